// Owners for what COM hands out: interface pointers, BSTR strings and VARIANT values.
#pragma once

#include <windows.h>

#include <oleauto.h>

#include <string_view>

#include "core/scoped.h"

template <class Interface>
struct ComTraits {
  using Type = Interface*;
  static bool IsValid(Interface* pointer) { return pointer != nullptr; }
  static void Close(Interface* pointer) { pointer->Release(); }
};

// One reference to an interface. To keep a pointer that somebody else owns, AddRef it first.
template <class Interface>
class ComPtr : public Scoped<ComTraits<Interface>> {
 public:
  using Scoped<ComTraits<Interface>>::Scoped;

  Interface* operator->() const { return this->Get(); }

  // For functions that return an interface through a void**. Releases what was held.
  void** ReceiveVoid() { return reinterpret_cast<void**>(this->Receive()); }
};

struct BstrTraits {
  using Type = BSTR;
  static bool IsValid(BSTR text) { return text != nullptr; }
  static void Close(BSTR text) { SysFreeString(text); }
};

using ScopedBstr = Scoped<BstrTraits>;

// Invalid when there is no memory.
inline ScopedBstr MakeBstr(std::wstring_view text) {
  return ScopedBstr(SysAllocStringLen(text.data(), static_cast<UINT>(text.size())));
}

// The text of a BSTR by its own length; a null one is an empty string.
inline std::wstring_view BstrText(BSTR text) {
  return text == nullptr ? std::wstring_view() : std::wstring_view(text, SysStringLen(text));
}

// A VARIANT, empty at first, all of its bytes zero, and cleared by the destructor.
class ScopedVariant {
 public:
  ScopedVariant() = default;
  ~ScopedVariant() { VariantClear(&m_variant); }
  ScopedVariant(const ScopedVariant&) = delete;
  ScopedVariant& operator=(const ScopedVariant&) = delete;

  const VARIANT& Get() const { return m_variant; }

  // For functions that return a value. Clears what was held.
  VARIANT* Receive() {
    VariantClear(&m_variant);
    m_variant = VARIANT{};
    return &m_variant;
  }

 private:
  VARIANT m_variant{};  // VT_EMPTY is 0
};
