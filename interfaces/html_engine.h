// The interface of the HTML engine, `sciter.dll`: one export that returns a table of functions. Only the entries that
// the program uses have names here; the others may be null and must not be called.
//
// All of a window's functions are called on the thread that owns the window. A function that takes text copies it.
// Sizes are in pixels. Nothing is thrown.
#pragma once

#include <windows.h>

#include <stddef.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

// A value of the page's script. Opaque: it is made by ValueInit, read and changed by the functions of the table, and
// ended by ValueClear. A copy of the bytes is no second value; only ValueCopy makes one. One value must not be used by
// two threads at once.
typedef struct HtmlValue {
  uint32_t type;
  uint32_t unit;
  uint64_t data;
} HtmlValue;

typedef enum HtmlValueType {
  HTML_VALUE_UNDEFINED = 0,
  HTML_VALUE_NULL = 1,
  HTML_VALUE_BOOL = 2,
  HTML_VALUE_INT = 3,
  HTML_VALUE_FLOAT = 4,
  HTML_VALUE_STRING = 5,
  HTML_VALUE_DATE = 6,
  HTML_VALUE_ARRAY = 9,
  HTML_VALUE_MAP = 10,
  HTML_VALUE_FUNCTION = 11,
  HTML_VALUE_BYTES = 12,
  HTML_VALUE_OBJECT = 13  // of the script; ValueIsolate makes plain maps and arrays of it
} HtmlValueType;

// The unit of a value of type HTML_VALUE_OBJECT. A function of the page's script is one with HTML_OBJECT_FUNCTION.
typedef enum HtmlObjectUnit {
  HTML_OBJECT_ARRAY = 0,
  HTML_OBJECT_OBJECT = 1,
  HTML_OBJECT_CLASS = 2,
  HTML_OBJECT_NATIVE = 3,
  HTML_OBJECT_FUNCTION = 4,
  HTML_OBJECT_ERROR = 5
} HtmlObjectUnit;

#define HTML_STRING_ERROR 1  // unit of a string that is the text of an error

typedef enum HtmlValueResult {
  HTML_VALUE_OK = 0,
  HTML_VALUE_BAD_PARAMETER = 1,
  HTML_VALUE_INCOMPATIBLE_TYPE = 2
} HtmlValueResult;

typedef enum HtmlStringConversion { HTML_CONVERT_SIMPLE = 0, HTML_CONVERT_JSON_LITERAL = 1 } HtmlStringConversion;

typedef void* HtmlElement;  // of the page; null is none

// Called for each member of a map or array; false ends the enumeration. `key` and `value` are borrowed for the call.
typedef BOOL(CALLBACK* HtmlElementVisitor)(void* param, const HtmlValue* key, const HtmlValue* value);

// --- What the engine tells the host

typedef enum HtmlNotificationCode {
  HTML_LOAD_DATA = 1,
  HTML_DATA_LOADED = 2,
  HTML_ATTACH_BEHAVIOR = 4,
  HTML_ENGINE_DESTROYED = 5,  // always the last
  HTML_POSTED = 6,
  HTML_GRAPHICS_FAILURE = 7
} HtmlNotificationCode;

typedef struct HtmlNotification {
  uint32_t code;  // HtmlNotificationCode
  HWND window;
} HtmlNotification;

// What a host returns to HTML_LOAD_DATA; to all others it returns 0.
typedef enum HtmlLoadDataResult {
  HTML_LOAD_BY_ENGINE = 0,  // also when the host has supplied the data
  HTML_LOAD_DISCARD = 1,
  HTML_LOAD_DELAYED = 2
} HtmlLoadDataResult;

// The host may supply the bytes while it handles this, with SciterDataReady or by `outData` and `outSize` (which it
// keeps until HTML_DATA_LOADED).
typedef struct HtmlLoadData {
  HtmlNotification header;
  const wchar_t* uri;
  const uint8_t* outData;
  uint32_t outSize;
  uint32_t dataType;
  void* request;
  HtmlElement principal;
  HtmlElement initiator;
} HtmlLoadData;

typedef struct HtmlDataLoaded {
  HtmlNotification header;
  const wchar_t* uri;
  const uint8_t* data;
  uint32_t size;
  uint32_t dataType;
  uint32_t status;  // 200: success; 0 with size 0: failure
} HtmlDataLoaded;

typedef uint32_t(CALLBACK* HtmlHostCallback)(HtmlNotification* notification, void* param);

// --- Events

#define HTML_EVENTS_SUBSCRIBE 0xFFFFFFFFu  // `params` is a uint32_t*: write the wanted groups into it, return true
#define HTML_EVENTS_SCRIPT_CALL 0x0400u    // `params` is an HtmlScriptCall*

// The page's script calls native code. The arguments are borrowed: copy what is kept. `result` is initialised.
typedef struct HtmlScriptCall {
  const char* name;  // ASCII
  const HtmlValue* argv;
  uint32_t argc;
  HtmlValue result;
} HtmlScriptCall;

