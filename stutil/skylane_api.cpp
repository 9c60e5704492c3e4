#include "stutil/skylane_api.h"

#include <tuple>

#include "core/logging.h"

namespace stutil {
namespace {

template <class Function>
struct EntryPoint {
  const char* name;
  Function SkylaneApi::*member;
};
template <class Function>
EntryPoint(const char*, Function SkylaneApi::*) -> EntryPoint<Function>;

// The only list; in the order of the table.
constexpr std::tuple kEntryPoints{
    EntryPoint{"qxskylane_init", &SkylaneApi::init},
    EntryPoint{"qxskylane_uninit", &SkylaneApi::uninit},
    EntryPoint{"qxskylane_push_info", &SkylaneApi::pushInfo},
    EntryPoint{"qxskylane_push_json", &SkylaneApi::pushJson},
    EntryPoint{"qxskylane_push_bin", &SkylaneApi::pushBin},
    EntryPoint{"qxskylane_ask", &SkylaneApi::ask},
    EntryPoint{"qxskylane_ask_json", &SkylaneApi::askJson},
    EntryPoint{"qxskylane_ask_bin", &SkylaneApi::askBin},
    EntryPoint{"qxskylane_ask_async", &SkylaneApi::askAsync},
    EntryPoint{"qxskylane_ask_json_async", &SkylaneApi::askJsonAsync},
    EntryPoint{"qxskylane_ask_bin_async", &SkylaneApi::askBinAsync},
    EntryPoint{"qxskylane_free_response", &SkylaneApi::freeResponse},
    EntryPoint{"qxskylane_text", &SkylaneApi::text},
    EntryPoint{"qxskylane_set_option", &SkylaneApi::setOption},
    EntryPoint{"qxskylane_set_optionv", &SkylaneApi::setOptionV},
    EntryPoint{"qxskylane_get_option", &SkylaneApi::getOption},
    EntryPoint{"qxskylane_file_upload", &SkylaneApi::fileUpload},
    EntryPoint{"qxskylane_file_upload_async", &SkylaneApi::fileUploadAsync},
    EntryPoint{"qxskylane_mem_upload", &SkylaneApi::memUpload},
    EntryPoint{"qxskylane_mem_upload_async", &SkylaneApi::memUploadAsync},
};
static_assert(std::tuple_size_v<decltype(kEntryPoints)> == 20);

template <class Function>
bool Bind(SkylaneApi& api, const EntryPoint<Function>& entry) {
  api.*entry.member = api.library.Resolve<Function>(entry.name);
  return api.*entry.member != nullptr;
}

}  // namespace

std::unique_ptr<SkylaneApi> LoadSkylaneApi() {
  auto api = std::make_unique<SkylaneApi>();
  api->library = DynamicLibrary(L"qxlink.dll");
  const bool isComplete =
      std::apply([&](const auto&... entries) { return (Bind(*api, entries) && ...); }, kEntryPoints);
  if (isComplete) return api;
  LOG_TRACE(L"stutil::LoadSkylaneApi", L"qxlink.dll cannot be loaded or is incomplete, error %u", GetLastError());
  return nullptr;
}

}  // namespace stutil
