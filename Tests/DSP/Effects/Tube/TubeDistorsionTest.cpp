#include "DSP/Effects/Tube/TubeDistorsion.h"

#include <gtest/gtest.h>

#include <complex>

#include "Plain/PlainTube.h"
#include "Support/EffectRun.h"

using namespace TestSupport;
using Corvo::DSP::TubeDistorsion;
using Corvo::DSP::VirtualTubeAmp;

namespace {

enum Control { kBoost = 0, kDrive = 2, kTone = 4, kFunction = 6, kOversampling = 8 };

void SetBoth(TubeDistorsion& tube, Control control, float value) {
    tube.SetParam(control, value, false);
    tube.SetParam(control + 1, value, false);
}

std::vector<double> Channel(const std::vector<double>& interleaved, std::size_t channel) {
    std::vector<double> samples;
    for (std::size_t i = channel; i < interleaved.size(); i += 2) samples.push_back(interleaved[i]);
    return samples;
}

// Renders stereo noise that reaches every branch of the functions.
std::vector<double> RenderNoise(TubeDistorsion& tube, std::vector<double>& input) {
    input = Noise<double>(2 * 1500, 1.2);
    return Render(tube, input, Format<double>(), {128});
}

struct Side {
    float boost, drive;
    int function;
};

void ExpectPlain(const std::vector<double>& output, const std::vector<double>& input, std::size_t channel,
                 const Side& side, int factor, double tolerance) {
    const auto expected = Plain::Tube(Channel(input, channel), 10.0 * static_cast<double>(side.boost) + 1.0,
                                      side.function, static_cast<double>(side.drive), factor);
    const auto actual = Channel(output, channel);
    for (std::size_t i = 0; i < actual.size(); ++i)
        ASSERT_NEAR(actual[i], expected[i], tolerance) << "channel " << channel << ", frame " << i;
}

}  // namespace

// Catches a wrong constant or branch, lanes that take the other side's values, and a mix-up of the factors.
TEST(TubeDistorsionTest, ShapesLikeThePlainForm) {
    constexpr struct {
        Side left, right;
        float oversampling;
        int factor;
    } kCases[] = {
        {{0.1f, 0.3f, 0}, {0.1f, 0.3f, 0}, 0.0f, 1},   {{0.0f, 0.6f, 1}, {0.0f, 0.9f, 1}, 0.17f, 1},
        {{0.05f, 0.5f, 2}, {0.2f, 0.1f, 2}, 0.0f, 1},  {{0.0f, 0.2f, 3}, {0.0f, 0.7f, 3}, 0.0f, 1},
        {{0.0f, 0.3f, 3}, {0.0f, 1.0f, 3}, 0.0f, 1},   {{0.3f, 0.4f, 0}, {0.0f, 0.8f, 2}, 0.0f, 1},
        {{0.3f, 0.0f, 0}, {0.0f, 0.8f, 1}, 0.0f, 1},   {{0.1f, 0.3f, 0}, {0.0f, 0.6f, 1}, 0.3f, 2},
        {{0.1f, 0.3f, 1}, {0.1f, 0.3f, 1}, 0.5f, 4},   {{0.1f, 0.5f, 2}, {0.1f, 0.3f, 3}, 0.7f, 8},
        {{0.1f, 0.5f, 3}, {0.1f, 0.3f, 3}, 0.75f, 12}, {{0.1f, 0.3f, 0}, {0.1f, 0.3f, 0}, 0.8f, 16},
    };
    std::vector<double> input;
    TubeDistorsion untouched;
    EXPECT_EQ(RenderNoise(untouched, input), input);
    for (const auto& c : kCases) {
        TubeDistorsion tube;
        const Side* sides[] = {&c.left, &c.right};
        for (int side = 0; side < 2; ++side) {
            tube.SetParam(kBoost + side, sides[side]->boost, false);
            tube.SetParam(kDrive + side, sides[side]->drive, false);
            tube.SetParam(kFunction + side, 0.25f * static_cast<float>(sides[side]->function), false);
        }
        // The left one is kept, and that is all.
        tube.SetParam(kOversampling, 0.6f, false);
        tube.SetParam(kOversampling + 1, c.oversampling, false);
        const auto output = RenderNoise(tube, input);
        SCOPED_TRACE("factor " + std::to_string(c.factor));
        // Boost and drive are floats; "Martens" multiplies their rounding by its factor.
        ExpectPlain(output, input, 0, c.left, c.factor, 2e-6);
        ExpectPlain(output, input, 1, c.right, c.factor, 2e-6);
    }
}

