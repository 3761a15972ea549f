#pragma once

namespace Corvo {

// True where the wide kernels run and pay: in a 64-bit program, where processor and operating system have
// AVX2. A 32-bit program can clean half of the wide registers only; once it has used them, SSE code, ours and
// the host's, takes two to four times as long from then on (measured on a processor of the Zen 4 family).
// DSP_BASELINE_ONLY makes a build to measure the other kernels with. A constant where they never run, so that
// they need not be linked.
#if defined(__x86_64__) && !defined(DSP_BASELINE_ONLY)
inline bool HasAvx2() { return __builtin_cpu_supports("avx2") != 0; }
#else
constexpr bool HasAvx2() { return false; }
#endif

}  // namespace Corvo
