#include "Drawing/Backends/TypefaceGdiPlus.h"

#include <algorithm>
#include <cstdint>
#include <vector>

#include "Drawing/Backends/WideText.h"
#include "Drawing/DrawingFont.h"

namespace Corvo {
namespace {

constexpr auto kStyle = Gdiplus::FontStyleRegular;
// Not the system's generic family: the headers keep it for good, past the end of GDI+.
constexpr const wchar_t* kSansSerifs[] = {L"Segoe UI", L"Arial", L"Tahoma", L"Microsoft Sans Serif"};

// Text stands where it is put, with the distances that its letters were drawn for.
std::unique_ptr<Gdiplus::StringFormat> MakeFormat() {
    std::unique_ptr<Gdiplus::StringFormat> format(Gdiplus::StringFormat::GenericTypographic()->Clone());
#if defined(__MINGW32__)
    // As with the family; this one cannot be done without.
    Gdiplus::StringFormat::operator delete(Gdiplus::_GdipStringFormatCachedGenericTypographic);
    Gdiplus::_GdipStringFormatCachedGenericTypographic = nullptr;
#endif
    format->SetFormatFlags(Gdiplus::StringFormatFlagsNoFitBlackBox | Gdiplus::StringFormatFlagsNoClip |
                           Gdiplus::StringFormatFlagsNoWrap |
                           Gdiplus::StringFormatFlagsMeasureTrailingSpaces);
    format->SetTrimming(Gdiplus::StringTrimmingNone);
    return format;
}

// By the feet of an H: systems differ in whether the ascent that GDI+ tells is the one it draws by.
float FindBaseline(const Gdiplus::FontFamily& family, const Gdiplus::StringFormat& format) {
    constexpr int kSize = 128, kHeight = 3 * kSize;
    std::vector<std::uint32_t> pixels(kSize * kHeight);
    Gdiplus::Bitmap picture(kSize, kHeight, kSize * static_cast<int>(sizeof(std::uint32_t)),
                            PixelFormat32bppRGB, reinterpret_cast<BYTE*>(pixels.data()));
    Gdiplus::Graphics graphics(&picture);
    graphics.SetTextRenderingHint(Gdiplus::TextRenderingHintAntiAlias);
    const Gdiplus::Font font(&family, kSize, kStyle, Gdiplus::UnitPixel);
    const Gdiplus::SolidBrush white(Gdiplus::Color(255, 255, 255, 255));
    graphics.DrawString(L"H", 1, &font, Gdiplus::PointF(0.0f, 0.0f), &format, &white);
    graphics.Flush(Gdiplus::FlushIntentionSync);

    const auto isInk = [](std::uint32_t pixel) { return (pixel & 0xFF) >= 0x80; };
    const auto lowest = std::find_if(pixels.rbegin(), pixels.rend(), isInk);
    return static_cast<float>((pixels.rend() - lowest + kSize - 1) / kSize) / kSize;
}

}  // namespace

TypefaceGdiPlus::TypefaceGdiPlus() : m_format(MakeFormat()) {
    const std::wstring wanted = WideString(DrawingFont::kFamily);
    if (UseFile(WideString(DrawingFont::GetFile())) || Use(Gdiplus::FontFamily(wanted.c_str())) ||
        UseListed(wanted))
        return;
    for (const wchar_t* const name : kSansSerifs)
        if (Use(Gdiplus::FontFamily(name))) return;
    UseListed({});
}

bool TypefaceGdiPlus::Use(const Gdiplus::FontFamily& family) {
    if (!family.IsAvailable() || !family.IsStyleAvailable(kStyle)) return false;
    m_family.reset(family.Clone());
    const auto size = static_cast<float>(m_family->GetEmHeight(kStyle));
    m_ascent = static_cast<float>(m_family->GetCellAscent(kStyle)) / size;
    m_descent = static_cast<float>(m_family->GetCellDescent(kStyle)) / size;
    m_baseline = FindBaseline(*m_family, *m_format);
    return true;
}

bool TypefaceGdiPlus::UseFile(const std::wstring& path) {
    Gdiplus::FontFamily family;
    int found = 0;
    return !path.empty() && m_files.AddFontFile(path.c_str()) == Gdiplus::Ok &&
           m_files.GetFamilies(1, &family, &found) == Gdiplus::Ok && found == 1 && Use(family);
}

// By way of the list, for a system that names families there and does not find them by that name. An empty
// name takes the first family that can be used.
bool TypefaceGdiPlus::UseListed(const std::wstring& name) {
    const Gdiplus::InstalledFontCollection installed;
    const int count = installed.GetFamilyCount();
    if (count < 1) return false;
    const std::unique_ptr<Gdiplus::FontFamily[]> families(
        new Gdiplus::FontFamily[static_cast<unsigned>(count)]);
    int found = 0;
    if (installed.GetFamilies(count, families.get(), &found) != Gdiplus::Ok) return false;
    for (int i = 0; i < found; ++i) {
        const Gdiplus::FontFamily& family = families[static_cast<unsigned>(i)];
        wchar_t listed[LF_FACESIZE] = {};
        if (family.GetFamilyName(listed) != Gdiplus::Ok) continue;
        if ((name.empty() || name == listed) && Use(family)) return true;
    }
    return false;
}

}  // namespace Corvo