// The virtual operations are what a host may call itself; here the exact digits of each function.
TEST(TubeDistorsionTest, VirtualShapersGiveTheFunctions) {
    const VirtualTubeAmp amp;
    for (double x = -1.5; x <= 1.5; x += 0.01) {
        EXPECT_NEAR(amp.Martens(x, 3.0), 4 * std::clamp(x, -1.0, 1.0) / (3 * std::min(std::abs(x), 1.0) + 1),
                    1e-15);
        EXPECT_NEAR(amp.DoidicS(x, 0.5), Plain::TubeShape(1, x, 0.5), 1e-15);
        EXPECT_NEAR(amp.DoidicA(x, 0.5), Plain::TubeShape(2, x, 0.5), 1e-14);
        EXPECT_NEAR(amp.ArayaS(x, 0.5), Plain::TubeShape(3, x, 0.5), 1e-15);
    }
}

// At drive 0.9901 the sine is 1 and its shape factor would be infinite.
TEST(TubeDistorsionTest, MartensStaysFiniteAtItsSteepest) {
    for (float drive = 0.9890f; drive < 0.9912f; drive += 0.00001f) {
        TubeDistorsion tube;
        SetBoth(tube, kDrive, drive);
        const std::vector<double> input{0.0, 0.0, 0.5, -0.5, 1e-3, -1e-3};
        const auto output = Render(tube, input, Format<double>(), {3});
        EXPECT_EQ(output[0], 0.0);
        EXPECT_NEAR(output[2], 1.0, 1e-4) << drive;
        EXPECT_NEAR(output[5], -1.0, 1e-2) << drive;
    }
}

// The filter's response against the four sections' product; -12 dB at its corner. Off above 3 radians.
TEST(TubeDistorsionTest, ToneIsALowPassOfOrderFour) {
    const auto z = [](double radians) { return std::polar(1.0, -radians); };
    for (const float v : {0.0f, 0.4f, 0.8f, 0.9f}) {
        TubeDistorsion tube;
        SetBoth(tube, kTone, v);
        std::vector<double> impulse(2 * 2000);
        impulse[0] = 1.0;
        const auto response = Channel(Render(tube, impulse, Format<double>(), {100}), 0);
        const double corner = (1.0 - static_cast<double>(v)) * 0.35 + static_cast<double>(v) * 3.5;
        for (const double radians : {0.0, 0.2, std::min(corner, 3.0), 2.0}) {
            std::complex<double> sum = 0.0;
            for (std::size_t i = 0; i < response.size(); ++i)
                sum += response[i] * z(radians * static_cast<double>(i));
            const double k = std::tan(corner / 2);
            const auto section = (k + k * z(radians)) / (1.0 + k + (k - 1.0) * z(radians));
            const auto expected = corner > 3.0 ? 1.0 : section * section * section * section;
            EXPECT_NEAR(std::abs(sum - expected), 0.0, 1e-5) << v << " at " << radians;
        }
    }
}

TEST(TubeDistorsionTest, FloatsAndMonoGetTheSame) {
    TubeDistorsion stereo, mono, floats;
    for (auto* tube : {&stereo, &mono, &floats}) tube->SetPreset(3);
    std::vector<double> input;
    const auto output = RenderNoise(stereo, input);
    const auto left = Render(mono, Channel(input, 0), Format<double>(1), {128});
    const auto single =
        Render(floats, std::vector<float>(input.begin(), input.end()), Format<float>(), {128});
    for (std::size_t i = 0; i < left.size(); ++i) {
        ASSERT_EQ(left[i], output[2 * i]);
        // "70s Muff" amplifies small samples about 40 times.
        ASSERT_NEAR(static_cast<double>(single[2 * i]), output[2 * i], 2e-5);
    }
}

// A change of the factor in mid-stream: the new filters must come in warm, so that a slow sine goes on
// without a step. The latency of all factors from 2 is within a frame.
TEST(TubeDistorsionTest, ChangesItsFactorWithoutAClick) {
    TubeDistorsion tube;
    SetBoth(tube, kDrive, 0.4f);
    const auto format = Format<double>();
    constexpr int kBlock = 50;  // not a divisor of the frames kept for warming up
    tube.InitProcessing(kBlock, &format);
    const auto input = Sine<double>(kBlock * 100, 100.0, 48000, 0.3, 2);
    double last = 0.0, steepest = 0.0;
    for (std::size_t block = 0; block < 100; ++block) {
        const auto begin = input.begin() + static_cast<std::ptrdiff_t>(2 * kBlock * block);
        auto samples = std::vector(begin, begin + 2 * kBlock);
        // From 2 to 16 and back: every pair of neighbours in both directions.
        constexpr float kSettings[] = {0.3f, 0.5f, 0.6f, 0.75f, 1.0f, 0.75f, 0.6f, 0.5f};
        tube.SetParam(kOversampling + 1, kSettings[block / 2 % 8], false);
        ProcessBlock(tube, samples.data(), kBlock, format);
        for (std::size_t i = 0; i < kBlock; ++i) {
            if (block > 0) steepest = std::max(steepest, std::abs(samples[2 * i] - last));
            last = samples[2 * i];
        }
    }
    // The curve's own slope: 2 pi 100 / 48000 * 0.3 * (k + 1) with k = 2.96 is 0.0155 a frame, and up to
    // twice that where the latency changes; a filter that starts from silence steps by the whole signal.
    EXPECT_LT(steepest, 0.031);
    EXPECT_GT(steepest, 0.01);
}