// True: handled.
typedef BOOL(CALLBACK* HtmlEventProc)(void* tag, HtmlElement element, uint32_t group, void* params);

// --- Diagnostics

typedef enum HtmlSeverity { HTML_INFORMATION = 0, HTML_WARNING = 1, HTML_ERROR = 2 } HtmlSeverity;

typedef enum HtmlSubsystem {
  HTML_SUBSYSTEM_DOM = 0,
  HTML_SUBSYSTEM_CSS_SCRIPT = 1,  // "csss!"
  HTML_SUBSYSTEM_CSS = 2,
  HTML_SUBSYSTEM_SCRIPT = 3
} HtmlSubsystem;

typedef void(CALLBACK* HtmlDebugOutput)(void* param, uint32_t subsystem, uint32_t severity, const wchar_t* text,
                                        uint32_t chars);

// An option of this engine only: the browser to use instead of the one that is found. `value` is the full path as a
// const wchar_t*, or null; it holds for windows that are made afterwards.
#define HTML_OPTION_BROWSER 0x53540001u

// --- Measuring: one of the first four, or-ed with one of the others

typedef enum HtmlArea {
  HTML_AREA_ROOT_RELATIVE = 1,
  HTML_AREA_SELF_RELATIVE = 2,
  HTML_AREA_CONTAINER_RELATIVE = 3,
  HTML_AREA_VIEW_RELATIVE = 4,
  HTML_AREA_CONTENT_BOX = 0x00,
  HTML_AREA_PADDING_BOX = 0x10,
  HTML_AREA_BORDER_BOX = 0x20,
  HTML_AREA_MARGIN_BOX = 0x30
} HtmlArea;

// --- The table. A member named after its slot is not used by the program.

typedef struct HtmlEngineApi {
  uint32_t version;  // slot 0
  uint32_t padding;
  void* slot1[2];
  // Answers a HTML_LOAD_DATA, only while it is being handled. The bytes are copied.
  BOOL(CALLBACK* SciterDataReady)(HWND window, const wchar_t* uri, const uint8_t* bytes, uint32_t size);
  void* slot4;
  // With and without the default window procedure. A window becomes a view of the engine by passing all its messages,
  // WM_CREATE included, through SciterProcND first; `*handled` says that the host shall return the result at once.
  LRESULT(CALLBACK* SciterProc)(HWND window, UINT message, WPARAM wparam, LPARAM lparam);
  LRESULT(CALLBACK* SciterProcND)(HWND window, UINT message, WPARAM wparam, LPARAM lparam, BOOL* handled);
  // "file://...", "res:...", "this://app/..." or a path. False when the page could not be loaded.
  BOOL(CALLBACK* SciterLoadFile)(HWND window, const wchar_t* address);
  void* slot8;
  void(CALLBACK* SciterSetCallback)(HWND window, HtmlHostCallback callback, void* param);
  void* slot10[5];
  uint32_t(CALLBACK* SciterGetMinWidth)(HWND window);
  uint32_t(CALLBACK* SciterGetMinHeight)(HWND window, uint32_t width);
  // Calls a global function of the page; its name is UTF-8. `*result` must be initialised.
  BOOL(CALLBACK* SciterCall)
  (HWND window, const char* function, uint32_t argc, const HtmlValue* argv, HtmlValue* result);
  void* slot18[3];
  BOOL(CALLBACK* SciterSetOption)(HWND windowOrNull, uint32_t option, uintptr_t value);
  void* slot22[10];
  void(CALLBACK* SciterSetupDebugOutput)(HWND windowOrNull, void* param, HtmlDebugOutput output);
  int(CALLBACK* Sciter_UseElement)(HtmlElement element);  // these and all that return int: 0 is success
  int(CALLBACK* Sciter_UnuseElement)(HtmlElement element);
  int(CALLBACK* SciterGetRootElement)(HWND window, HtmlElement* element);
  void* slot36[19];
  int(CALLBACK* SciterGetElementLocation)(HtmlElement element, RECT* location, uint32_t areas);
  void* slot56[27];
  int(CALLBACK* SciterWindowAttachEventHandler)(HWND window, HtmlEventProc proc, void* tag, uint32_t subscription);
  int(CALLBACK* SciterWindowDetachEventHandler)(HWND window, HtmlEventProc proc, void* tag);
  void* slot85[7];
  int(CALLBACK* SciterGetElementIntrinsicWidths)(HtmlElement element, int* minimum, int* maximum);
  int(CALLBACK* SciterGetElementIntrinsicHeight)(HtmlElement element, int width, int* height);
  void* slot94[35];

  // Values. All return an HtmlValueResult.
  uint32_t(CALLBACK* ValueInit)(HtmlValue* value);
  uint32_t(CALLBACK* ValueClear)(HtmlValue* value);  // undefined afterwards, and fit to be set again
  void* slot131;
  uint32_t(CALLBACK* ValueCopy)(HtmlValue* to, const HtmlValue* from);  // `to` must be initialised
  uint32_t(CALLBACK* ValueIsolate)(HtmlValue* value);                   // needed before a value crosses threads
  uint32_t(CALLBACK* ValueType)(const HtmlValue* value, uint32_t* type, uint32_t* unit);
  uint32_t(CALLBACK* ValueStringData)(const HtmlValue* value, const wchar_t** text, uint32_t* chars);  // borrowed
  uint32_t(CALLBACK* ValueStringDataSet)(HtmlValue* value, const wchar_t* text, uint32_t chars, uint32_t unit);
  uint32_t(CALLBACK* ValueIntData)(const HtmlValue* value, int32_t* data);
  uint32_t(CALLBACK* ValueIntDataSet)(HtmlValue* value, int32_t data, uint32_t type, uint32_t unit);  // int or bool
  void* slot139[2];
  uint32_t(CALLBACK* ValueFloatData)(const HtmlValue* value, double* data);
  uint32_t(CALLBACK* ValueFloatDataSet)(HtmlValue* value, double data, uint32_t type, uint32_t unit);
  void* slot143[2];
  // Arrays and maps. Setting an element of what is neither makes it an array; setting a key of what is no map makes it
  // a map.
  uint32_t(CALLBACK* ValueElementsCount)(const HtmlValue* value, int32_t* count);
  uint32_t(CALLBACK* ValueNthElementValue)(const HtmlValue* value, int32_t n, HtmlValue* element);
  uint32_t(CALLBACK* ValueNthElementValueSet)(HtmlValue* value, int32_t n, const HtmlValue* element);
  uint32_t(CALLBACK* ValueNthElementKey)(const HtmlValue* value, int32_t n, HtmlValue* key);
  uint32_t(CALLBACK* ValueEnumElements)(const HtmlValue* value, HtmlElementVisitor visitor, void* param);
  uint32_t(CALLBACK* ValueSetValueToKey)(HtmlValue* value, const HtmlValue* key, const HtmlValue* element);
  uint32_t(CALLBACK* ValueGetValueOfKey)(const HtmlValue* value, const HtmlValue* key, HtmlValue* element);
  uint32_t(CALLBACK* ValueToString)(HtmlValue* value, uint32_t how);  // in place; HtmlStringConversion
  // Returns the number of characters that were left unparsed, not an HtmlValueResult.
  uint32_t(CALLBACK* ValueFromString)(HtmlValue* value, const wchar_t* text, uint32_t chars, uint32_t how);
  // Calls a function that the script passed in as an argument. `name` is for error messages; it and `self` may be null.
  uint32_t(CALLBACK* ValueInvoke)(const HtmlValue* function, HtmlValue* self, uint32_t argc, const HtmlValue* argv,
                                  HtmlValue* result, const wchar_t* name);
} HtmlEngineApi;

