#include "DSP/Equalizer/ParEQ.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <optional>
#include <span>

#include "DSP/Equalizer/EqCascade.h"
#include "Plain/PlainParEQ.h"
#include "Platform/DenormalGuard.h"
#include "Spectrum/kivspectrum.h"
#include "Support/Signals.h"

namespace {

using namespace Corvo::DSP;
using TestSupport::Noise;
using TestSupport::Random;

builtin_effects_data Bands(std::initializer_list<_eq_data> bands) {
    builtin_effects_data data;
    data.numBands = 0;
    for (const auto& band : bands) data.bands[static_cast<std::size_t>(data.numBands++)] = band;
    return data;
}

_eq_data RandomBand(Random& random) {
    _eq_data band;
    band.type = random.Below(8) | (random.Below(6) == 0 ? _eq_data::kBypassBand : 0);
    band.freq = 1 + static_cast<int>(std::exp2(random.Unit() * 15.0));
    band.boost = random.Below(5) == 0 ? 0 : random.Below(300) - 150;
    // A pass filter of next to nothing: from one to another its coefficients have no way to go.
    if (band.type % 4 == 0 && random.Below(2)) band.boost = -3000 - random.Below(20);
    band.Q = 10 + random.Below(140);
    return band;
}

// A session of edits, glides and blocks of every length, in step with the plain form.
template <typename Sample>
void CompareWithPlain(int channels, int bands, std::uint64_t seed) {
    const Corvo::DenormalGuard guard;
    Random random(seed);
    const int rate = random.Below(2) ? 48000 : 8000;
    std::vector<builtin_effects_data> records(static_cast<std::size_t>(channels));
    auto& data = records[0];
    data.numBands = bands;
    for (auto& band : data.bands) band = RandomBand(random);
    ParEQ eq;
    Plain::ParEQ<> plain(channels);
    eq.Cook(false, false, &data, rate, channels);
    plain.Cook(false, false, data, rate);
    for (int block = 0; block < 60; ++block) {
        if (random.Below(3) == 0) {
            data.bands[static_cast<std::size_t>(random.Below(20))] = RandomBand(random);
            const bool smooth = random.Below(8) != 0, bypassAll = random.Below(15) == 0;
            eq.Cook(smooth, bypassAll, &data, rate, channels);
            plain.Cook(smooth, bypassAll, data, rate);
        }
        if (random.Below(10) == 0) {
            eq.ResetProcessing();
            plain.counter = 0;
        }
        for (auto& record : records) record.SetPhaseShift(random.Below(2) == 0);
        const int frames = random.Below(4) == 0 ? random.Below(1500) : random.Below(40);
        auto samples = Noise<Sample>(static_cast<std::size_t>(frames * channels), 0.25, seed + 1);
        auto expected = samples;
        if (random.Below(5) == 0) {
            const int channel = random.Below(channels), stride = 1 + random.Below(channels + 2);
            const int fit = frames * channels / stride;
            eq.ProcessSingle(samples.data(), fit, stride, false, channel, records.data());
            plain.ProcessSingle(expected.data(), fit, stride, channel, records.data());
        } else {
            eq.Process(samples.data(), frames, channels, false, records.data());
            plain.Process(expected.data(), frames, channels, records.data());
        }
        ASSERT_TRUE(std::ranges::equal(std::as_bytes(std::span(samples)), std::as_bytes(std::span(expected))))
            << channels << " channels, " << bands << " bands, block " << block << ", seed " << seed;
    }
}

TEST(ParEQ, EqualsThePlainFormToTheBitWithEveryKernel) {
    for (const bool wide : {false, true}) {
        MayUseWideEqKernels() = wide;
        for (const int channels : {1, 2, 3, 4})
            for (const int bands : {0, 1, 2, 3, 4, 5, 7, 8, 13, 20}) {
                const auto seed = static_cast<std::uint64_t>(100 * channels + bands);
                CompareWithPlain<float>(channels, bands, seed);
                CompareWithPlain<double>(channels, bands, seed);
                if (HasFailure()) break;
            }
    }
}

TEST(ParEQ, StaysBoundedWhateverTheRecordSays) {
    constexpr int kMost = std::numeric_limits<int>::max();
    for (int type = 0; type < 8; ++type)
        for (const int freq : {-5, 1, 3999, 4000, 22050, kMost})
            for (const int Q : {-kMost, 0, 1, kMost})
                for (const int rate : {8000, 44100, 0}) {
                    auto data = Bands({{type, freq, 240, Q}});
                    ParEQ eq;
                    eq.Cook(false, false, &data, rate, 1);
                    auto samples = Noise<double>(100);
                    eq.Process(samples.data(), 100, 1, false, &data);
                    for (const double sample : samples)
                        ASSERT_LT(std::abs(sample), 1e4) << type << ' ' << freq << ' ' << Q << ' ' << rate;
                }
}

class Peaks : public testing::Test {
protected:
    builtin_effects_data m_data = Bands({{EQ_PEAK, 1000, 60, 200}});
    std::vector<builtin_effects_data> m_records{8, m_data};  // of as many channels
    ParEQ m_eq;
};

TEST_F(Peaks, TouchNothingButTheirChannel) {
    m_data.SetEqBoost(0, 0);
    for (auto& record : m_records) record.SetPhaseShift(true);
    m_eq.Cook(false, false, &m_data, 48000, 6);
    // The samples that may change, of a buffer of 8 frames.
    constexpr int kCases[][5] = {{4, 2, 1, 1, 4}, {4, 1, 3, 0, 4}, {4, 0, 3, 0, 0}, {4, 2, -1, 0, 0}};
    for (const auto& [frames, stride, channel, first, count] : kCases) {
        std::vector<float> samples(16, 1.0f), expected = samples;
        for (int i = 0; i < count; ++i) expected[static_cast<std::size_t>(first + i * stride)] = -1.0f;
        m_eq.ProcessSingle(samples.data(), frames, stride, true, channel, m_records.data());
        EXPECT_EQ(samples, expected) << "stride " << stride << ", channel " << channel;
    }
}

// Each channel's analyser gets that channel's result.
TEST_F(Peaks, FeedTheAnalysersWithTheResult) {
    m_eq.Cook(false, false, &m_data, 48000, 3);
    EXPECT_NEAR(m_eq.GetResponse(0, 1000.0, 48000, m_records.data()).real(), 1.995, 0.001);
    m_records[1].SetPhaseShift(true);
    EXPECT_NEAR(m_eq.GetResponse(1, 1000.0, 48000, m_records.data()).real(), -1.995, 0.001);
    auto samples = Noise<float>(3 * 2000);
    m_eq.Process(samples.data(), 2000, 3, true, m_records.data());
    for (std::size_t c = 0; c < 3; ++c) {
        const auto& captured = m_eq.GetSpectrum(static_cast<int>(c))->GetBufferInputPoints();
        for (std::size_t i = 0; i < 2000; ++i)
            ASSERT_EQ(captured.end()[-1 - static_cast<int>(i)], samples[3 * (1999 - i) + c]) << i;
    }
}

// Catches double frees and leaks (with the address sanitizer).
TEST_F(Peaks, CopiesMayGoInAnyOrder) {
    const auto use = [&](ParEQ& eq) {
        std::vector<double> samples(64, 0.5);
        eq.Process(samples.data(), 32, 2, false, m_records.data());
        return samples.back();
    };
    for (int order = 0; order < 6; ++order) {
        std::optional<ParEQ> source(std::in_place), copy, assigned(std::in_place);
        for (auto* eq : {&source, &assigned}) (*eq)->Cook(false, false, &m_data, 48000, 2);
        copy = source;
        *assigned = *source;
        EXPECT_NE(use(*copy), 0.5) << "shares the channels";
        if (order & 1) source.reset();
        copy->AfterCloneInit();
        EXPECT_EQ(use(*copy), 0.5) << "no channels, nothing happens";
        if (order & 2) assigned.reset();
        if (order & 4) copy.reset();
        for (auto* eq : {&source, &copy, &assigned})
            if (*eq) use(**eq);
    }
}

}  // namespace
