#pragma once

#include <cstddef>

namespace Corvo::Plugins {

// Between a host's buffers and an effect's: samples that are not finite become 0. Buffers are the same or
// apart.
void CopyFinite(const float* from, float* to, std::size_t count);
void Interleave(const float* left, const float* right, float* both, std::size_t frames);
void Separate(const float* both, float* left, float* right, std::size_t frames);

}  // namespace Corvo::Plugins
