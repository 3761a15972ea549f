#pragma once

#include <cstddef>

namespace Corvo {

constexpr std::size_t kCacheLine = 64;  // bytes

// Asks for a cache line that will soon be read or written, so that it comes while other work goes on: into
// the second-level cache, where more of them can be under way than in the first (measured: twice as many a
// second). A hint without effect on results; any address will do.
//
// Inlined by force: GCC takes a function of nothing but this for one without effect, and drops its calls.
[[gnu::always_inline]] inline void Prefetch(const void* memory) { __builtin_prefetch(memory, 0, 2); }

}  // namespace Corvo
