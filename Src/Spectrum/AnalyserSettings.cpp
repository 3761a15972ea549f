#include "Spectrum/AnalyserSettings.h"

#include <algorithm>

namespace Corvo {

CriticalSection& AnalyserLock() {
    static CriticalSection lock;
    return lock;
}

void StoreOverlap(SpectrumSettings& settings, float overlap) {
    constexpr float kLargest = 0.99f;
    constexpr double kLongestHop = 1 << 30;
    // Written so that an overlap which is not a number is stored as the largest, too.
    const double used = overlap < kLargest ? overlap : kLargest;
    settings.overlap = overlap < 1.0f ? overlap : kLargest;
    const double hop = (1.0 - used) * settings.window_length;
    settings.hop_length = hop > -kLongestHop ? static_cast<std::int32_t>(std::min(hop, kLongestHop)) : -1;
}

void StoreWindowLength(SpectrumSettings& settings, int length) {
    settings.window_length = length;
    if (settings.overlap >= 0.0f) StoreOverlap(settings, settings.overlap);
}

void FitTransform(SpectrumSettings& settings) {
    settings.fft_length = settings.fft_length_auto ? settings.window_length
                                                   : std::max(settings.window_length, settings.fft_length);
}

}  // namespace Corvo
