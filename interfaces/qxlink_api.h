// The C interface of the cloud communication library, `qxlink.dll`: it uploads files, or puts them into an outbox
// folder where no service is configured, and exchanges short messages with the service. What it uploads to is said by
// its own configuration, `qxlink.json` beside the library (docs/delivery.md), not by the program.
//
// Text is UTF-8 and zero-terminated. What a caller hands over is only borrowed for the call; asynchronous functions
// copy what they need before they return, except for the bytes of qxskylane_mem_upload_async and
// qxskylane_ask_bin_async, which must stay until the completion callback. Every function returns a QxskylaneResult
// unless said otherwise, and throws nothing. A context may be used by several threads at once; the calls of one thread
// are never reordered.
#pragma once

#include <stddef.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

#ifdef ST_QXLINK_EXPORTS
#define ST_QXLINK_API __declspec(dllexport)
#else
#define ST_QXLINK_API
#endif

// qxskylane_text gives each of them a sentence. Later versions may add numbers: 1 to 999 are found out on this machine,
// 1000 and more on the way to the service or there.
typedef enum QxskylaneResult {
  QXSKYLANE_OK = 0,                     // done
  QXSKYLANE_BAD_ARGUMENT = 1,           // a null pointer, an empty path, a size or JSON text that cannot be
  QXSKYLANE_OUT_OF_MEMORY = 2,          //
  QXSKYLANE_NOT_SUPPORTED = 3,          // this version of the library, or its configured service, cannot do it
  QXSKYLANE_CONFIGURATION_INVALID = 4,  // qxlink.json cannot be read or says what cannot be; the log names it
  QXSKYLANE_OPTION_UNKNOWN = 5,         // no option of this number, or not one of this function's type
  QXSKYLANE_OPTION_REFUSED = 6,         // the configuration forbids this value
  QXSKYLANE_FILE_UNREADABLE = 7,        // the file to upload cannot be opened or read to its end
  QXSKYLANE_OUTBOX_UNWRITABLE = 8,      // the outbox folder cannot be made or the file cannot be written into it
  QXSKYLANE_CANCELLED = 9,              // a progress callback asked for it, or the context ended
  QXSKYLANE_INTERNAL_ERROR = 10,        // a fault of the library
  QXSKYLANE_NO_CONNECTION = 1001,       // the service cannot be reached
  QXSKYLANE_NO_SECURE_CHANNEL = 1002,   // it can be, but not by HTTPS with a certificate that holds
  QXSKYLANE_TIMED_OUT = 1003,           // nothing came for too long
  QXSKYLANE_SERVICE_REFUSED = 1004,     // the service does not want this: its answer was 400 to 499
  QXSKYLANE_SERVICE_FAILED = 1005       // the service is out of order, or its answer makes no sense
} QxskylaneResult;

// For qxskylane_set_option and _get_option, unless it says text: those are for qxskylane_set_optionv only. Options last
// as long as the context and override the configuration.
typedef enum QxskylaneOption {
  QXSKYLANE_OPTION_PLAIN_HTTP = 20,  // 1: talk HTTP instead of HTTPS. Refused unless "allow_plain_http" is configured
  QXSKYLANE_OPTION_OUTBOX = 30       // text: the outbox folder, as "outbox" in the configuration
} QxskylaneOption;

typedef struct QxskylaneContext QxskylaneContext;

// What was answered. Made by the library; a caller frees it with qxskylane_free_response, but for one that a completion
// callback is handed: that one is borrowed for the callback.
typedef struct QxskylaneResponse {
  uint32_t size;         // of this struct
  uint32_t http_status;  // 0: no service was involved
  const char* location;  // where the upload now is: its address, or the path of the file in the outbox; or null
  const void* body;      // `body_size` bytes and a terminating zero; never null
  uint64_t body_size;
} QxskylaneResponse;

// Called on the thread that uploads, at most some ten times a second and once at the end. Non-zero ends the upload with
// QXSKYLANE_CANCELLED. `total` is the size of the file.
typedef int32_t (*QxskylaneProgress)(void* user, uint64_t sent, uint64_t total);

