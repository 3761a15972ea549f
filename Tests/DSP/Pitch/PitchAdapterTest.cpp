#include "DSP/Pitch/PitchAdapter.h"

#include <SoundTouch.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <memory>

#include "Plain/PlainClassicPitch.h"
#include "Support/Signals.h"

using namespace Corvo::DSP;
using namespace TestSupport;

namespace {

enum { kClassic, kNew };

std::unique_ptr<PitchAdapter> Make(int index, int channels = 2, float factor = 1.0f, int quality = 4) {
    std::unique_ptr<PitchAdapter> adapter(PitchAdapter::CreateAdapter(index));
    adapter->SetChannelsNum(channels);
    adapter->SetSampleRate(48000);
    for (int channel = 0; channel < channels; ++channel) adapter->SetPitchFactor(channel, factor);
    adapter->SetFFTSize(2);
    adapter->SetQuality(quality);
    adapter->CookFactors();
    return adapter;
}

// One channel through the path without padding: as many frames as went in.
template <typename Sample>
std::vector<Sample> Offline(PitchAdapter& adapter, const std::vector<Sample>& input, int block) {
    std::vector<Sample> output, buffer;
    const int frames = static_cast<int>(input.size());
    for (int done = 0; done < frames; done += block) {
        const int count = std::min(frames - done, block);
        buffer.assign(input.begin() + done, input.begin() + done + count);
        const int got = adapter.ProcessInPlaceNoPadding(buffer.data(), count);
        output.insert(output.end(), buffer.begin(), buffer.begin() + got);
    }
    adapter.Flush();
    for (int count; (count = std::min(adapter.GetNumSamplesAvailable(), block)) > 0;) {
        buffer.assign(static_cast<std::size_t>(count), Sample(9));
        adapter.ReceiveSamples(buffer.data(), count);
        output.insert(output.end(), buffer.begin(), buffer.end());
    }
    return output;
}

// Frequency of a steady tone, from the rising zero crossings of a stretch in the middle.
double Frequency(const std::vector<float>& samples) {
    double first = 0.0, last = 0.0;
    int count = -1;
    for (std::size_t i = samples.size() / 4; i < samples.size() * 3 / 4; ++i)
        if (samples[i - 1] < 0.0f && samples[i] >= 0.0f) {
            last = static_cast<double>(i) - samples[i] / (samples[i] - samples[i - 1]);
            if (++count == 0) first = last;
        }
    return count * 48000 / (last - first);
}

}  // namespace

// Catches an engine configured otherwise than each quality says, or driven in another order.
TEST(PitchAdapterNew, IsTheEngineAsConfigured) {
    for (int quality = 0; quality <= 9; ++quality) {
        soundtouch::SoundTouch engine;
        engine.setChannels(2);
        engine.setSampleRate(48000);
        engine.setPitch(1.25f);
        engine.setSetting(SETTING_USE_AA_FILTER, quality >= 3 ? 1 : 0);
        engine.setSetting(SETTING_AA_FILTER_LENGTH, quality <= 4 ? 32 : quality == 5 ? 64 : 128);
        engine.setSetting(SETTING_USE_QUICKSEEK, quality < 4 ? 1 : 0);
        const auto adapter = Make(kNew, 2, 1.25f, quality);
        for (std::uint64_t i = 1; i <= 40; ++i) {
            auto block = Noise<float>(2 * 512, 0.25, i);
            std::vector<float> expected(block.size());
            engine.putSamples(block.data(), 512);
            if (engine.numSamples() >= 512) engine.receiveSamples(expected.data(), 512);
            adapter->ProcessInPlace(block.data(), 512);
            ASSERT_EQ(block, expected) << "quality " << quality << ", block " << i;
        }
    }
}

TEST(PitchAdapterNew, ShiftsTheRightDistance) {
    for (const float semitones : {-12.0f, -2.0f, 0.0f, 1.0f, 12.0f}) {
        const auto adapter = Make(kNew, 1);
        adapter->SetTranspose(semitones);
        adapter->SetPitchFactor(1, 2.0f);  // only the first channel's factor counts
        const double hz = Frequency(Offline(*adapter, Sine<float>(96000, 440.0), 512));
        EXPECT_NEAR(1200.0 * std::log2(hz / 440.0), 100.0 * static_cast<double>(semitones), 3.0);
    }
}

// Catches frames lost or invented at the ends of an offline rendering, and a stream that comes out shifted.
TEST(PitchAdapterNew, ReturnsAsManyFramesAsItWasGiven) {
    for (const int frames : {1, 100, 30011})
        for (const int block : {64, 8192})
            for (const float speed : {1.0f, 1.5f}) {
                const auto adapter = Make(kNew, 1, 1.5f);
                adapter->SetSpeed(speed);
                const auto input = Noise<double>(static_cast<std::size_t>(frames));
                EXPECT_EQ(Offline(*adapter, input, block).size(),
                          static_cast<std::size_t>(frames / static_cast<double>(speed)))
                    << frames << " in blocks of " << block << " at speed " << speed;
            }
    std::vector<float> click(48000);
    click[20000] = 1.0f;
    const auto adapter = Make(kNew, 1);
    adapter->SetTranspose(0.0f);
    const auto output = Offline(*adapter, click, 512);
    EXPECT_NEAR(static_cast<double>(std::ranges::max_element(output) - output.begin()), 20000.0, 1.0);
}

