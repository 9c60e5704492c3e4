// The cloud communication library, `qxlink.dll`, bound at run time: the module and its 20 entry points. A table with
// only some of them does not exist.
#pragma once

#include <memory>

#include "core/dynamic_library.h"
#include "interfaces/qxlink_api.h"

namespace stutil {

struct SkylaneApi {
  DynamicLibrary library;
  decltype(&qxskylane_init) init;
  decltype(&qxskylane_uninit) uninit;
  decltype(&qxskylane_push_info) pushInfo;
  decltype(&qxskylane_push_json) pushJson;
  decltype(&qxskylane_push_bin) pushBin;
  decltype(&qxskylane_ask) ask;
  decltype(&qxskylane_ask_json) askJson;
  decltype(&qxskylane_ask_bin) askBin;
  decltype(&qxskylane_ask_async) askAsync;
  decltype(&qxskylane_ask_json_async) askJsonAsync;
  decltype(&qxskylane_ask_bin_async) askBinAsync;
  decltype(&qxskylane_free_response) freeResponse;
  decltype(&qxskylane_text) text;
  decltype(&qxskylane_set_option) setOption;
  decltype(&qxskylane_set_optionv) setOptionV;
  decltype(&qxskylane_get_option) getOption;
  decltype(&qxskylane_file_upload) fileUpload;
  decltype(&qxskylane_file_upload_async) fileUploadAsync;
  decltype(&qxskylane_mem_upload) memUpload;
  decltype(&qxskylane_mem_upload_async) memUploadAsync;
};

// Loads the library by its bare name. Null when it is not found or lacks an export; it is freed then, and the caller
// logs. The table frees it when it is destroyed.
std::unique_ptr<SkylaneApi> LoadSkylaneApi();

}  // namespace stutil
