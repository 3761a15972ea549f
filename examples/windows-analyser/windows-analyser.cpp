// The analyser in a plain window with Direct2D, fed from a WAV file (16 bits), as if it were played.
//     windows-analyser.exe FILE.wav [PICTURE.bmp]    with a picture: writes the file's last one and ends
// The right button opens the analyser's menu; the keys 1 to 4 choose the view.
#include <algorithm>
#include <cstdint>
#include <cstring>
#include <fstream>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include "Drawing/Backends/DrawingD2D.h"
#include "Drawing/Backends/WindowDpi.h"
#include "Spectrum/AnalyserMenu.h"
#include "Spectrum/kivspectrum.h"

#include <windows.h>

#include <d2d1.h>
#include <wincodec.h>
#include <windowsx.h>
#include <wrl/client.h>

using Microsoft::WRL::ComPtr;

namespace {
struct Wave {
    int rate = 0, channels = 0, bits = 0;
    std::vector<float> samples;  // interleaved
};
// Chunk by chunk; without samples for what is no WAV file with 16 bits.
Wave ReadWave(const char* path) {
    std::ifstream file(path, std::ios::binary);
    const std::string bytes((std::istreambuf_iterator<char>(file)), {});
    const auto number = [&](std::size_t at, auto value) {
        std::memcpy(&value, bytes.data() + at, sizeof value);
        return value;
    };
    Wave wave;
    for (std::size_t at = 12; bytes.starts_with("RIFF") && at + 8 <= bytes.size();) {
        const std::size_t length = number(at + 4, std::uint32_t{}), from = at + 8;
        const std::size_t end = from + std::min(length, bytes.size() - from);
        if (bytes.compare(at, 4, "fmt ") == 0 && end - from >= 16)
            wave = {number(from + 4, 0), number(from + 2, short{}), number(from + 14, short{}), {}};
        for (std::size_t i = from; bytes.compare(at, 4, "data") == 0 && i + 2 <= end; i += 2)
            wave.samples.push_back(static_cast<float>(number(i, std::int16_t{})) / 32768.0f);
        at = end + length % 2;
    }
    return wave.bits == 16 && wave.rate > 0 && wave.channels > 0 ? wave : Wave{};
}
// The back-end belongs to the target.
void Draw(kivspectrum& analyser, Corvo::DrawingD2D& drawing, ID2D1RenderTarget& target, float dpi) {
    const D2D1_SIZE_U size = target.GetPixelSize();
    Corvo::DrawingD2D::DrawTarget to(drawing, dpi);
    analyser.DoDraw<Corvo::DrawingD2D>(
        to, {0.0f, 0.0f, static_cast<float>(size.width), static_cast<float>(size.height)});
}

void SavePicture(kivspectrum& analyser, ID2D1Factory& factory, const std::string& path, UINT width,
                 UINT height) {
    ComPtr<IWICImagingFactory> imaging;
    ComPtr<IWICBitmap> image;
    ComPtr<ID2D1RenderTarget> target;
    const D2D1_RENDER_TARGET_PROPERTIES properties{};
    const auto must = [](HRESULT result) {
        FAILED(result) ? throw std::runtime_error("no picture") : void();
    };
    must(CoCreateInstance(CLSID_WICImagingFactory, nullptr, CLSCTX_INPROC_SERVER, IID_PPV_ARGS(&imaging)));
    must(imaging->CreateBitmap(width, height, GUID_WICPixelFormat32bppPBGRA, WICBitmapCacheOnLoad, &image));
    must(factory.CreateWicBitmapRenderTarget(image.Get(), &properties, &target));
    Corvo::DrawingD2D drawing(target.Get());
    target->BeginDraw();
    Draw(analyser, drawing, *target.Get(), 96.0f);
    must(target->EndDraw());
    std::vector<BYTE> pixels(std::size_t{4} * width * height);
    must(image->CopyPixels(nullptr, 4 * width, static_cast<UINT>(pixels.size()), pixels.data()));
    constexpr DWORD kHeaders = sizeof(BITMAPFILEHEADER) + sizeof(BITMAPINFOHEADER);
    const BITMAPFILEHEADER header{0x4D42, kHeaders + static_cast<DWORD>(pixels.size()), 0, 0, kHeaders};
    const BITMAPINFOHEADER info{
        sizeof info, static_cast<LONG>(width), -static_cast<LONG>(height), 1, 32, 0, 0, 0, 0, 0, 0};
    std::ofstream file(path, std::ios::binary);
    file.write(reinterpret_cast<const char*>(&header), sizeof header);
    file.write(reinterpret_cast<const char*>(&info), sizeof info);
    file.write(reinterpret_cast<const char*>(pixels.data()), static_cast<std::streamsize>(pixels.size()));
}

struct Window {
    Wave wave;
    int played = 0;  // samples
    kivspectrum analyser;
    ComPtr<ID2D1Factory> factory;
    ComPtr<ID2D1HwndRenderTarget> target;
    std::unique_ptr<Corvo::DrawingD2D> drawing;

