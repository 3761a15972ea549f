#pragma once

#include <memory>
#include <string>

#include "Drawing/Backends/GdiPlusHeader.h"

namespace Corvo {

// What GDI+, which has to be running, writes with: the family (DrawingFont.h) and the way it lays out a line.
class TypefaceGdiPlus {
public:
    TypefaceGdiPlus();

    // Null on a system without typefaces.
    const Gdiplus::FontFamily* Family() const { return m_family.get(); }
    const Gdiplus::StringFormat* Format() const { return m_format.get(); }
    // The font's above and below the baseline, in sizes.
    float Ascent() const { return m_ascent; }
    float Descent() const { return m_descent; }
    // From where GDI+ is told to put a text down to the baseline, in sizes.
    float Baseline() const { return m_baseline; }

private:
    bool Use(const Gdiplus::FontFamily& family);
    bool UseFile(const std::wstring& path);
    bool UseListed(const std::wstring& name);

    std::unique_ptr<Gdiplus::StringFormat> m_format;
    Gdiplus::PrivateFontCollection m_files;  // before the family that may be in it
    std::unique_ptr<Gdiplus::FontFamily> m_family;
    float m_ascent = 1.0f, m_descent = 0.0f, m_baseline = 1.0f;
};

}  // namespace Corvo
