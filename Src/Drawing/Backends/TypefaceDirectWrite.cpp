#include "Drawing/Backends/TypefaceDirectWrite.h"

#include "Drawing/DrawingFont.h"

#include <dwrite_3.h>

using Microsoft::WRL::ComPtr;

namespace Corvo {
namespace {

constexpr const wchar_t* kSansSerifs[] = {L"Segoe UI", L"Arial", L"Tahoma", L"Microsoft Sans Serif"};

// Gray, and as much ink as the letter covers: the same on a light ground as on a dark one, and as on every
// other back-end.
ComPtr<IDWriteRenderingParams> MakeRendering(IDWriteFactory* factory) {
    constexpr float kGamma = 1.0f, kNoContrast = 0.0f, kNoColours = 0.0f;
    ComPtr<IDWriteRenderingParams> rendering;
    factory->CreateCustomRenderingParams(kGamma, kNoContrast, kNoColours, DWRITE_PIXEL_GEOMETRY_FLAT,
                                         DWRITE_RENDERING_MODE_CLEARTYPE_NATURAL_SYMMETRIC, &rendering);
    return rendering;
}

// The typefaces of one file, null where there are none or the system cannot.
ComPtr<IDWriteFontCollection> CollectionOf(IDWriteFactory* factory, const std::wstring& path) {
    ComPtr<IDWriteFactory5> newer;
    ComPtr<IDWriteFontFile> file;
    ComPtr<IDWriteFontSetBuilder1> builder;
    ComPtr<IDWriteFontSet> set;
    ComPtr<IDWriteFontCollection1> collection;
    if (SUCCEEDED(factory->QueryInterface(IID_PPV_ARGS(&newer))) &&
        SUCCEEDED(newer->CreateFontFileReference(path.c_str(), nullptr, &file)) &&
        SUCCEEDED(newer->CreateFontSetBuilder(&builder)) && SUCCEEDED(builder->AddFontFile(file.Get())) &&
        SUCCEEDED(builder->CreateFontSet(&set)))
        newer->CreateFontCollectionFromFontSet(set.Get(), &collection);
    return collection;
}

std::wstring NameOf(IDWriteFontFamily* family) {
    ComPtr<IDWriteLocalizedStrings> names;
    UINT32 length = 0;
    if (FAILED(family->GetFamilyNames(&names)) || FAILED(names->GetStringLength(0, &length))) return {};
    std::wstring name(length + 1, L'\0');  // the system ends it with a null
    if (FAILED(names->GetString(0, name.data(), length + 1))) return {};
    name.resize(length);
    return name;
}

}  // namespace

TypefaceDirectWrite::TypefaceDirectWrite() {
    if (FAILED(DWriteCreateFactory(DWRITE_FACTORY_TYPE_SHARED, __uuidof(IDWriteFactory), &m_factory))) return;
    m_rendering = MakeRendering(m_factory.Get());
    if (UseFile(WideString(DrawingFont::GetFile()))) return;
    if (FAILED(m_factory->GetSystemFontCollection(&m_collection)) ||
        UseName(WideString(DrawingFont::kFamily)))
        return;
    for (const wchar_t* const name : kSansSerifs)
        if (UseName(name)) return;
    Use(0);
}

bool TypefaceDirectWrite::UseFile(const std::wstring& path) {
    if (path.empty()) return false;
    m_collection = CollectionOf(m_factory.Get(), path);
    if (m_collection && Use(0)) return true;
    m_collection.Reset();
    return false;
}

bool TypefaceDirectWrite::UseName(const std::wstring& name) {
    UINT32 index = 0;
    BOOL exists = FALSE;
    return SUCCEEDED(m_collection->FindFamilyName(name.c_str(), &index, &exists)) && exists && Use(index);
}

bool TypefaceDirectWrite::Use(UINT32 index) {
    ComPtr<IDWriteFontFamily> family;
    ComPtr<IDWriteFont> font;
    if (FAILED(m_collection->GetFontFamily(index, &family)) ||
        FAILED(family->GetFirstMatchingFont(DWRITE_FONT_WEIGHT_NORMAL, DWRITE_FONT_STRETCH_NORMAL,
                                            DWRITE_FONT_STYLE_NORMAL, &font)))
        return false;
    DWRITE_FONT_METRICS metrics;
    font->GetMetrics(&metrics);
    if (metrics.designUnitsPerEm == 0) return false;
    m_ascent = static_cast<float>(metrics.ascent) / metrics.designUnitsPerEm;
    m_descent = static_cast<float>(metrics.descent) / metrics.designUnitsPerEm;
    m_family = NameOf(family.Get());
    return true;
}

ComPtr<IDWriteTextLayout> TypefaceDirectWrite::LayOut(const WideText& text, float size) const {
    ComPtr<IDWriteTextFormat> format;
    ComPtr<IDWriteTextLayout> layout;
    if (!m_factory || FAILED(m_factory->CreateTextFormat(
                          m_family.c_str(), m_collection.Get(), DWRITE_FONT_WEIGHT_NORMAL,
                          DWRITE_FONT_STYLE_NORMAL, DWRITE_FONT_STRETCH_NORMAL, size, L"en-us", &format)))
        return nullptr;
    format->SetWordWrapping(DWRITE_WORD_WRAPPING_NO_WRAP);
    m_factory->CreateTextLayout(text.text.data(), static_cast<UINT32>(text.length), format.Get(), 0.0f, 0.0f,
                                &layout);
    return layout;
}

}  // namespace Corvo
