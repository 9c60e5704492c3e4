#include "companions/engine/frame_surface.h"

#include <utility>

namespace engine {
namespace {

constexpr UINT kLargestSide = 16384;  // pixels

// Puts a bitmap into a DC for as long as the object lives.
class Selected {
 public:
  Selected(HDC dc, HBITMAP bitmap) : m_dc(dc), m_before(SelectObject(dc, bitmap)) {}
  ~Selected() { SelectObject(m_dc, m_before); }
  Selected(const Selected&) = delete;
  Selected& operator=(const Selected&) = delete;

 private:
  const HDC m_dc;
  const HGDIOBJ m_before;
};

}  // namespace

bool FrameSurface::Reserve(SIZE size) {
  if (m_bitmap && size.cx == m_size.cx && size.cy == m_size.cy) return true;
  BITMAPINFO info{};
  info.bmiHeader.biSize = sizeof info.bmiHeader;
  info.bmiHeader.biWidth = size.cx;
  info.bmiHeader.biHeight = -size.cy;  // top down
  info.bmiHeader.biPlanes = 1;
  info.bmiHeader.biBitCount = 32;
  void* bits = nullptr;
  ScopedBitmap bitmap(CreateDIBSection(nullptr, &info, DIB_RGB_COLORS, &bits, nullptr, 0));
  if (!bitmap) return false;
  m_bitmap = std::move(bitmap);
  m_bits = bits;
  m_size = size;
  return true;
}

HRESULT FrameSurface::Decode(std::string& png) {
  HRESULT result = S_OK;
  if (!m_factory) {
    result = CoCreateInstance(CLSID_WICImagingFactory, nullptr, CLSCTX_INPROC_SERVER, IID_IWICImagingFactory,
                              m_factory.ReceiveVoid());
    if (FAILED(result)) return result;
  }
  ComPtr<IWICStream> stream;
  ComPtr<IWICBitmapDecoder> decoder;
  ComPtr<IWICBitmapFrameDecode> frame;
  ComPtr<IWICFormatConverter> converter;
  UINT width = 0;
  UINT height = 0;
  if (FAILED(result = m_factory->CreateStream(stream.Receive())) ||
      FAILED(result =
                 stream->InitializeFromMemory(reinterpret_cast<BYTE*>(png.data()), static_cast<DWORD>(png.size()))) ||
      FAILED(result = m_factory->CreateDecoderFromStream(stream.Get(), nullptr, WICDecodeMetadataCacheOnDemand,
                                                         decoder.Receive())) ||
      FAILED(result = decoder->GetFrame(0, frame.Receive())) ||
      FAILED(result = m_factory->CreateFormatConverter(converter.Receive())) ||
      FAILED(result = converter->Initialize(frame.Get(), GUID_WICPixelFormat32bppPBGRA, WICBitmapDitherTypeNone,
                                            nullptr, 0, WICBitmapPaletteTypeCustom)) ||
      FAILED(result = converter->GetSize(&width, &height))) {
    return result;
  }
  if (width == 0 || height == 0 || width > kLargestSide || height > kLargestSide) return E_INVALIDARG;
  if (!Reserve({static_cast<LONG>(width), static_cast<LONG>(height)})) return E_OUTOFMEMORY;
  return converter->CopyPixels(nullptr, width * 4, width * 4 * height, static_cast<BYTE*>(m_bits));
}

bool FrameSurface::ShowLayered(HWND window, SIZE size) {
  // The window takes the picture's size. While it changes its own, the browser may send the picture before once more,
  // scaled to fit.
  const bool isOfSize = size.cx == m_size.cx && size.cy == m_size.cy;
  if (!isOfSize && !Stretch(size)) return false;
  const MemoryDc dc(CreateCompatibleDC(nullptr));
  const Selected selected(dc.Get(), m_bitmap.Get());
  POINT origin{};
  BLENDFUNCTION blend{AC_SRC_OVER, 0, 255, AC_SRC_ALPHA};
  return UpdateLayeredWindow(window, nullptr, nullptr, &size, dc.Get(), &origin, 0, &blend, ULW_ALPHA) != FALSE;
}

bool FrameSurface::Stretch(SIZE size) {
  const ScopedBitmap former = std::move(m_bitmap);
  const SIZE formerSize = m_size;
  if (!Reserve(size)) return false;
  const MemoryDc from(CreateCompatibleDC(nullptr));
  const MemoryDc to(CreateCompatibleDC(nullptr));
  const Selected source(from.Get(), former.Get());
  const Selected target(to.Get(), m_bitmap.Get());
  return StretchBlt(to.Get(), 0, 0, size.cx, size.cy, from.Get(), 0, 0, formerSize.cx, formerSize.cy, SRCCOPY) != FALSE;
}

void FrameSurface::Paint(HDC target) const {
  if (!m_bitmap) return;
  const MemoryDc dc(CreateCompatibleDC(target));
  const Selected selected(dc.Get(), m_bitmap.Get());
  BitBlt(target, 0, 0, m_size.cx, m_size.cy, dc.Get(), 0, 0, SRCCOPY);
}

}  // namespace engine
