#include "companions/engine/clipboard.h"

#include <cstring>

#include "core/scope_exit.h"
#include "core/scoped.h"

namespace engine {
namespace {

struct GlobalMemoryTraits {
  using Type = HGLOBAL;
  static bool IsValid(HGLOBAL memory) { return memory != nullptr; }
  static void Close(HGLOBAL memory) { GlobalFree(memory); }
};
using GlobalMemory = Scoped<GlobalMemoryTraits>;

}  // namespace

std::wstring ReadClipboardText(HWND owner) {
  if (!OpenClipboard(owner)) return {};
  const ScopeExit close([] { CloseClipboard(); });
  const HANDLE data = GetClipboardData(CF_UNICODETEXT);  // the clipboard's own
  const auto* text = data == nullptr ? nullptr : static_cast<const wchar_t*>(GlobalLock(data));
  if (text == nullptr) return {};
  const ScopeExit unlock([&] { GlobalUnlock(data); });
  return {text, wcsnlen(text, GlobalSize(data) / sizeof(wchar_t))};
}

void WriteClipboardText(HWND owner, std::wstring_view text) {
  GlobalMemory memory(GlobalAlloc(GMEM_MOVEABLE, (text.size() + 1) * sizeof(wchar_t)));
  auto* target = memory ? static_cast<wchar_t*>(GlobalLock(memory.Get())) : nullptr;
  if (target == nullptr) return;
  std::memcpy(target, text.data(), text.size() * sizeof(wchar_t));
  target[text.size()] = L'\0';
  GlobalUnlock(memory.Get());
  if (!OpenClipboard(owner)) return;
  const ScopeExit close([] { CloseClipboard(); });
  // Taken over by the clipboard when it succeeds.
  if (EmptyClipboard() && SetClipboardData(CF_UNICODETEXT, memory.Get()) != nullptr) memory.Release();
}

}  // namespace engine
