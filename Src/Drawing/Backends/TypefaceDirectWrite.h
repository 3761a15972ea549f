#pragma once

#include <string>

#include "Drawing/Backends/WideText.h"
#include "Platform/WindowsHeader.h"

#include <dwrite.h>
#include <wrl/client.h>

namespace Corvo {

// What DirectWrite writes with: the family (DrawingFont.h) and the way a line is laid out and smoothed. A
// file is read from Windows 10 on; before, the family counts that is installed.
class TypefaceDirectWrite {
public:
    TypefaceDirectWrite();

    // Null when it cannot be made.
    Microsoft::WRL::ComPtr<IDWriteTextLayout> LayOut(const WideText& text, float size) const;
    // Null for the system's own.
    IDWriteRenderingParams* Rendering() const { return m_rendering.Get(); }
    // The font's above and below the baseline, in sizes.
    float Ascent() const { return m_ascent; }
    float Descent() const { return m_descent; }

private:
    bool UseFile(const std::wstring& path);
    bool UseName(const std::wstring& name);
    bool Use(UINT32 index);

    Microsoft::WRL::ComPtr<IDWriteFactory> m_factory;
    Microsoft::WRL::ComPtr<IDWriteRenderingParams> m_rendering;
    Microsoft::WRL::ComPtr<IDWriteFontCollection> m_collection;
    std::wstring m_family;
    float m_ascent = 1.0f, m_descent = 0.0f;
};

}  // namespace Corvo
