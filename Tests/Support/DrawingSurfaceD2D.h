#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "Drawing/Backends/DrawingD2D.h"
#include "Platform/WindowsHeader.h"

#include <d2d1.h>
#include <wincodec.h>
#include <wrl/client.h>

namespace TestSupport {

// The one render target of all surfaces, made once: a device is slow to make, and some systems that stand in
// for Windows have room for a few only.
class SharedRenderTarget {
public:
    static constexpr UINT32 kWidth = 640, kHeight = 360;

    static SharedRenderTarget& Get() {
        static SharedRenderTarget* const target = new SharedRenderTarget;  // outlives every surface
        return *target;
    }
    ID2D1RenderTarget* operator->() { return m_target.Get(); }
    ID2D1RenderTarget* Target() { return m_target.Get(); }
    IWICBitmap* Image() { return m_image.Get(); }

private:
    SharedRenderTarget() {
        CoInitializeEx(nullptr, COINIT_APARTMENTTHREADED);
        Microsoft::WRL::ComPtr<IWICImagingFactory> imaging;
        CoCreateInstance(CLSID_WICImagingFactory, nullptr, CLSCTX_INPROC_SERVER, IID_PPV_ARGS(&imaging));
        imaging->CreateBitmap(kWidth, kHeight, GUID_WICPixelFormat32bppPBGRA, WICBitmapCacheOnLoad, &m_image);
        Microsoft::WRL::ComPtr<ID2D1Factory> factory;
        D2D1CreateFactory(D2D1_FACTORY_TYPE_SINGLE_THREADED, IID_PPV_ARGS(&factory));
        const D2D1_RENDER_TARGET_PROPERTIES properties{};
        factory->CreateWicBitmapRenderTarget(m_image.Get(), &properties, &m_target);
    }

    Microsoft::WRL::ComPtr<IWICBitmap> m_image;
    Microsoft::WRL::ComPtr<ID2D1RenderTarget> m_target;
};

// Keeps its picture itself, and lends it to the target while it is painted on. At most as large as the
// target.
template <>
class DrawingSurface<Corvo::DrawingD2D> {
public:
    // At a resolution of its own, which must not matter.
    DrawingSurface(int width, int height)
        : m_width(static_cast<UINT32>(width)),
          m_height(static_cast<UINT32>(height)),
          m_pixels(static_cast<std::size_t>(width) * static_cast<std::size_t>(height), 0xFF000000) {
        m_target->SetDpi(144.0f, 144.0f);
        m_target->SetAntialiasMode(D2D1_ANTIALIAS_MODE_PER_PRIMITIVE);
    }

    template <typename Draw>
    void Paint(float dpi, Draw draw) {
        Lend();
        {
            Corvo::DrawingD2D::DrawTarget target(m_drawing, dpi);
            draw(target);
        }
        TakeBack();
    }

    void PaintWith(Corvo::DrawingBrush brush) {
        const D2D1_RECT_F everything{0.0f, 0.0f, 1e4f, 1e4f};
        Lend();
        m_target->FillRectangle(&everything, static_cast<ID2D1Brush*>(brush.object));
        TakeBack();
    }

    std::uint32_t Pixel(int x, int y) const {
        return m_pixels[static_cast<std::size_t>(y) * m_width + static_cast<std::size_t>(x)] & 0xFFFFFF;
    }
    Corvo::DrawingD2D& Drawing() { return m_drawing; }
    ID2D1RenderTarget* Target() { return m_target.Target(); }

    // Some systems that stand in for Windows fill whole pixels only; theirs is not ours to repair.
    static bool Smooths() {
        DrawingSurface surface(2, 1);
        const Corvo::DrawingBrush brush = surface.Drawing().CreateSolidBrush(0xFFFFFF, 255);
        const D2D1_RECT_F half{0.0f, 0.0f, 0.5f, 1.0f};
        surface.Paint(96.0f, [&](auto&) {
            surface.m_target->FillRectangle(&half, static_cast<ID2D1Brush*>(brush.object));
        });
        surface.Drawing().ReleaseBrush(brush);
        return surface.Pixel(0, 0) != 0 && surface.Pixel(0, 0) != 0xFFFFFF;
    }

private:
    void Lend() {
        D2D1_BITMAP_PROPERTIES properties{};
        properties.pixelFormat = {DXGI_FORMAT_B8G8R8A8_UNORM, D2D1_ALPHA_MODE_PREMULTIPLIED};
        Microsoft::WRL::ComPtr<ID2D1Bitmap> picture;
        m_target->CreateBitmap({m_width, m_height}, m_pixels.data(), m_width * 4, &properties, &picture);
        const D2D1_RECT_F place{0.0f, 0.0f, static_cast<float>(m_width), static_cast<float>(m_height)};
        float x = 0.0f, y = 0.0f;
        m_target->BeginDraw();
        m_target->GetDpi(&x, &y);
        m_target->SetDpi(96.0f, 96.0f);
        m_target->DrawBitmap(picture.Get(), &place, 1.0f, D2D1_BITMAP_INTERPOLATION_MODE_NEAREST_NEIGHBOR);
        m_target->SetDpi(x, y);
    }

    // After a failure every pixel is of a colour that no test draws.
    void TakeBack() {
        const WICRect place{0, 0, static_cast<INT>(m_width), static_cast<INT>(m_height)};
        const UINT bytes = static_cast<UINT>(m_pixels.size() * 4);
        if (FAILED(m_target->EndDraw()) ||
            FAILED(m_target.Image()->CopyPixels(&place, m_width * 4, bytes,
                                                reinterpret_cast<BYTE*>(m_pixels.data()))))
            m_pixels.assign(m_pixels.size(), 0xFFBADBAD);
    }

    UINT32 m_width, m_height;
    std::vector<std::uint32_t> m_pixels;
    SharedRenderTarget& m_target = SharedRenderTarget::Get();
    Corvo::DrawingD2D m_drawing{m_target.Target()};
};

}  // namespace TestSupport
