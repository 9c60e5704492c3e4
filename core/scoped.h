// Owners for Windows handles. A traits struct says what a kind of handle is, when it is valid and how it is closed; the
// named alias is what the rest of the code uses, so that the wrong closer cannot compile. An owner is move-only and
// closes exactly once, on the thread that destroys it.
#pragma once

#include <windows.h>

#include <utility>

template <class Traits>
class Scoped {
 public:
  using Type = typename Traits::Type;

  Scoped() = default;
  explicit Scoped(Type handle) : m_handle(handle) {}
  Scoped(Scoped&& other) noexcept : m_handle(other.Release()) {}
  Scoped& operator=(Scoped&& other) noexcept {
    Reset(other.Release());
    return *this;
  }
  Scoped(const Scoped&) = delete;
  Scoped& operator=(const Scoped&) = delete;
  ~Scoped() { Reset(); }

  explicit operator bool() const { return Traits::IsValid(m_handle); }
  Type Get() const { return m_handle; }

  // Gives the handle to the caller, who closes it from then on.
  Type Release() { return std::exchange(m_handle, Type{}); }

  void Reset(Type handle = Type{}) {
    const Type old = std::exchange(m_handle, handle);
    if (Traits::IsValid(old)) Traits::Close(old);
  }

  // For functions that return a handle through a pointer. Closes what was held.
  Type* Receive() {
    Reset();
    return &m_handle;
  }

 private:
  Type m_handle{};
};

struct KernelHandleTraits {
  using Type = HANDLE;
  static bool IsValid(HANDLE handle) { return handle != nullptr && handle != INVALID_HANDLE_VALUE; }
  static void Close(HANDLE handle) { CloseHandle(handle); }
};
using KernelHandle = Scoped<KernelHandleTraits>;  // files, events, processes, threads, mappings

struct FindHandleTraits {
  using Type = HANDLE;
  static bool IsValid(HANDLE handle) { return handle != nullptr && handle != INVALID_HANDLE_VALUE; }
  static void Close(HANDLE handle) { FindClose(handle); }
};
using FindHandle = Scoped<FindHandleTraits>;  // FindFirstFile enumerations

struct ChangeNotificationTraits {
  using Type = HANDLE;
  static bool IsValid(HANDLE handle) { return handle != nullptr && handle != INVALID_HANDLE_VALUE; }
  static void Close(HANDLE handle) { FindCloseChangeNotification(handle); }
};
using ChangeNotification = Scoped<ChangeNotificationTraits>;  // FindFirstChangeNotification

struct ModuleTraits {
  using Type = HMODULE;
  static bool IsValid(HMODULE module) { return module != nullptr; }
  static void Close(HMODULE module) { FreeLibrary(module); }
};
using ScopedModule = Scoped<ModuleTraits>;

struct RegistryKeyTraits {
  using Type = HKEY;
  static bool IsValid(HKEY key) { return key != nullptr; }
  static void Close(HKEY key) { RegCloseKey(key); }
};
using RegistryKeyHandle = Scoped<RegistryKeyTraits>;

template <class T>
struct LocalMemoryTraits {
  using Type = T*;
  static bool IsValid(T* memory) { return memory != nullptr; }
  static void Close(T* memory) { LocalFree(memory); }
};
template <class T>
using LocalMemory = Scoped<LocalMemoryTraits<T>>;  // what the system allocated with LocalAlloc for its caller
