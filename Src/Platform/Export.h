#pragma once

// DSP_API marks what the library exports; everything else stays inside it. A program made of the library's
// own objects instead of the DLL defines DSPDLL_STATIC.
#if !defined(_WIN32)
#define DSP_API __attribute__((visibility("default")))
#elif defined(DSPDLL_BUILDING)
#define DSP_API __declspec(dllexport)
#elif defined(DSPDLL_STATIC)
#define DSP_API
#else
#define DSP_API __declspec(dllimport)
#endif
