#include "DSP/Effects/Gain/GainEfx.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <stdexcept>

#include "Plain/PlainGain.h"
#include "Support/EffectRun.h"

using Corvo::DSP::ProcessFlags;
using Corvo::DSP::GainEfx::GainEfx;
using TestSupport::Format;

namespace {

enum { kGain, kWidth, kPan, kFlipLeft, kFlipRight };

// Normalised positions of plain settings.
float Pan(double plain) { return static_cast<float>((plain + 1.0) / 2.0); }
float Width(double plain) { return static_cast<float>(plain / 2.0); }

struct Frame {
    double left, right;
};

Frame ThroughStereo(GainEfx& gain, Frame in) {
    const auto format = Format<double>(2);
    ProcessFlags flags;
    double samples[] = {in.left, in.right};
    gain.Process(samples, 1, &format, flags);
    return {samples[0], samples[1]};
}

}  // namespace

// Expected values from the definition of width, pan law and polarity, worked out here in plain numbers.
TEST(GainEfx, ShapesAStereoFrame) {
    const double k = std::pow(10.0, 3.0 / 20.0);
    struct Case {
        const char* what;
        float width, pan;
        bool flipLeft, flipRight;
        double left, right;  // of the input 1.0, 0.5
    } const cases[] = {
        {"neutral is the identity", Width(1), Pan(0), false, false, 1.0, 0.5},
        {"width 0 gives the sum on both sides", Width(0), Pan(0), false, false, 1.5, 1.5},
        {"width 2 spreads fourfold and keeps the middle", Width(2), Pan(0), false, false, 1.75, -0.25},
        {"width 0.5 mixes", Width(0.5), Pan(0), false, false, (0.25 + 2.25) / 2, (2.25 - 0.25) / 2},
        {"hard right", Width(1), Pan(1), false, false, 0.0, 0.5 * k},
        {"hard left", Width(1), Pan(-1), false, false, k, 0.0},
        {"just off the centre the law jumps off its pin", Width(1), Pan(0.001), false, false, 0.99803,
         0.5 * 0.99960},
        {"each side flips alone", Width(1), Pan(0), true, false, -1.0, 0.5},
        {"right", Width(1), Pan(0), false, true, 1.0, -0.5},
    };
    for (const auto& c : cases) {
        GainEfx gain;
        const auto format = Format<double>();
        gain.InitProcessing(16, &format);
        gain.SetParam(kWidth, c.width, false);
        gain.SetParam(kPan, c.pan, false);
        gain.SetParam(kFlipLeft, c.flipLeft ? 0.001f : 0.0f, false);  // anything but zero flips
        gain.SetParam(kFlipRight, c.flipRight ? 1.0f : 0.0f, false);
        const auto out = ThroughStereo(gain, {1.0, 0.5});
        EXPECT_NEAR(out.left, c.left, 1e-5) << c.what;
        EXPECT_NEAR(out.right, c.right, 1e-5) << c.what;
    }
}

TEST(GainEfx, MapsTheGainKnobAroundUnity) {
    struct Case {
        float normalised;
        double plain;
        const wchar_t* text;
    } const cases[] = {
        {0.0f, 0.0001, L"-Inf. dB"},  {0.5f, 1.0, L"0.0 dB"},   {1.0f, 10.0, L"20.0 dB"},
        {0.25f, 0.50005, L"-6.0 dB"}, {0.75f, 5.5, L"14.8 dB"},
    };
    GainEfx gain;
    for (const auto& c : cases) {
        gain.SetParam(kGain, c.normalised, false);
        EXPECT_FLOAT_EQ(gain.GetParamPlain(kGain), static_cast<float>(c.plain));
        EXPECT_EQ(gain.GetParameterFormattedText(kGain, -1.0), c.text);
        EXPECT_FLOAT_EQ(gain.GetParam(kGain), c.normalised);
    }
    gain.SetParam(kGain, 1.5f, false);  // not limited on the way in, limited on the way out
    EXPECT_EQ(gain.GetParamPlain(kGain), 19.0f);
    EXPECT_EQ(gain.GetParam(kGain), 1.0f);
    EXPECT_EQ(gain.GetParameterFormattedText(kWidth, 0.0), L"1.00 ");
    EXPECT_EQ(gain.GetParameterFormattedText(kFlipLeft, 0.5), L"On");
    EXPECT_EQ(gain.GetParameterFormattedText(kFlipLeft, 0.49), L"Off");
}

