#include <algorithm>
#include <cwchar>
#include <string>

#include "Errors.h"
#include "Picture.h"
#include "Platform/WindowsHeader.h"

#include <objidl.h>

namespace Gdiplus {
using std::max;  // for the macros that WindowsHeader.h does without
using std::min;
}  // namespace Gdiplus

#include <gdiplus.h>

namespace dsphost {
namespace {

// False on a system that writes no PNG files.
bool FindPngEncoder(CLSID& encoder) {
    UINT count = 0, bytes = 0;
    if (Gdiplus::GetImageEncodersSize(&count, &bytes) != Gdiplus::Ok || bytes == 0) return false;
    std::vector<std::uint64_t> memory(bytes / sizeof(std::uint64_t) + 1);  // texts stand behind the records
    auto* const encoders = reinterpret_cast<Gdiplus::ImageCodecInfo*>(memory.data());
    if (Gdiplus::GetImageEncoders(count, bytes, encoders) != Gdiplus::Ok) return false;
    const auto* const found = std::find_if(encoders, encoders + count, [](const auto& info) {
        return std::wcscmp(info.MimeType, L"image/png") == 0;
    });
    if (found == encoders + count) return false;
    encoder = found->Clsid;
    return true;
}

// What was written to the stream so far; empty after a failure.
std::vector<std::uint8_t> BytesOf(IStream& stream) {
    STATSTG status{};
    if (FAILED(stream.Stat(&status, STATFLAG_NONAME)) || FAILED(stream.Seek({}, STREAM_SEEK_SET, nullptr)))
        return {};
    std::vector<std::uint8_t> bytes(static_cast<std::size_t>(status.cbSize.QuadPart));
    ULONG read = 0;
    if (FAILED(stream.Read(bytes.data(), static_cast<ULONG>(bytes.size()), &read)) || read != bytes.size())
        return {};
    return bytes;
}

std::vector<std::uint8_t> Encode(Gdiplus::Image& image) {
    CLSID encoder;
    IStream* stream = nullptr;
    if (!FindPngEncoder(encoder) || FAILED(CreateStreamOnHGlobal(nullptr, TRUE, &stream))) return {};
    std::vector<std::uint8_t> png;
    if (image.Save(stream, &encoder, nullptr) == Gdiplus::Ok) png = BytesOf(*stream);
    stream->Release();
    return png;
}

}  // namespace

// 24 bits to a pixel: no alpha that could let the viewer's ground through.
struct Picture::Surface {
    Surface(int width, int height) : image(width, height, PixelFormat24bppRGB), graphics(&image) {}

    Gdiplus::Bitmap image;
    Gdiplus::Graphics graphics;
};

Picture::Picture(int width, int height, float dpi)
    : m_surface(width > 0 && height > 0 ? std::make_unique<Surface>(width, height) : nullptr),
      m_whole{0.0f, 0.0f, static_cast<float>(width), static_cast<float>(height)},
      m_dpi(dpi) {
    if (!m_surface || m_surface->graphics.Clear(Gdiplus::Color(255, 0, 0, 0)) != Gdiplus::Ok)
        throw UserError("no picture of " + std::to_string(width) + "x" + std::to_string(height) +
                        " pixels can be made");
}

Picture::~Picture() = default;

PictureDrawing::DrawTarget Picture::Target() { return {m_drawing, &m_surface->graphics, m_dpi}; }

std::vector<std::uint8_t> Picture::Png() {
    std::vector<std::uint8_t> png = Encode(m_surface->image);
    if (png.empty()) throw IoError("cannot make the PNG file");
    return png;
}

}  // namespace dsphost
