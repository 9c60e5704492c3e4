// The program's own string: a length-counted, zero-terminated buffer with guard words around its text, so that a write
// past either end is noticed at the next access instead of travelling on. Members that mirror std::basic_string have
// its names; text passes between the two as a string view.
#pragma once

#include <algorithm>
#include <array>
#include <compare>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <new>
#include <stdexcept>
#include <string_view>
#include <utility>

namespace qx {

// Where strings get their buffers from. Null when there is no memory.
struct StringMemMgr {
  static void* Allocate(size_t bytes) { return std::malloc(bytes); }
  static void Free(void* memory) { std::free(memory); }
};

// A guard word was overwritten. A programming error: the text cannot be trusted, and nobody catches this.
class StringGuardException : public std::exception {
 public:
  const char* what() const noexcept override { return "a string's guard word is damaged"; }
};

// Every member but the destructor and moving throws StringGuardException when a guard is damaged; growing throws
// std::bad_alloc or std::length_error. An instance may be read by several threads, like a std::string.
template <class Char, class MemMgr>
class StringT {
 public:
  using View = std::basic_string_view<Char>;

  StringT() noexcept = default;  // no buffer until text comes
  StringT(View text) : StringT(text, 0) {}
  StringT(const StringT& other) : StringT(View(other), other.capacity()) {}
  StringT(StringT&& other) noexcept : m_buffer(std::exchange(other.m_buffer, nullptr)) {}
  StringT& operator=(const StringT& other) { return this == &other ? *this : assign(other); }
  StringT& operator=(StringT&& other) noexcept {
    StringT moved(std::move(other));
    swap(moved);
    return *this;
  }
  StringT& operator=(View text) { return assign(text); }
  ~StringT() { MemMgr::Free(m_buffer); }

  size_t size() const { return m_buffer == nullptr ? 0 : Checked().length; }
  size_t capacity() const { return m_buffer == nullptr ? 0 : Checked().capacity; }
  bool empty() const { return size() == 0; }
  const Char* c_str() const { return m_buffer == nullptr ? kNoText : Text(&Checked()); }

  // For functions of the system that fill a buffer of size() characters; null without a buffer.
  Char* data() { return m_buffer == nullptr ? nullptr : Text(&Checked()); }

  operator View() const { return View(c_str(), size()); }

  Char operator[](size_t index) const {
    if (index >= size()) throw std::out_of_range("no such character");
    return c_str()[index];
  }

  // `text` may be a part of this string.
  StringT& append(View text) {
    const size_t length = size();
    if (text.size() > capacity() - length) {
      if (text.size() > kMostCharacters - length) throw std::length_error("a string grows too long");
      StringT grown(*this, std::max(length + text.size(), std::min(capacity() * 2, kMostCharacters)));
      grown.Put(length, text);
      swap(grown);
    } else if (!text.empty()) {
      Put(length, text);
    }
    return *this;
  }
  StringT& append(size_t count, Char character) {
    const size_t length = size();
    resize(length + count);
    std::fill_n(data() + length, count, character);
    return *this;
  }
  StringT& operator+=(View text) { return append(text); }
  StringT& operator+=(Char character) { return append(View(&character, 1)); }

  StringT& assign(View text) {
    if (text.size() > capacity()) {
      StringT(text, 0).swap(*this);
    } else if (m_buffer != nullptr) {
      Put(0, text);
    }
    return *this;
  }

  // New characters are zero. Making a string shorter keeps its capacity.
  void resize(size_t length) {
    reserve(length);
    if (m_buffer == nullptr) return;
    Header& header = Checked();
    if (length > header.length) std::fill(Text(&header) + header.length, Text(&header) + length, Char{});
    SetLength(header, length);
  }
  void reserve(size_t characters) {
    if (characters > capacity()) StringT(View(*this), characters).swap(*this);
  }
  void clear() { resize(0); }
  void swap(StringT& other) noexcept { std::swap(m_buffer, other.m_buffer); }

  friend bool operator==(const StringT& left, const StringT& right) { return View(left) == View(right); }
  friend bool operator==(const StringT& left, View right) { return View(left) == right; }
  friend auto operator<=>(const StringT& left, const StringT& right) { return View(left) <=> View(right); }
  friend auto operator<=>(const StringT& left, View right) { return View(left) <=> right; }

 private:
  static constexpr uint16_t kGuard = 0xABCD;
  using GuardRow = std::array<uint16_t, 4>;
  static constexpr GuardRow kGuardRow{kGuard, kGuard, kGuard, kGuard};

  // In memory: the header, `capacity` characters, the terminating zero, the last guard word.
  struct Header {
    size_t length;
    size_t capacity;
    GuardRow guard;  // a row of words, so that no padding lies between the guard and the text
  };
  static_assert(sizeof(Header) == 2 * sizeof(size_t) + sizeof(GuardRow) && alignof(Char) <= alignof(size_t));

  static constexpr Char kNoText[1] = {};
  static constexpr size_t kMostCharacters = (SIZE_MAX / 2 - sizeof(Header) - sizeof kGuard) / sizeof(Char) - 1;

  StringT(View text, size_t capacity) {
    capacity = std::max(capacity, text.size());
    if (capacity == 0) return;
    if (capacity > kMostCharacters) throw std::length_error("a string grows too long");
    void* const memory = MemMgr::Allocate(sizeof(Header) + (capacity + 1) * sizeof(Char) + sizeof kGuard);
    if (memory == nullptr) throw std::bad_alloc();
    m_buffer = new (memory) Header{0, capacity, kGuardRow};
    std::memcpy(LastGuard(m_buffer), &kGuard, sizeof kGuard);
    Put(0, text);
  }

  static Char* Text(Header* header) { return reinterpret_cast<Char*>(header + 1); }
  static Char* LastGuard(Header* header) { return Text(header) + header->capacity + 1; }

  static void SetLength(Header& header, size_t length) {
    header.length = length;
    Text(&header)[length] = Char{};
  }

  // The buffer, which exists, after a look at its guards.
  Header& Checked() const {
    uint16_t last = 0;
    if (m_buffer->guard == kGuardRow) std::memcpy(&last, LastGuard(m_buffer), sizeof last);
    if (last != kGuard) throw StringGuardException();
    return *m_buffer;
  }

  // Writes `text`, for which there is room, at `offset` and ends the string behind it.
  void Put(size_t offset, View text) {
    Header& header = Checked();
    std::memmove(Text(&header) + offset, text.data(), text.size() * sizeof(Char));
    SetLength(header, offset + text.size());
  }

  Header* m_buffer = nullptr;
};

using String = StringT<wchar_t, StringMemMgr>;

}  // namespace qx
