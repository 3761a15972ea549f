#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "AudioReader.h"
#include "File.h"
#include "Progress.h"
#include "Spectrum/kivspectrum.h"

namespace dsphost {

constexpr int kRefreshesPerSecond = 30;

// Plays a file to an analyser as a host would, without waiting: feeds what falls between two refreshes of the
// display, then calls each(seconds played). Ends with the refresh that takes the last samples.
template <typename Each>
void PlayThrough(AudioReader& input, kivspectrum& analyser, const std::string& what, bool quiet, Each each) {
    const int rate = input.Rate(), channels = input.Channels();
    std::vector<double> samples(static_cast<std::size_t>((rate / kRefreshesPerSecond + 1) * channels));
    Progress progress(what, rate, input.Frames(), quiet);
    std::int64_t played = 0;
    for (std::int64_t refresh = 1;; ++refresh) {
        CheckInterrupted();
        const auto wanted = static_cast<int>(refresh * rate / kRefreshesPerSecond - played);
        const int got = input.Read(samples.data(), wanted);
        if (got == 0) return;
        analyser.Feed(samples.data(), got, channels, channels);
        played += got;
        each(static_cast<double>(played) / rate);
        progress.Update(played);
        if (got < wanted) return;
    }
}

}  // namespace dsphost
