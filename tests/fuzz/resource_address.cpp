// The addresses that a page in the browser asks for.
#include "companions/engine/resource_address.h"

#include "core/text.h"
#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  using namespace engine;
  IsNativeCall(bytes);
  IsSiteIcon(bytes);
  const auto uri = ToEngineUri(bytes);
  const std::wstring wide = ToWide(bytes);
  for (const std::wstring& address : {uri.value_or(L""), wide}) {
    PROMISE(!MimeTypeOf(address).empty());
    const auto path = PathInside(address, L"C:\\pages");
    if (!path) continue;
    PROMISE(path->size() > 9 && path->find(L'/') == std::wstring::npos);
    PROMISE(path->find(L"\\..\\") == std::wstring::npos && !path->ends_with(L"\\.."));
  }
  if (const auto page = ToPageAddress(wide)) {
    PROMISE(std::all_of(page->browserUrl.begin(), page->browserUrl.end(), [](char c) { return c > ' ' && c <= '~'; }));
  }
}