// Catches filters that automation does not reach, and a restart for factors that came and went before a
// block.
TEST(TubeDistorsionTest, AutomationChangesTheFactorAsAnEditDoes) {
    const auto format = Format<double>();
    const auto input = Noise<double>(2 * 600, 0.5);
    const auto render = [&](bool fromAutomation, std::initializer_list<float> factors) {
        TubeDistorsion tube;
        SetBoth(tube, kDrive, 0.4f);
        SetBoth(tube, kOversampling, 0.5f);
        tube.InitProcessing(300, &format);
        auto samples = input;
        ProcessBlock(tube, samples.data(), 300, format);
        for (const float factor : factors) tube.SetParam(kOversampling + 1, factor, fromAutomation);
        ProcessBlock(tube, samples.data() + 600, 300, format);
        return samples;
    };
    EXPECT_EQ(render(true, {1.0f, 0.3f}), render(false, {0.3f}));
    EXPECT_NE(render(true, {0.3f}), render(true, {}));
    EXPECT_EQ(render(true, {1.0f, 0.5f}), render(true, {}));
}

TEST(TubeDistorsionTest, LatencyIsTheDelayOfBothFilters) {
    TubeDistorsion tube;
    EXPECT_EQ(tube.GetLatency(), 0);
    SetBoth(tube, kOversampling, 1.0f);
    // Group delay at DC of a Butterworth of order 10 behind the bilinear transform, up and down.
    const double delay =
        2 / std::sin(std::numbers::pi / 20) / (2 * std::tan(std::numbers::pi * 0.455 / 16)) / 16;
    EXPECT_EQ(tube.GetLatency(), std::lround(delay));
    std::vector<double> ramp(2 * 400);
    for (std::size_t i = 0; i < ramp.size(); ++i) ramp[i] = static_cast<double>(i / 2) * 1e-3;
    const auto output = Render(tube, ramp, Format<double>(), {400});
    // The first filter's images come back through the second one, 130 dB down.
    EXPECT_NEAR((ramp.back() - output.back()) / 1e-3, delay, 1e-3);
}

TEST(TubeDistorsionTest, ShowsAndReadsItsTexts) {
    TubeDistorsion tube;
    const struct {
        int index;
        float value;
        const wchar_t* text;
        const char* typed;
        float read;
    } kCases[] = {
        {0, 0.0f, L"None | 0", "33", 0.33f},
        {1, 0.249f, L"Weak | 25", "Weak | 25", 0.25f},
        {3, 0.5f, L"Angry | 50", "250", 1.0f},
        {5, 1.0f, L"Holy | 100", "-3", 0.0f},
        {6, 0.5f, L"Doidic A.", "martens", 0.125f},
        {7, 0.8f, L"Araya-S.", "Doidic S.", 0.375f},
        {8, 0.79f, L"12 x ", "12", 0.76f},
        {9, 0.0f, L"1 x ", "1", 0.9f},
        {9, 0.5f, L"4 x ", "4 x ", 0.48f},
        {9, 0.2f, L"2 x ", "2", 0.24f},
        {9, 0.9f, L"16 x ", "8", 0.64f},
    };
    for (const auto& c : kCases) {
        EXPECT_EQ(tube.GetParameterFormattedText(c.index, static_cast<double>(c.value)), c.text);
        EXPECT_FLOAT_EQ(tube.GetParamValueNormalizedFromText(c.index, c.typed), c.read) << c.typed;
    }
    EXPECT_EQ(tube.GetParamName(9), L"Oversampling");
    EXPECT_EQ(tube.GetParamUnitsText(0), L"Amount ");
}

TEST(TubeDistorsionTest, ChunkHoldsTheTenValuesBehindTheLeadingWord) {
    TubeDistorsion tube;
    tube.SetPreset(14);
    const auto chunk = Chunk(tube);
    ASSERT_EQ(chunk.size(), 44u);
    // 0.872f, the drive, is 0x3F5F3B64.
    EXPECT_EQ(std::vector<std::uint8_t>(chunk.begin() + 12, chunk.begin() + 16),
              (std::vector<std::uint8_t>{0x64, 0x3B, 0x5F, 0x3F}));
    GenericUIData data;
    tube.InitializeXyEditingData(data);
    EXPECT_EQ(data.groups.size(), 6u);
    EXPECT_EQ(data.entries.at(14), "Drums");
}
