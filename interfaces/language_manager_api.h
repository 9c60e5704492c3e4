// The C interface of the language manager plug-in, `LanguageManager.dll`: the texts of the pages in the user's
// language. Text is UTF-16 and zero-terminated; what is handed over is only borrowed for the call. A function returns 0
// on success and a Windows error number otherwise, and throws nothing. A manager may be used by several threads.
#pragma once

#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

#ifdef ST_LANGUAGE_EXPORTS
#define ST_LANGUAGE_API __declspec(dllexport)
#else
#define ST_LANGUAGE_API
#endif

typedef struct LanguageManager LanguageManager;

// Makes a manager for the catalogue `language` ("en", "ro"), which lies as "language\<language>.json" beside the
// library. `*manager` is null after a failure; ERROR_FILE_NOT_FOUND: there is no such catalogue, ERROR_BAD_FORMAT: it
// is not one. Destroying null does nothing.
ST_LANGUAGE_API int32_t LanguageManagerCreate(const wchar_t* language, LanguageManager** manager);
ST_LANGUAGE_API void LanguageManagerDestroy(LanguageManager* manager);

// `text` is the key of a text, or the text as the English catalogue has it. `*chars` is the room in `buffer`, and
// becomes the length that is needed, both with the terminating zero. ERROR_NOT_FOUND: there is no translation;
// ERROR_INSUFFICIENT_BUFFER: nothing was written (`buffer` may be null then).
ST_LANGUAGE_API int32_t LanguageManagerTranslate(const LanguageManager* manager, const wchar_t* text, wchar_t* buffer,
                                                 uint32_t* chars);

#ifdef __cplusplus
}
#endif
