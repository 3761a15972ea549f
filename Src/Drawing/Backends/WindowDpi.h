#pragma once

#include "Platform/Export.h"
#include "Platform/WindowsHeader.h"

namespace Corvo {

// Pixels per inch of the monitor that shows most of the window: what a DrawTarget on it takes. The system
// answers 96 to a program that has not declared itself aware of other values. Where the system knows of one
// value only (before Windows 8.1), that; for no window, 96. Any thread.
DSP_API int DpiOfWindow(HWND window);

}  // namespace Corvo
