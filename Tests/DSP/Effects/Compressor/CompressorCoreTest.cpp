#include <gtest/gtest.h>

#include <numbers>

#include "DSP/Effects/Parameters/SettingsChunk.h"
#include "Plain/PlainCompressor.h"
#include "Support/CompressorProbe.h"

using namespace TestSupport;

// What happens from sample to sample.
namespace {

constexpr double kRate = 48000.0;

// Of a one-pole that covers 90 % of its way in that time.
double Coefficient(double frames) { return 1.0 - std::pow(10.0, -1.0 / (frames + 1.0)); }

// The plain core with the settings that a chunk holds, standing.
Plain::Compressor PlainFrom(Compressor& effect) {
    const auto chunk = Chunk(effect);
    std::int32_t tag;
    std::array<std::int32_t, 24> words;
    std::array<std::int32_t, 4> counts;
    Corvo::DSP::ChunkReader read(chunk);
    read(tag) && read(words) && read(counts);
    Plain::Compressor plain;
    for (std::size_t channel = 0; channel < 2; ++channel) {
        std::array<std::array<float, 3>, 666> points;
        for (auto& point : points) read(point);
        for (std::size_t i = 0; i < static_cast<std::size_t>(counts[channel]); ++i)
            plain.curve[channel].push_back({points[i][0], points[i][1]});
        plain.attack[channel] = Coefficient(words[channel] * kRate * 0.00001);
        plain.release[channel] = Coefficient(words[2 + channel] * kRate * 0.0001);
        plain.outGain[channel] = plain.appliedGain[channel] = std::pow(10.0, words[4 + channel] * 0.005);
    }
    plain.smoothing = 1.0 - std::exp(-2.0 * std::numbers::pi / (kRate * 0.1));
    return plain;
}

// Noise whose level wanders over the whole curve, left and right differently.
template <typename Sample>
std::vector<Sample> Wandering(std::size_t frames) {
    auto samples = Noise<Sample>(2 * frames, 1.0);
    for (std::size_t i = 0; i < samples.size(); ++i)
        samples[i] *= static_cast<Sample>(
            Amplitude(-40.0 + 45.0 * std::sin(static_cast<double>(i / 2) * (i % 2 ? 0.0013 : 0.0007))));
    return samples;
}

void Prepare(Compressor& effect, bool linked) {
    effect.SetPreset(26);  // a soft knee, a ratio and a gate
    effect.SetParam(kAttack, TimePosition(30), false);
    effect.SetParam(kAttack + 1, TimePosition(700), false);
    effect.SetParam(kRelease + 1, TimePosition(300), false);
    effect.SetParam(kOutGain + 1, OutGainPosition(-35), false);
    effect.SetParam(kThreshold + 1, ThresholdPosition(-350), false);
    effect.SetParam(kStereoLink, linked ? 1.0f : 0.0f, false);
}

// 10 dB less for each 10 dB above -20 dB, so that envelopes can be read from the output.
void Limit(Compressor& effect) {
    effect.SetPreset(0);
    SetBoth(effect, kThreshold, ThresholdPosition(-200));
    SetBoth(effect, kRatio, 1.0f);
}

}  // namespace

// Catches wrong times, a linked pair that does not follow the left ones, a wrong order of operations, a
// segment search that loses its place, right and left mixed up; and glides of another length or shape than
// every point's own one-pole, or with a step at their end.
TEST(ParameterSmootherTester, GlidesLikeThePlainForm) {
    constexpr std::size_t kEdit = 20000, kFrames = 80000;
    const std::vector<Edit> edits{{kEdit, kThreshold + 1, ThresholdPosition(-120)},
                                  {kEdit, kRatio + 1, RatioPosition(251)},
                                  {kEdit, kOutGain, OutGainPosition(85)}};
    const auto check = [&]<typename Sample>(Sample, bool linked, double tolerance) {
        const auto input = Wandering<Sample>(kFrames);
        Compressor effect, edited;
        Prepare(effect, linked);
        Prepare(edited, linked);
        for (const auto& edit : edits) edited.SetParam(edit.index, edit.value, false);
        auto plain = PlainFrom(effect);
        const auto target = PlainFrom(edited);
        auto expected = input;
        plain.Run(expected.data(), kEdit, linked);
        for (std::size_t channel = 0; channel < 2; ++channel) {
            ASSERT_EQ(plain.curve[channel].size(), target.curve[channel].size());
            for (std::size_t i = 0; i < target.curve[channel].size(); ++i) {
                plain.curve[channel][i].targetX = target.curve[channel][i].x;
                plain.curve[channel][i].targetY = target.curve[channel][i].y;
            }
        }
        plain.outGain = target.outGain;
        plain.Run(expected.data() + 2 * kEdit, kFrames - kEdit, linked);
        const auto output = Render(effect, input, Format<Sample>(), {512}, edits);
        for (std::size_t i = 0; i < output.size(); ++i)
            ASSERT_NEAR(output[i], expected[i], i < 2 * kEdit ? 0.0 : tolerance)
                << "sample " << i << (linked ? ", linked" : "");
    };
    for (const bool linked : {true, false}) {
        check(0.0, linked, 1e-9);
        check(0.0f, linked, 1e-6);
    }
}

