#include "Drawing/Backends/WindowDpi.h"

namespace Corvo {
namespace {

constexpr int kUsualDpi = 96;

// shcore.dll's, there since Windows 8.1.
using GetDpiForMonitorType = HRESULT(WINAPI*)(HMONITOR, int kind, UINT* x, UINT* y);

GetDpiForMonitorType FindGetDpiForMonitor() {
    // From the system's folder: by name alone it could be another one, from where the program stands.
    const HMODULE library = LoadLibraryExW(L"shcore.dll", nullptr, LOAD_LIBRARY_SEARCH_SYSTEM32);
    if (!library) return nullptr;
    // By way of void*: the compiler takes a cast between two types of function for a mistake.
    return reinterpret_cast<GetDpiForMonitorType>(
        reinterpret_cast<void*>(GetProcAddress(library, "GetDpiForMonitor")));
}

int DpiOfMonitor(HWND window) {
    static const GetDpiForMonitorType getDpiForMonitor = FindGetDpiForMonitor();
    if (!getDpiForMonitor) return 0;
    constexpr int kEffective = 0;  // with the user's own scaling
    UINT x = 0, y = 0;
    const HMONITOR monitor = MonitorFromWindow(window, MONITOR_DEFAULTTONEAREST);
    return SUCCEEDED(getDpiForMonitor(monitor, kEffective, &x, &y)) ? static_cast<int>(x) : 0;
}

int DpiOfDevice(HWND window) {
    const HDC device = GetDC(window);
    if (!device) return 0;
    const int dpi = GetDeviceCaps(device, LOGPIXELSX);
    ReleaseDC(window, device);
    return dpi;
}

}  // namespace

int DpiOfWindow(HWND window) {
    if (!IsWindow(window)) return kUsualDpi;
    if (const int dpi = DpiOfMonitor(window); dpi > 0) return dpi;
    const int dpi = DpiOfDevice(window);
    return dpi > 0 ? dpi : kUsualDpi;
}

}  // namespace Corvo
