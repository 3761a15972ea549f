#pragma once

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstddef>
#include <cstdint>
#include <numbers>
#include <vector>

#include "Platform/WaveFormat.h"

namespace TestSupport {

// The format of a block of float or double samples.
template <typename Sample>
tWAVEFORMATEX Format(int channels = 2, int rate = 48000) {
    tWAVEFORMATEX format{};
    format.wFormatTag = 3;
    format.nChannels = static_cast<std::uint16_t>(channels);
    format.nSamplesPerSec = static_cast<std::uint32_t>(rate);
    format.wBitsPerSample = static_cast<std::uint16_t>(8 * sizeof(Sample));
    format.nBlockAlign = static_cast<std::uint16_t>(sizeof(Sample) * static_cast<std::size_t>(channels));
    format.nAvgBytesPerSec = format.nSamplesPerSec * format.nBlockAlign;
    return format;
}

// The same random numbers on every machine and in every run of one seed.
class Random {
public:
    explicit Random(std::uint64_t seed = 1) : m_state(seed * 0x9E3779B97F4A7C15u + 1) {}
    std::uint32_t Next() {
        m_state ^= m_state << 13;
        m_state ^= m_state >> 7;
        m_state ^= m_state << 17;
        return static_cast<std::uint32_t>(m_state >> 32);
    }
    // 0..1, 1 excluded.
    double Unit() { return Next() * (1.0 / 4294967296.0); }
    int Below(int limit) { return static_cast<int>(Unit() * limit); }

private:
    std::uint64_t m_state;
};

inline bool AllFinite(const auto& samples) {
    return std::ranges::all_of(samples, [](auto sample) { return std::isfinite(sample); });
}

// check(0.0f) and check(0.0).
void ForBothSamples(const auto& check) {
    check(0.0f);
    check(0.0);
}

// `count` samples in -amplitude..amplitude.
template <typename Sample>
std::vector<Sample> Noise(std::size_t count, double amplitude = 0.25, std::uint64_t seed = 1) {
    Random random(seed);
    std::vector<Sample> noise(count);
    for (auto& sample : noise) sample = static_cast<Sample>((2.0 * random.Unit() - 1.0) * amplitude);
    return noise;
}

// The same sine on every channel, interleaved.
template <typename Sample>
std::vector<Sample> Sine(std::size_t frames, double hz, int rate = 48000, double amplitude = 0.5,
                         int channels = 1) {
    std::vector<Sample> sine;
    sine.reserve(frames * static_cast<std::size_t>(channels));
    for (std::size_t i = 0; i < frames; ++i)
        sine.insert(sine.end(), static_cast<std::size_t>(channels),
                    static_cast<Sample>(
                        amplitude * std::sin(2.0 * std::numbers::pi * hz * static_cast<double>(i) / rate)));
    return sine;
}

// The mean power from one second to another, in decibels.
template <typename Sample>
double Level(const std::vector<Sample>& mono, double from, double to, int rate = 48000) {
    double sum = 0.0;
    const auto first = static_cast<std::size_t>(from * rate), last = static_cast<std::size_t>(to * rate);
    for (std::size_t i = first; i < last; ++i)
        sum += static_cast<double>(mono.at(i)) * static_cast<double>(mono[i]);
    return 10.0 * std::log10(sum / static_cast<double>(last - first) + 1e-30);
}

template <typename Sample>
std::vector<Sample> Mixed(std::vector<Sample> a, const std::vector<Sample>& b, double gain = 1.0) {
    for (std::size_t i = 0; i < a.size(); ++i) a[i] += static_cast<Sample>(gain) * b.at(i);
    return a;
}

// One of the channels of an interleaved block.
template <typename Sample>
std::vector<Sample> Channel(const std::vector<Sample>& interleaved, std::size_t channel,
                            std::size_t count = 2) {
    std::vector<Sample> samples;
    for (std::size_t i = channel; i < interleaved.size(); i += count) samples.push_back(interleaved[i]);
    return samples;
}

// What samples have of one frequency, given in turns a sample, by the transform's definition.
std::complex<double> TransformAt(const auto& samples, double turns) {
    const auto step = std::polar(1.0, -2.0 * std::numbers::pi * turns);
    std::complex<double> sum = 0.0;
    for (std::size_t i = samples.size(); i-- > 0;) sum = sum * step + static_cast<double>(samples[i]);
    return sum;
}

}  // namespace TestSupport
