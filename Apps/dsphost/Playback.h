#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "AudioReader.h"
#include "File.h"
#include "Progress.h"
#include "Spectrum/kivspectrum.h"

namespace dsphost {

constexpr int kRefreshesPerSecond = 30;
constexpr int kMostChannels = 64;
// A new spectrum at every refresh, from 5 kHz on.
constexpr float kDisplayOverlap = 0.98f;

// Lets the tuner hear as low at every rate as its shortest window does at 48 kHz.
inline void UseTunerWindow(int rate) {
    constexpr int kShortest = 8192, kRate = 48000, kLongest = 524288;
    int window = kShortest;
    while (window < kLongest &&
           static_cast<std::int64_t>(window) * kRate < static_cast<std::int64_t>(kShortest) * rate)
        window *= 2;
    kivspectrum::settings.window_length = window;
}

// Plays a file to an analyser as a host would, without waiting: feeds what falls between two refreshes of the
// display, then calls each(seconds), the time in the file that the middle of the newest window stands at;
// what lies before the file is left out. With `toTheEnd` half a window of silence follows, so that the file's
// end comes to stand there, too.
template <typename Each>
void PlayThrough(AudioReader& input, kivspectrum& analyser, const std::string& what, bool quiet,
                 bool toTheEnd, Each each) {
    const int rate = input.Rate(), channels = input.Channels();
    std::vector<double> samples(static_cast<std::size_t>((rate / kRefreshesPerSecond + 1) * channels));
    Progress progress(what, rate, input.Frames(), quiet);
    const int half = kivspectrum::settings.window_length / 2;
    std::int64_t played = 0, end = 0;
    bool ended = false;
    for (std::int64_t refresh = 1; !ended || played < end; ++refresh) {
        const auto wanted = static_cast<int>(refresh * rate / kRefreshesPerSecond - played);
        const int got = ended ? 0 : input.Read(samples.data(), wanted);
        if (!ended && got < wanted) {
            ended = true;
            end = played + got + (toTheEnd ? half : 0);
        }
        std::fill(samples.begin() + static_cast<std::ptrdiff_t>(got) * channels, samples.end(), 0.0);
        analyser.Feed(samples.data(), wanted, channels, channels);
        played += wanted;
        if (played >= half) each(static_cast<double>(played - half) / rate);
        if (!ended) progress.Update(played);
    }
}

}  // namespace dsphost
