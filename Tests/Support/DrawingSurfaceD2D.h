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

// At most as large as the target, whose upper left corner it is. One is painted on at a time: a new one
// begins with another picture.
template <>
class DrawingSurface<Corvo::DrawingD2D> {
public:
    // At a resolution of its own, which must not matter.
    DrawingSurface(int width, int height)
        : m_width(static_cast<UINT32>(width)),
          m_pixels(static_cast<std::size_t>(width) * static_cast<std::size_t>(height)),
          m_place{0, 0, width, height} {
        m_target->SetDpi(144.0f, 144.0f);
        m_target->SetAntialiasMode(D2D1_ANTIALIAS_MODE_PER_PRIMITIVE);
        const D2D1_COLOR_F black{0.0f, 0.0f, 0.0f, 1.0f};
        PaintPlainly([&] { m_target->Clear(&black); });
    }

    template <typename Draw>
    void Paint(float dpi, Draw draw) {
        PaintPlainly([&] {
            Corvo::DrawingD2D::DrawTarget target(m_drawing, dpi);
            draw(target);
        });
    }

    void PaintWith(Corvo::DrawingBrush brush) {
        const D2D1_RECT_F everything{0.0f, 0.0f, 1e4f, 1e4f};
        PaintPlainly([&] { m_target->FillRectangle(&everything, static_cast<ID2D1Brush*>(brush.object)); });
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
    // After a failure every pixel is of a colour that no test draws.
    void PaintPlainly(const auto& draw) {
        m_target->BeginDraw();
        draw();
        const UINT bytes = static_cast<UINT>(m_pixels.size() * 4);
        if (FAILED(m_target->EndDraw()) ||
            FAILED(m_target.Image()->CopyPixels(&m_place, m_width * 4, bytes,
                                                reinterpret_cast<BYTE*>(m_pixels.data()))))
            m_pixels.assign(m_pixels.size(), 0xFFBADBAD);
    }

    UINT32 m_width;
    std::vector<std::uint32_t> m_pixels;
    WICRect m_place;
    SharedRenderTarget& m_target = SharedRenderTarget::Get();
    Corvo::DrawingD2D m_drawing{m_target.Target()};
};

}  // namespace TestSupport
