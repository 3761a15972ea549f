#pragma once

// DSP_API marks what the library exports; everything else stays inside it.
#if defined(_WIN32)
#if defined(DSPDLL_BUILDING)
#define DSP_API __declspec(dllexport)
#else
#define DSP_API __declspec(dllimport)
#endif
#else
#define DSP_API __attribute__((visibility("default")))
#endif
