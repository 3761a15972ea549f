#pragma once

namespace Corvo {

// True where the processor and the operating system run AVX2 instructions.
inline bool HasAvx2() { return __builtin_cpu_supports("avx2") != 0; }

}  // namespace Corvo