    // A thirtieth of a second. False at the end of the file.
    bool Step() {
        const int left = static_cast<int>(wave.samples.size()) - played;
        const int frames = std::min(wave.rate / 30, left / wave.channels);
        if (frames == 0) return false;
        analyser.Feed(wave.samples.data() + played, frames, wave.channels, wave.channels);
        played += frames * wave.channels;
        analyser.Refresh();
        return true;
    }
    void Paint(HWND window) {
        RECT client;
        GetClientRect(window, &client);
        const D2D1_SIZE_U size{static_cast<UINT32>(client.right), static_cast<UINT32>(client.bottom)};
        if (!target) {
            drawing.reset();
            const D2D1_RENDER_TARGET_PROPERTIES properties{};
            const D2D1_HWND_RENDER_TARGET_PROPERTIES mine{window, size, D2D1_PRESENT_OPTIONS_NONE};
            if (FAILED(factory->CreateHwndRenderTarget(&properties, &mine, &target))) return;
            drawing = std::make_unique<Corvo::DrawingD2D>(target.Get());
        }
        target->Resize(&size);
        target->BeginDraw();
        Draw(analyser, *drawing, *target.Get(), static_cast<float>(Corvo::DpiOfWindow(window)));
        if (target->EndDraw() == static_cast<HRESULT>(D2DERR_RECREATE_TARGET)) target.Reset();
    }
    void ShowMenu(HWND window, LPARAM where) {
        POINT place{GET_X_LPARAM(where), GET_Y_LPARAM(where)};
        if (where == -1) ClientToScreen(window, &(place = {}));  // the keyboard's
        const HMENU menu = CreatePopupMenu();
        HMENU group = nullptr;
        const char* name = "";
        for (const Corvo::AnalyserMenuEntry& entry : Corvo::AnalyserMenu()) {
            if (std::strcmp(name, entry.group) != 0) {
                group = CreatePopupMenu();
                AppendMenuA(menu, MF_POPUP, reinterpret_cast<UINT_PTR>(group), name = entry.group);
            }
            const UINT tick = analyser.popupmenu_checked(entry.command) ? MF_CHECKED : MF_UNCHECKED;
            AppendMenuA(group, MF_STRING | tick, static_cast<UINT_PTR>(entry.command), entry.text);
        }
        constexpr UINT kHow = TPM_RETURNCMD | TPM_RIGHTBUTTON;
        analyser.popupmenu_process(TrackPopupMenu(menu, kHow, place.x, place.y, 0, window, nullptr));
        DestroyMenu(menu);
    }
};

LRESULT CALLBACK Handle(HWND window, UINT message, WPARAM first, LPARAM second) {
    auto* const self = reinterpret_cast<Window*>(GetWindowLongPtrA(window, GWLP_USERDATA));
    switch (self ? message : WM_NULL) {
        case WM_TIMER:
            return self->Step() ? InvalidateRect(window, nullptr, FALSE), 0 : 0;
        case WM_PAINT:
            self->Paint(window);
            return ValidateRect(window, nullptr), 0;
        case WM_MOUSEMOVE:
            return self->analyser.SetPointer(1.0f * GET_X_LPARAM(second), 1.0f * GET_Y_LPARAM(second)), 0;
        case WM_CONTEXTMENU:
            return self->ShowMenu(window, second), 0;
        case WM_CHAR:
            for (int i = 0; first >= '1' && first <= '4' && i < 3; ++i)
                if (self->analyser.GetDisplayMode() != static_cast<int>(first - '1'))
                    self->analyser.ToggleDisplayMode();
            return 0;
        case WM_DESTROY:
            return PostQuitMessage(0), 0;
    }
    return DefWindowProcA(window, message, first, second);
}

}  // namespace
int main(int argc, char** argv) {
    Window self;
    if (argc > 1) self.wave = ReadWave(argv[1]);
    if (self.wave.samples.empty())
        return MessageBoxA(nullptr, "windows-analyser FILE.wav (16 bits)", "Analyser", MB_OK), 2;
    CoInitializeEx(nullptr, COINIT_APARTMENTTHREADED);
    D2D1CreateFactory(D2D1_FACTORY_TYPE_SINGLE_THREADED, IID_PPV_ARGS(&self.factory));
    self.analyser.set_parameters(self.wave.rate);
    self.analyser.SetOn(true);
    self.analyser.SetTunerOn(true);
    constexpr int kLargestOverlap = 1267;  // of windows, so that every refresh has a new spectrum
    self.analyser.popupmenu_process(kLargestOverlap);
    self.analyser.ShowSonogram(true);
    WNDCLASSA kind{};
    kind.lpfnWndProc = Handle;
    kind.lpszClassName = "Analyser";
    kind.hCursor = LoadCursor(nullptr, IDC_ARROW);
    RegisterClassA(&kind);
    const HWND window = CreateWindowA("Analyser", "Analyser", WS_OVERLAPPEDWINDOW | WS_VISIBLE, CW_USEDEFAULT,
                                      CW_USEDEFAULT, 1000, 700, nullptr, nullptr, nullptr, nullptr);
    if (!window) return 1;
    SetWindowLongPtrA(window, GWLP_USERDATA, reinterpret_cast<LONG_PTR>(&self));
    if (argc > 2) {
        self.Paint(window);  // sizes the sonogram
        while (self.Step()) continue;
        self.Paint(window);
        if (!self.target) return 1;  // nothing came into the window
        SavePicture(self.analyser, *self.factory.Get(), argv[2], 984, 661);
        return 0;
    }
    SetTimer(window, 1, 33, nullptr);
    for (MSG message; GetMessageA(&message, nullptr, 0, 0) > 0; DispatchMessageA(&message))
        TranslateMessage(&message);
}
