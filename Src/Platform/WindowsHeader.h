#pragma once

// <windows.h> without its min and max macros; included only when building for Windows.
#if defined(_WIN32)
#ifndef NOMINMAX
#define NOMINMAX
#endif
#include <windows.h>
#endif
