#pragma once

#include <algorithm>

namespace Corvo {

constexpr int kMaxTransform = 524288;
constexpr int kMaxFilterSpectra = 64;

// What buffers are sized for, whatever the settings hold.
constexpr int BufferLength(int length) { return std::clamp(length, 0, kMaxTransform); }

}  // namespace Corvo
