// The page's picture as it stands in a window: frames arrive as PNG, and are kept as a bitmap in memory.
#pragma once

#include <windows.h>

#include <wincodec.h>

#include <string>

#include "core/com.h"
#include "core/scoped.h"

namespace engine {

struct BitmapTraits {
  using Type = HBITMAP;
  static bool IsValid(HBITMAP bitmap) { return bitmap != nullptr; }
  static void Close(HBITMAP bitmap) { DeleteObject(bitmap); }
};
using ScopedBitmap = Scoped<BitmapTraits>;

struct MemoryDcTraits {
  using Type = HDC;
  static bool IsValid(HDC dc) { return dc != nullptr; }
  static void Close(HDC dc) { DeleteDC(dc); }
};
using MemoryDc = Scoped<MemoryDcTraits>;

class FrameSurface {
 public:
  // Decodes `png` into the bitmap. 0, or the HRESULT of what failed; the picture before stays then.
  HRESULT Decode(std::string& png);

  bool IsEmpty() const { return !m_bitmap; }
  SIZE Size() const { return m_size; }

  // Shows the picture as the content of a layered window of this size. False with the last error.
  bool ShowLayered(HWND window, SIZE size);
  void Paint(HDC dc) const;

 private:
  bool Reserve(SIZE size);
  bool Stretch(SIZE size);  // the picture is of this size then

  ComPtr<IWICImagingFactory> m_factory;
  ScopedBitmap m_bitmap;  // 32 bits, premultiplied, top down
  void* m_bits = nullptr;
  SIZE m_size{};
};

}  // namespace engine