#ifdef ST_ENGINE_EXPORTS
#define ST_ENGINE_API __declspec(dllexport)
#else
#define ST_ENGINE_API
#endif

// The table is never null and lives as long as the library is loaded.
ST_ENGINE_API const HtmlEngineApi* CALLBACK SciterAPI(void);

#ifdef __cplusplus
}

// The layout is fixed by the engine: slot n lies at byte 8 * n.
static_assert(sizeof(HtmlValue) == 16);
static_assert(offsetof(HtmlLoadData, uri) == 16 && offsetof(HtmlLoadData, request) == 40);
static_assert(offsetof(HtmlScriptCall, result) == 24);
static_assert(offsetof(HtmlEngineApi, SciterDataReady) == size_t{8} * 3);
static_assert(offsetof(HtmlEngineApi, SciterLoadFile) == size_t{8} * 7);
static_assert(offsetof(HtmlEngineApi, SciterCall) == size_t{8} * 17);
static_assert(offsetof(HtmlEngineApi, SciterSetOption) == size_t{8} * 21);
static_assert(offsetof(HtmlEngineApi, SciterSetupDebugOutput) == size_t{8} * 32);
static_assert(offsetof(HtmlEngineApi, SciterGetElementLocation) == size_t{8} * 55);
static_assert(offsetof(HtmlEngineApi, SciterWindowAttachEventHandler) == size_t{8} * 83);
static_assert(offsetof(HtmlEngineApi, SciterGetElementIntrinsicWidths) == size_t{8} * 92);
static_assert(offsetof(HtmlEngineApi, ValueInit) == size_t{8} * 129);
static_assert(offsetof(HtmlEngineApi, ValueIntData) == size_t{8} * 137);
static_assert(offsetof(HtmlEngineApi, ValueElementsCount) == size_t{8} * 145);
static_assert(offsetof(HtmlEngineApi, ValueInvoke) == size_t{8} * 154);
#endif
