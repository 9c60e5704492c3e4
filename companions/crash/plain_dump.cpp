#include "companions/crash/plain_dump.h"

#include <psapi.h>

#include <algorithm>
#include <cstring>
#include <utility>

#include "companions/crash/kernel_file.h"

namespace crash {
namespace {

constexpr ULONG32 kSignature = 0x504D444D;      // "MDMP"; the header's own constant is no portable literal
constexpr size_t kLongestName = 1024;           // of a module's file; a longer one is cut
constexpr size_t kMostStack = size_t{1} << 20;  // bytes

bool IsReadable(const MEMORY_BASIC_INFORMATION& region) {
  return region.State == MEM_COMMIT && (region.Protect & (PAGE_GUARD | PAGE_NOACCESS)) == 0;
}

// From the stack pointer to the end of the stack, as far as it can be read.
std::span<const std::byte> StackOf(const CONTEXT& context) {
  const auto* const begin = reinterpret_cast<const std::byte*>(context.Rsp);
  MEMORY_BASIC_INFORMATION region;
  if (VirtualQuery(begin, &region, sizeof region) == 0 || !IsReadable(region)) return {};
  const auto* const end = static_cast<const std::byte*>(region.BaseAddress) + region.RegionSize;
  return {begin, std::min(static_cast<size_t>(end - begin), kMostStack)};
}

}  // namespace

PlainDump::PlainDump(DumpPath path) : m_path(std::move(path)), m_version(SystemVersion()) {
  GetNativeSystemInfo(&m_system);
}

bool PlainDump::Write(const CrashedThread& crashed) noexcept {
  m_path.SetTime(UtcNow());
  KernelFile file(m_path.PartialPath());
  if (!file) return false;
  const std::span<const std::byte> stack = LayOut(crashed);
  return file.Write({m_space, m_used}) && file.Write(stack) && file.Rename(m_path.Path());
}

template <class T>
T* PlainDump::Add(size_t count) noexcept {
  constexpr size_t kAlignment = 16;  // of a thread's context in the file; enough for all
  const size_t begin = (m_used + kAlignment - 1) / kAlignment * kAlignment;
  if (begin + count * sizeof(T) > kSpace) return nullptr;
  m_used = begin + count * sizeof(T);
  std::memset(m_space + begin, 0, count * sizeof(T));
  return reinterpret_cast<T*>(m_space + begin);
}

RVA PlainDump::OffsetOf(const void* placed) const noexcept {
  return static_cast<RVA>(static_cast<const std::byte*>(placed) - m_space);
}

MINIDUMP_LOCATION_DESCRIPTOR PlainDump::LocationOf(const void* placed, size_t size) const noexcept {
  return {static_cast<ULONG32>(size), OffsetOf(placed)};
}

RVA PlainDump::AddString(std::span<const wchar_t> text) noexcept {
  auto* const bytes = Add<std::byte>(sizeof(ULONG32) + (text.size() + 1) * sizeof(wchar_t));
  if (bytes == nullptr) return 0;
  const auto length = static_cast<ULONG32>(text.size_bytes());
  std::memcpy(bytes, &length, sizeof length);
  if (length != 0) std::memcpy(bytes + sizeof length, text.data(), length);  // an empty text may have no place
  return OffsetOf(bytes);
}

std::span<const std::byte> PlainDump::LayOut(const CrashedThread& crashed) noexcept {
  // In this order everything but the modules is sure to fit.
  constexpr ULONG32 kStreams = 5;
  m_used = 0;
  auto* const header = Add<MINIDUMP_HEADER>();
  auto* const directory = Add<MINIDUMP_DIRECTORY>(kStreams);
  *header = {kSignature, MINIDUMP_VERSION, kStreams, OffsetOf(directory), 0, {0}, MiniDumpNormal};

  AddSystem(directory[0]);
  AddException(directory[1], crashed);
  const auto* const exception = reinterpret_cast<MINIDUMP_EXCEPTION_STREAM*>(m_space + directory[1].Location.Rva);

  auto* const threads = Add<std::byte>(sizeof(ULONG32) + sizeof(MINIDUMP_THREAD));
  auto* const memory = Add<std::byte>(sizeof(ULONG32) + sizeof(MINIDUMP_MEMORY_DESCRIPTOR));
  directory[2] = {ThreadListStream, LocationOf(threads, sizeof(ULONG32) + sizeof(MINIDUMP_THREAD))};
  directory[3] = {MemoryListStream, LocationOf(memory, sizeof(ULONG32) + sizeof(MINIDUMP_MEMORY_DESCRIPTOR))};
  AddModules(directory[4]);

  const std::span<const std::byte> stack = StackOf(*crashed.exception->ContextRecord);
  auto* const threadList = reinterpret_cast<MINIDUMP_THREAD_LIST*>(threads);
  threadList->NumberOfThreads = 1;
  MINIDUMP_THREAD& thread = threadList->Threads[0];
  thread.ThreadId = crashed.id;
  thread.ThreadContext = exception->ThreadContext;
  thread.Stack.StartOfMemoryRange = reinterpret_cast<ULONG64>(stack.data());
  thread.Stack.Memory = {static_cast<ULONG32>(stack.size()), static_cast<RVA>(m_used)};
  auto* const memoryList = reinterpret_cast<MINIDUMP_MEMORY_LIST*>(memory);
  memoryList->NumberOfMemoryRanges = 1;
  memoryList->MemoryRanges[0] = thread.Stack;
  return stack;
}

void PlainDump::AddSystem(MINIDUMP_DIRECTORY& entry) noexcept {
  auto* const system = Add<MINIDUMP_SYSTEM_INFO>();
  system->ProcessorArchitecture = m_system.wProcessorArchitecture;
  system->ProcessorLevel = m_system.wProcessorLevel;
  system->ProcessorRevision = m_system.wProcessorRevision;
  system->NumberOfProcessors = static_cast<UCHAR>(std::min<DWORD>(m_system.dwNumberOfProcessors, 255));
  system->ProductType = VER_NT_WORKSTATION;
  system->MajorVersion = m_version.dwMajorVersion;
  system->MinorVersion = m_version.dwMinorVersion;
  system->BuildNumber = m_version.dwBuildNumber;
  system->PlatformId = m_version.dwPlatformId;
  system->CSDVersionRva = AddString({});
  entry = {SystemInfoStream, LocationOf(system, sizeof *system)};
}

void PlainDump::AddException(MINIDUMP_DIRECTORY& entry, const CrashedThread& crashed) noexcept {
  auto* const context = Add<std::byte>(sizeof(CONTEXT));
  std::memcpy(context, crashed.exception->ContextRecord, sizeof(CONTEXT));
  auto* const stream = Add<MINIDUMP_EXCEPTION_STREAM>();
  const EXCEPTION_RECORD& record = *crashed.exception->ExceptionRecord;
  stream->ThreadId = crashed.id;
  stream->ThreadContext = LocationOf(context, sizeof(CONTEXT));
  stream->ExceptionRecord.ExceptionCode = record.ExceptionCode;
  stream->ExceptionRecord.ExceptionFlags = record.ExceptionFlags;
  stream->ExceptionRecord.ExceptionAddress = reinterpret_cast<ULONG64>(record.ExceptionAddress);
  const DWORD count = std::min<DWORD>(record.NumberParameters, EXCEPTION_MAXIMUM_PARAMETERS);
  stream->ExceptionRecord.NumberParameters = count;
  for (DWORD i = 0; i < count; ++i)
    stream->ExceptionRecord.ExceptionInformation[i] = record.ExceptionInformation[i];
  entry = {ExceptionStream, LocationOf(stream, sizeof *stream)};
}

// The loader's list may be spoilt with the heap, so the modules are found in the address space itself.
void PlainDump::AddModules(MINIDUMP_DIRECTORY& entry) noexcept {
  auto* const list =
      reinterpret_cast<MINIDUMP_MODULE_LIST*>(Add<std::byte>(sizeof(ULONG32) + kMostModules * sizeof(MINIDUMP_MODULE)));
  MEMORY_BASIC_INFORMATION region;
  for (const std::byte* address = nullptr; VirtualQuery(address, &region, sizeof region) != 0;) {
    const auto* const base = static_cast<const std::byte*>(region.BaseAddress);
    const bool isImage = region.Type == MEM_IMAGE && region.BaseAddress == region.AllocationBase && IsReadable(region);
    if (isImage && list->NumberOfModules < kMostModules && AddModule(list->Modules[list->NumberOfModules], base)) {
      ++list->NumberOfModules;
    }
    address = base + region.RegionSize;
  }
  entry = {ModuleListStream, LocationOf(list, sizeof(ULONG32) + list->NumberOfModules * sizeof(MINIDUMP_MODULE))};
}

bool PlainDump::AddModule(MINIDUMP_MODULE& module, const std::byte* image) noexcept {
  const auto* const dos = reinterpret_cast<const IMAGE_DOS_HEADER*>(image);
  constexpr LONG kPage = 4096;
  if (dos->e_magic != IMAGE_DOS_SIGNATURE || dos->e_lfanew < 0 ||
      dos->e_lfanew > kPage - static_cast<LONG>(sizeof(IMAGE_NT_HEADERS))) {
    return false;
  }
  const auto* const headers = reinterpret_cast<const IMAGE_NT_HEADERS*>(image + dos->e_lfanew);
  if (headers->Signature != IMAGE_NT_SIGNATURE) return false;
  wchar_t name[kLongestName];
  const DWORD length = GetMappedFileNameW(GetCurrentProcess(), const_cast<std::byte*>(image), name, kLongestName);
  module.ModuleNameRva = AddString({name, length});
  module.BaseOfImage = reinterpret_cast<ULONG64>(image);
  module.SizeOfImage = headers->OptionalHeader.SizeOfImage;
  module.CheckSum = headers->OptionalHeader.CheckSum;
  module.TimeDateStamp = headers->FileHeader.TimeDateStamp;
  return module.ModuleNameRva != 0;
}

}  // namespace crash
