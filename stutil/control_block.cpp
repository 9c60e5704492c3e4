#include "stutil/control_block.h"

#include <windows.h>

#include <algorithm>
#include <atomic>

#include "core/logging.h"
#include "core/scope_trace.h"
#include "core/scoped.h"

namespace stutil {
namespace {

constexpr wchar_t kScope[] = L"stutil::ActivateCSTLogs";

struct MappedViewTraits {
  using Type = void*;
  static bool IsValid(void* view) { return view != nullptr; }
  static void Close(void* view) { UnmapViewOfFile(view); }
};
using MappedView = Scoped<MappedViewTraits>;

std::string NameOf(const ControlBlock::Component& component) {
  const char* const end = std::find(component.name, component.name + sizeof component.name, '\0');
  return {component.name, end};
}

}  // namespace

bool ChangeControlBlock(const LevelChoice& choose) {
  const logging::ScopeTrace trace(kScope);
  const KernelHandle mapping(
      CreateFileMappingW(INVALID_HANDLE_VALUE, nullptr, PAGE_READWRITE, 0, sizeof(ControlBlock), kControlBlockName));
  if (!mapping) {
    LOG_ERROR(kScope, L"Unable to create file mapping: %d", GetLastError());
    return false;
  }
  const MappedView view(MapViewOfFile(mapping.Get(), FILE_MAP_READ | FILE_MAP_WRITE, 0, 0, sizeof(ControlBlock)));
  if (!view) {
    LOG_ERROR(kScope, L"Unable o map file mapping: %d", GetLastError());
    return false;
  }
  auto& block = *static_cast<ControlBlock*>(view.Get());
  const uint32_t count = std::atomic_ref(block.componentCount).load();
  LOG_TRACE(kScope, L"Active components count: %d\n", count);
  for (uint32_t i = 0; i < std::min(count, ControlBlock::kMostComponents); ++i) {
    ControlBlock::Component& component = block.components[i];
    const std::string name = NameOf(component);
    LOG_TRACE(kScope, L"Changing dbg settings for [%S]", name.c_str());
    // One aligned store each, without a lock: the components read them at any time.
    const std::atomic_ref level(component.level);
    level.store(choose(i, name, level.load()));
  }
  return true;
}

}  // namespace stutil
