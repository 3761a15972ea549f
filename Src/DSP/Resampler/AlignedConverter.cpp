#include "DSP/Resampler/AlignedConverter.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <new>
#include <numeric>
#include <span>
#include <stdexcept>
#include <string>

namespace {

constexpr int kLowestRate = 1000, kHighestRate = 768000;
// Frames of silence that Finish hands over at once; all bytes of silence are 0 in every format.
constexpr int kSilentFrames = 64;
constexpr std::array<std::uint64_t, kSilentFrames * SamplingFrequencyConverter::kMaxChannels> kSilence{};

void Require(bool holds, const std::string& sentence) {
    if (!holds) throw std::invalid_argument(sentence);
}

int BytesOf(StoredSample sample) {
    constexpr int kBytes[]{2, 3, 4, 8};
    return kBytes[static_cast<int>(sample)];
}

// call(In{}) with the tag of the format.
template <typename Call>
int WithInput(StoredSample sample, Call call) {
    switch (sample) {
        case StoredSample::Int16:
            return call(tipo_16bit{});
        case StoredSample::Int24:
            return call(tipo_24bit{});
        case StoredSample::Float:
            return call(tipo_floatbit{});
        default:
            return call(tipo_doublebit{});
    }
}
template <typename Call>
int WithOutput(StoredSample sample, Call call) {
    switch (sample) {
        case StoredSample::Int16:
            return call(tipo_16bit_outd{});
        case StoredSample::Int24:
            return call(tipo_24bit_outd{});
        case StoredSample::Float:
            return call(tipo_floatbit_outd{});
        default:
            return call(tipo_doublebit_outd{});
    }
}

template <typename In, typename Out>
int Copy(const char* in, std::ptrdiff_t samples, int channels, char* out, CDither<double>* dither) {
    for (std::ptrdiff_t i = 0; i < samples; ++i)
        Out::Write(ApplyDither(dither[i % channels], In::Read(in + i * In::kBytes)), out + i * Out::kBytes);
    return static_cast<int>(samples / channels);
}

int DitherBits(const AlignedConverter::Settings& settings) {
    return settings.ditherBits ? settings.ditherBits : 8 * BytesOf(settings.out);
}

void Check(const AlignedConverter::Settings& settings) {
    for (const int rate : {settings.inRate, settings.outRate})
        Require(rate >= kLowestRate && rate <= kHighestRate,
                "a rate cannot be " + std::to_string(rate) + "; accepted: 1000 to 768000 Hz");
    Require(settings.channels >= 1 && settings.channels <= SamplingFrequencyConverter::kMaxChannels,
            "there cannot be " + std::to_string(settings.channels) + " channels; accepted: 1 to 48");
    for (const StoredSample sample : {settings.in, settings.out})
        Require(sample >= StoredSample::Int16 && sample <= StoredSample::Double,
                "there is no such sample format");
    Require(settings.dither >= DitherCurve::None && settings.dither <= DitherCurve::Strong,
            "there is no such dither");
    const int bits = DitherBits(settings);
    Require(settings.dither == DitherCurve::None || bits == 16 || bits == 24,
            "dither is for samples of 16 and 24 bits");
}

}  // namespace

AlignedConverter::AlignedConverter(const Settings& settings) : m_settings(settings) {
    Check(settings);
    std::ranges::fill(m_dither, MakeDither(settings.dither, DitherBits(settings)));
    if (settings.inRate == settings.outRate) return;
    const int common = std::gcd(settings.inRate, settings.outRate);
    const bool set = settings.exact ? m_core.InitConversionByFactors(settings.outRate / common,
                                                                     settings.inRate / common) != 0
                                    : m_core.InitConversion(settings.inRate, settings.outRate) != 0;
    if (!set) throw std::bad_alloc();
    m_core.Init(settings.channels);
    if (std::ranges::count(std::span(m_core.rings).first(static_cast<std::size_t>(settings.channels)),
                           nullptr) > 0) {
        m_core.FreeRings();
        throw std::bad_alloc();
    }
    m_up = m_core.up;
    m_down = m_core.down;
    // Outputs begin where the filter's delay ends, to the nearest step of the raised rate.
    const auto delay = static_cast<int>(std::lround(m_core.GroupDelay()));
    m_core.readPosition = delay % m_core.ringLength;
    m_core.readWraps = delay / m_core.ringLength;
}

AlignedConverter::~AlignedConverter() { m_core.FreeRings(); }

std::int64_t AlignedConverter::FramesOut(std::int64_t framesIn) const {
    return (2 * framesIn * m_up + m_down) / (2 * m_down);
}

std::int64_t AlignedConverter::MostFrames(std::int64_t frames) const {
    return std::max<std::int64_t>(frames, 0) * m_up / m_down + 1;
}

int AlignedConverter::Convert(const void* in, int frames, void* out) {
    if (frames < 1 || m_finished) return 0;
    m_taken += frames;
    return Limited(Store(in, frames, out));
}

int AlignedConverter::Finish(void* out, int frames) {
    // As much silence as gives no more than there is room for.
    const auto fitting = static_cast<int>(static_cast<std::int64_t>(frames - 1) * m_down / m_up);
    m_finished = true;
    if (frames < MostFrames(1)) return 0;
    while (m_given < FramesOut(m_taken))
        if (const int given = Limited(Store(kSilence.data(), std::clamp(fitting, 1, kSilentFrames), out)))
            return given;
    return 0;
}

int AlignedConverter::Store(const void* in, int frames, void* out) {
    const auto* from = static_cast<const char*>(in);
    auto* const to = static_cast<char*>(out);
    const int channels = m_settings.channels;
    return WithInput(m_settings.in, [&]<typename In>(In) {
        return WithOutput(m_settings.out, [&]<typename Out>(Out) {
            if (m_up == m_down)
                return Copy<In, Out>(from, static_cast<std::ptrdiff_t>(frames) * channels, channels, to,
                                     m_dither);
            return m_core.sfreq_conversion_core_block<In, Out>(
                frames, const_cast<char*>(from), to, channels, channels * In::kBytes, channels * Out::kBytes,
                m_settings.dither == DitherCurve::None ? nullptr : m_dither);
        });
    });
}

int AlignedConverter::Limited(int written) {
    const std::int64_t owed = FramesOut(m_taken) - m_given;
    const auto given = static_cast<int>(std::min<std::int64_t>(written, owed));
    m_given += given;
    return given;
}