// Catches a rate at which the engine hangs. The latency depends on the rate that the engine was given, and is
// asked for before any sample: where the rate is wrong the test fails before it could hang.
TEST(PitchAdapterNew, PlaysAtEveryRate) {
    const auto made = [](int rate) {
        std::unique_ptr<PitchAdapter> adapter(PitchAdapter::CreateAdapter(kNew));
        adapter->SetSampleRate(rate);
        return adapter;
    };
    const int lowest = made(1000)->GetLatency();
    EXPECT_LT(lowest, made(2000)->GetLatency());
    for (const int rate : {1, 10, 50, 999, 1000})
        for (const float pitch : {0.02f, 1.0f, 64.0f})
            for (const int speed : {1, 100}) {
                const auto adapter = made(rate);
                ASSERT_EQ(adapter->GetLatency(), lowest) << rate;
                adapter->SetChannelsNum(1);
                adapter->SetPitchFactor(0, pitch);
                adapter->SetSpeed(static_cast<float>(speed));
                auto block = Noise<float>(2000);
                const int taken = adapter->ProcessInPlaceNoPadding(block.data(), 2000);
                adapter->Flush();
                EXPECT_EQ(taken + adapter->GetNumSamplesAvailable(), 2000 / speed) << rate << ", " << pitch;
            }
}

TEST(PitchAdapterNew, RefusesChannelsBeyondTheEngine) {
    const auto adapter = Make(kNew, 1);
    std::vector<float> block(4096);
    for (const int channels : {0, 17}) {
        EXPECT_THROW(adapter->SetChannelsNum(channels), std::runtime_error);
        adapter->ProcessInPlace(block.data(), 16);  // refused, so it must not reach the engine
    }
}

// Catches the tables of sign changes, the wrapped phases and the short cosine drifting from the definition,
// and tables of a pitch that stood before. The left one stands, moves from block to block, and stands
// elsewhere.
TEST(PitchAdapterClassic, AgreesWithTheDefinition) {
    const struct {
        int sizeIndex, size, qualityIndex, oversampling;
        float left, right;
    } cases[] = {{0, 256, 2, 4, 1.5f, 0.5f},
                 {2, 1024, 1, 3, 1.0f, 2.0f},
                 {1, 512, 9, 11, 0.7f, 1.01f},
                 {5, 8192, 13, 32, 1.2f, 0.9f},
                 {99, 8192, -5, 2, 1.2f, 0.9f}};
    for (const auto& c : cases) {
        const auto adapter = Make(kClassic);
        adapter->SetPitchFactor(1, c.right);
        adapter->SetFFTSize(c.sizeIndex);
        adapter->SetQuality(c.qualityIndex);
        adapter->CookFactors();
        Plain::ClassicPitch left(c.size, c.oversampling, 48000), right = left;
        auto samples = Noise<float>(2 * 20000);
        auto expected = samples;
        for (std::size_t at = 0; at < 20000; at += 500) {
            const float moved =
                c.left * static_cast<float>(std::clamp<std::size_t>(at, 8000, 12000)) / 8000.0f;
            adapter->SetPitchFactor(0, moved);
            adapter->ProcessInPlace(samples.data() + 2 * at, 500);
            left.Run(expected.data() + 2 * at, 500, 2, moved);
            right.Run(expected.data() + 2 * at + 1, 500, 2, c.right);
        }
        for (std::size_t i = 0; i < samples.size(); ++i)
            ASSERT_NEAR(samples[i], expected[i], 2e-7f) << c.size << "/" << c.oversampling << ", " << i / 2;
        EXPECT_GT(*std::ranges::max_element(samples), 1e-6f) << "something must come out";
    }
}

TEST(PitchAdapterClassic, LeavesWhatItDoesNotShift) {
    const auto input = Noise<float>(4 * 5000);
    auto four = input;
    Make(kClassic, 4, 1.5f)->ProcessInPlace(four.data(), 5000);
    for (std::size_t i = 0; i < four.size(); i += 4)
        ASSERT_TRUE(four[i + 2] == input[i + 2] && four[i + 3] == input[i + 3]) << i;
    EXPECT_NE(four[0], input[0]);
    for (const float wild : {-1.0f, 1e30f, std::nanf("")})
        Make(kClassic, 2, wild)->ProcessInPlace(four.data(), 5000);
}

TEST(PitchAdapterClassic, SoundsTheSameWithoutARate) {
    const auto input = Noise<float>(2 * 5000);
    auto known = input, unknown = input;
    for (auto [rate, samples] : {std::pair{48000, &known}, std::pair{0, &unknown}}) {
        const auto adapter = Make(kClassic, 2, 1.5f);
        adapter->SetSampleRate(rate);
        adapter->CookFactors();
        adapter->ProcessInPlace(samples->data(), 5000);
    }
    for (std::size_t i = 0; i < known.size(); ++i) ASSERT_NEAR(unknown[i], known[i], 1e-6f) << i;
}