// Called exactly once for every asynchronous call that returned QXSKYLANE_OK, on a thread of the library. `response` is
// null when there was no answer. It must not call qxskylane_uninit.
typedef void (*QxskylaneDone)(void* user, int32_t result, const QxskylaneResponse* response);

// One upload. Set all fields that are not used to zero. Later versions may add fields at the end: a library takes a
// struct that is longer than its own, and takes what a shorter one lacks for zero.
typedef struct QxskylaneUpload {
  uint32_t size;               // sizeof(QxskylaneUpload)
  uint32_t flags;              // 0
  const char* file_path;       // the file; for uploads from memory only the name that it shall have. Not null
  const char* category;        // under which the service files it. Not null
  const char* tags_json;       // a JSON object, or null
  QxskylaneProgress progress;  // or null
  void* user;                  // handed to `progress`
} QxskylaneUpload;

// Makes a context and reads the configuration. `*context` is null after a failure. qxskylane_uninit cancels what is
// under way, waits for its callbacks and frees the context; no other call may be running on it or come later.
ST_QXLINK_API int32_t qxskylane_init(QxskylaneContext** context);
ST_QXLINK_API int32_t qxskylane_uninit(QxskylaneContext* context);

// Tells the service something under a topic; nothing is answered.
ST_QXLINK_API int32_t qxskylane_push_info(QxskylaneContext* context, const char* topic, const char* text);
ST_QXLINK_API int32_t qxskylane_push_json(QxskylaneContext* context, const char* topic, const char* json);
ST_QXLINK_API int32_t qxskylane_push_bin(QxskylaneContext* context, const char* topic, const void* bytes,
                                         uint64_t size);

// Asks the service something under a topic. `*response` is null after a failure.
ST_QXLINK_API int32_t qxskylane_ask(QxskylaneContext* context, const char* topic, const char* text,
                                    QxskylaneResponse** response);
ST_QXLINK_API int32_t qxskylane_ask_json(QxskylaneContext* context, const char* topic, const char* json,
                                         QxskylaneResponse** response);
ST_QXLINK_API int32_t qxskylane_ask_bin(QxskylaneContext* context, const char* topic, const void* bytes, uint64_t size,
                                        QxskylaneResponse** response);
ST_QXLINK_API int32_t qxskylane_ask_async(QxskylaneContext* context, const char* topic, const char* text,
                                          QxskylaneDone done, void* user);
ST_QXLINK_API int32_t qxskylane_ask_json_async(QxskylaneContext* context, const char* topic, const char* json,
                                               QxskylaneDone done, void* user);
ST_QXLINK_API int32_t qxskylane_ask_bin_async(QxskylaneContext* context, const char* topic, const void* bytes,
                                              uint64_t size, QxskylaneDone done, void* user);
ST_QXLINK_API void qxskylane_free_response(QxskylaneResponse* response);  // null does nothing

// An English sentence for a result, never null, for ever valid.
ST_QXLINK_API const char* qxskylane_text(int32_t result);

// Options with a number, and options with a value of another kind: `value` is `size` bytes, for text without the
// terminating zero.
ST_QXLINK_API int32_t qxskylane_set_option(QxskylaneContext* context, int32_t option, int64_t value);
ST_QXLINK_API int32_t qxskylane_set_optionv(QxskylaneContext* context, int32_t option, const void* value, size_t size);
ST_QXLINK_API int32_t qxskylane_get_option(QxskylaneContext* context, int32_t option, int64_t* value);

// Upload a file, or bytes in memory as if they were one. The synchronous forms return when the service, or the outbox,
// has all of it.
ST_QXLINK_API int32_t qxskylane_file_upload(QxskylaneContext* context, const QxskylaneUpload* upload);
ST_QXLINK_API int32_t qxskylane_file_upload_async(QxskylaneContext* context, const QxskylaneUpload* upload,
                                                  QxskylaneDone done, void* user);
ST_QXLINK_API int32_t qxskylane_mem_upload(QxskylaneContext* context, const QxskylaneUpload* upload, const void* bytes,
                                           uint64_t size);
ST_QXLINK_API int32_t qxskylane_mem_upload_async(QxskylaneContext* context, const QxskylaneUpload* upload,
                                                 const void* bytes, uint64_t size, QxskylaneDone done, void* user);

#ifdef __cplusplus
}
#endif
