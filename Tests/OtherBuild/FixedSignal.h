#pragma once

#include <cstring>
#include <vector>

#include "OtherBuild/Recording.h"
#include "Support/Signals.h"

namespace OtherBuild {

// 440 Hz by recursion: multiplications and additions give the same bits everywhere, a library's sine does
// not.
template <typename Sample>
std::vector<Sample> FixedSignal() {
    constexpr double kTwiceCosine = 1.9966836332280566, kSine = 0.057564026959567284;
    std::vector<Sample> signal;
    double previous = -0.4 * kSine, current = 0.0;
    for (std::size_t i = 0; i < kToneFrames; ++i) {
        signal.push_back(static_cast<Sample>(current));
        signal.push_back(static_cast<Sample>(0.5 * current));
        const double next = kTwiceCosine * current - previous;
        previous = current;
        current = next;
    }
    const auto noise = TestSupport::Noise<Sample>(kNoiseFrames * kChannels);
    signal.insert(signal.end(), noise.begin(), noise.end());
    signal.resize(signal.size() + kSilentFrames * kChannels);
    return signal;
}

template <typename T>
std::vector<std::uint8_t> Bytes(const std::vector<T>& values) {
    std::vector<std::uint8_t> bytes(values.size() * sizeof(T));
    if (!bytes.empty()) std::memcpy(bytes.data(), values.data(), bytes.size());
    return bytes;
}

}  // namespace OtherBuild