TEST(GainEfx, ReadsTexts) {
    GainEfx gain;
    EXPECT_FLOAT_EQ(gain.GetParamValueNormalizedFromText(kGain, "0.0 dB"), 0.5f);
    EXPECT_FLOAT_EQ(gain.GetParamValueNormalizedFromText(kGain, "20"), 1.0f);
    EXPECT_FLOAT_EQ(gain.GetParamValueNormalizedFromText(kGain, "40 dB"), 1.0f);
    EXPECT_FLOAT_EQ(gain.GetParamValueNormalizedFromText(kGain, "-Inf. dB"), 0.0f);
    EXPECT_FLOAT_EQ(gain.GetParamValueNormalizedFromText(kPan, " -0.5"), 0.25f);
    for (const auto& [text, message] :
         {std::pair{"loud", "invalid stof argument"}, std::pair{"1e99", "stof argument out of range"}})
        try {
            gain.GetParamValueNormalizedFromText(kGain, text);
            FAIL();
        } catch (const std::logic_error& error) {
            EXPECT_STREQ(error.what(), message);
        }
}

// Catches lanes that are swapped or rounded differently, and the frames that fill no register.
TEST(GainEfx, HasTheBitsOfThePlainForm) {
    const auto check = []<typename Sample>(Sample) {
        for (int frames = 1; frames <= 17; ++frames) {
            GainEfx gain;
            gain.SetParam(kWidth, Width(0.75), false);
            auto input = TestSupport::Noise<Sample>(static_cast<std::size_t>(2 * frames));
            input[0] = input[1] = Sample(-0.0);
            auto expected = input;
            Plain::Gain(expected.data(), frames, Sample(0.75), Sample(1.25), Sample(1), Sample(1));
            const auto output = TestSupport::Render(gain, input, Format<Sample>(), {frames});
            ASSERT_EQ(std::memcmp(output.data(), expected.data(), output.size() * sizeof(Sample)), 0)
                << frames;
        }
    };
    check(0.0f);
    check(0.0);
}

// Catches a stride or channel mistake: only the first channel of a stream that is not stereo is scaled.
TEST(GainEfx, ScalesTheFirstChannelOfOtherLayouts) {
    GainEfx gain;
    gain.SetParam(kGain, 0.75f, false);
    ProcessFlags flags;
    const auto three = Format<float>(3);
    std::array<float, 6> block{1, 2, 3, 4, 5, 6};
    gain.Process(reinterpret_cast<double*>(block.data()), 2, &three, flags);
    EXPECT_EQ(block, (std::array<float, 6>{5.5f, 2, 3, 22, 5, 6}));

    gain.SetParam(kPan, 1.0f, false);  // left over from a stereo stream
    const auto mono = Format<double>(1);
    double sample = 1.0;
    gain.Process(&sample, 1, &mono, flags);
    EXPECT_EQ(sample, 0.0);
}

TEST(GainEfx, LeavesOtherSampleWidthsAlone) {
    GainEfx gain;
    gain.SetParam(kGain, 1.0f, false);
    auto format = Format<float>();
    format.wBitsPerSample = 16;
    ProcessFlags flags;
    double block[2] = {0.25, 0.5};
    gain.Process(block, 2, &format, flags);
    EXPECT_EQ(block[0], 0.25);
    EXPECT_EQ(block[1], 0.5);
}

// Catches controls that stay hidden, or a host that is not told to rebuild them.
TEST(GainEfx, LaysItsControlsOutForTheStream) {
    GainEfx gain;
    const auto knob = [&](int index) {
        PluginParameterInfo info;
        gain.GetParamSectionInfo(index, info);
        return info;
    };
    const auto stereo = Format<float>(2), mono = Format<float>(1);
    EXPECT_FALSE(gain.WantsUpdateUiFromScratch());
    gain.CheckCookProperties(&stereo, false);
    EXPECT_TRUE(gain.WantsUpdateUiFromScratch());
    EXPECT_EQ(knob(kFlipLeft).label, "Flip phase L");
    EXPECT_EQ(knob(kFlipLeft).layout_group, 2);
    EXPECT_TRUE(knob(kFlipLeft).is_switch);
    EXPECT_EQ(knob(kGain).layout_group, 1);
    EXPECT_FALSE(knob(kPan).hidden);

    gain.SetUpdateUiFromScratch(false);
    gain.CheckCookProperties(&stereo, false);
    EXPECT_FALSE(gain.WantsUpdateUiFromScratch()) << "nothing changed";
    gain.CheckCookProperties(&mono, false);
    EXPECT_TRUE(gain.WantsUpdateUiFromScratch());
    EXPECT_EQ(knob(kFlipLeft).label, "Flip phase");
    EXPECT_EQ(knob(kFlipLeft).layout_group, -1);
    EXPECT_TRUE(knob(kPan).hidden && knob(kWidth).hidden && knob(kFlipRight).hidden);
    EXPECT_FALSE(knob(kGain).hidden);

    gain.SetUpdateUiFromScratch(false);
    gain.SetSettingsChunk(std::vector<std::uint8_t>(20));
    gain.CheckCookProperties(&mono, false);
    EXPECT_TRUE(gain.WantsUpdateUiFromScratch()) << "a loaded chunk rebuilds the controls";
}
