// For the native build only: the few types and the one function of Windows that portable sources touch, with the sizes
// that they have there. What needs more of the system than this is not built natively.
#pragma once

#include <cstdint>

using BOOL = int32_t;
using UINT = uint32_t;
using LONG = int32_t;
using DWORD = uint32_t;
using LRESULT = int64_t;
using WPARAM = uint64_t;
using LPARAM = int64_t;
using HWND = struct Window*;

struct SIZE {
  LONG cx, cy;
};
struct POINT {
  LONG x, y;
};
struct RECT {
  LONG left, top, right, bottom;
};

inline constexpr BOOL TRUE = 1;
inline constexpr BOOL FALSE = 0;
inline constexpr int CSTR_EQUAL = 2;

#define CALLBACK

int CompareStringOrdinal(const wchar_t* left, int leftLength, const wchar_t* right, int rightLength, BOOL ignoreCase);