// Catches a detector that listens to the wrong signal, or goes on reading buffers it was lent for one block.
TEST(CompressorCore, ListensToTheSideChain) {
    constexpr int kFrames = 4000;
    std::vector<float> loud(kFrames, 1.0f), silent(kFrames, 0.0f), opposite(kFrames, -1.0f), block;
    const auto buffer = [](std::vector<float>& samples) { return reinterpret_cast<double*>(samples.data()); };
    double* const mono[] = {buffer(loud), nullptr};
    double* const stereo[] = {buffer(silent), buffer(loud)};
    double* const opposites[] = {buffer(loud), buffer(opposite)};
    struct Case {
        const char* what;
        int channels, announced;  // of the block, which is mono or stereo, and of the side-chain
        double* const* buffers;
        float link;
        double left, right;  // gains in dB of a quiet block; full scale is 20 dB above the threshold
        bool used;
    } const cases[] = {
        {"no side-chain", 2, 0, mono, 0.0f, 0.0, 0.0, false},
        {"mono serves both channels", 2, 1, mono, 0.0f, -20.0, -20.0, true},
        {"fewer buffers than announced", 2, 2, mono, 0.0f, -20.0, -20.0, true},
        {"each channel has its own", 2, 2, stereo, 0.0f, 0.0, -20.0, true},
        {"linked, the mean of both: half of full scale", 2, 2, stereo, 1.0f, -13.98, -13.98, true},
        {"a mono block follows the mean", 1, 2, stereo, 0.0f, -13.98, -13.98, true},
        {"the mean of levels, not of samples", 1, 2, opposites, 0.0f, -20.0, -20.0, true},
        {"announced, but null", 2, 2, nullptr, 0.0f, 0.0, 0.0, false},
        {"announced, but of null channels", 2, 2, mono + 1, 0.0f, 0.0, 0.0, false},
    };
    for (const auto& c : cases) {
        const auto format = Format<float>(c.channels);
        Compressor effect;
        Limit(effect);
        effect.SetParam(kStereoLink, c.link, false);
        SetBoth(effect, kRelease, 0.0f);
        if (c.announced > 0) effect.SetSidechainBusNumChannels(0, c.announced);
        effect.InitProcessing(kFrames, &format);
        effect.SetSidechainBuffer(0, c.buffers);
        effect.SetSidechainBuffer(1, mono);
        const auto expect = [&](double left, double right, const char* when) {
            block.assign(static_cast<std::size_t>(c.channels * kFrames), 0.001f);
            ProcessBlock(effect, block.data(), kFrames, format);
            const auto* const last = &block.back();
            EXPECT_NEAR(Decibels(last[1 - c.channels] / 0.001), left, 0.05) << c.what << when;
            EXPECT_NEAR(Decibels(*last / 0.001), right, 0.05) << c.what << when;
        };
        expect(c.left, c.right, "");
        EXPECT_EQ(effect.IsUsingSideChain(), c.used) << c.what;
        expect(0.0, 0.0, ", the block after");
        EXPECT_FALSE(effect.IsUsingSideChain());
    }
    const auto format = Format<float>(1);
    Compressor monitored;
    monitored.SetSidechainBusNumChannels(0, 2);
    monitored.SetParam(kMonitor, 1.0f, false);
    monitored.InitProcessing(1, &format);
    monitored.SetSidechainBuffer(0, stereo);
    ProcessBlock(monitored, block.data(), 1, format);
    EXPECT_EQ(block[0], 0.5f) << "the mean of both is heard";
}

// Catches a monitor that plays the wrong signal, or that leaves the followers behind.
TEST(CompressorCore, MonitorsTheDetector) {
    const auto format = Format<float>();
    constexpr int kFrames = 333;
    auto key = Noise<float>(2 * kFrames, 0.8, 9);  // left, then right
    const auto input = Noise<float>(2 * kFrames);
    double* const buffers[] = {reinterpret_cast<double*>(key.data()),
                               reinterpret_cast<double*>(key.data() + kFrames)};
    std::vector<std::vector<float>> afterwards;
    for (const float monitor : {1.0f, 0.0f}) {
        Compressor effect;
        effect.SetSidechainBusNumChannels(0, 2);
        effect.InitProcessing(kFrames, &format);
        auto block = input;
        const auto run = [&](float monitored) {
            effect.SetParam(kMonitor + 1, monitored, false);
            ProcessBlock(effect, (block = input).data(), kFrames, format);
        };
        effect.SetSidechainBuffer(0, buffers);
        run(monitor);
        for (std::size_t i = 0; monitor == 1.0f && i < block.size(); ++i)
            ASSERT_EQ(block[i], key[i % 2 * kFrames + i / 2]);
        run(monitor);
        EXPECT_EQ(block == input, monitor == 1.0f)
            << "without a side-chain the block is the detector's signal";
        run(0.0f);
        afterwards.push_back(block);
    }
    EXPECT_EQ(afterwards[0], afterwards[1]);
}

TEST(CompressorCore, MetersTheGainWhileTheMeterIsOn) {
    Compressor effect;
    Limit(effect);
    for (const bool on : {false, true}) {
        effect.SetGainMeterOn(on);
        SteadyGains(effect, {0.0}, 8000);
        for (const int channel : {0, 1})
            EXPECT_NEAR(effect.GetGainReduction(channel), on ? 0.1 : 1.0, on ? 1e-4 : 0.0);
    }
}
