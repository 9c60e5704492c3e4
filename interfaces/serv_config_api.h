// The C interface of the product configuration plug-in, `ServConfig.dll`: what the installed product is. Text is UTF-16
// and zero-terminated. A function returns 0 on success and a Windows error number otherwise, and throws nothing. A
// configuration may be used by several threads.
#pragma once

#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

#ifdef ST_CONFIG_EXPORTS
#define ST_CONFIG_API __declspec(dllexport)
#else
#define ST_CONFIG_API
#endif

typedef struct ServConfig ServConfig;

// Reads "ServConfig.json" beside the library. `*config` is null after a failure. Destroying null does nothing.
ST_CONFIG_API int32_t ServConfigCreate(ServConfig** config);
ST_CONFIG_API void ServConfigDestroy(ServConfig* config);

// The member `key`: "product_name", "product_version", "maker", "support_address", and whatever else the file has.
// Buffer and results as for LanguageManagerTranslate.
ST_CONFIG_API int32_t ServConfigGetText(const ServConfig* config, const wchar_t* key, wchar_t* buffer, uint32_t* chars);

#ifdef __cplusplus
}
#endif
