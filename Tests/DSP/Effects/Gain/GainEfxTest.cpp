#include "DSP/Effects/Gain/GainEfx.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdio>

#include "Support/EffectRun.h"

using Corvo::DSP::GainEfx::GainEfx;
using namespace TestSupport;

namespace {

enum { kGain, kWidth, kPan, kFlipLeft, kFlipRight };

// Normalised positions of plain settings.
float Pan(double plain) { return static_cast<float>((plain + 1.0) / 2.0); }
float Width(double plain) { return static_cast<float>(plain / 2.0); }

}  // namespace

// Expected values from the definition of width, pan law and polarity, worked out here in plain numbers; over
// as many frames as fill registers and leave some over.
TEST(GainEfx, ShapesStereoFrames) {
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
        {"hard right", Width(1), Pan(1), false, false, 0.0, 0.5 * k},
        {"just off the centre the law jumps off its pin", Width(1), Pan(0.001), false, false, 0.99803,
         0.5 * 0.99960},
        {"each side flips alone", Width(1), Pan(0), true, false, -1.0, 0.5},
        {"right", Width(1), Pan(0), false, true, 1.0, -0.5},
    };
    for (const auto& c : cases)
        for (int frames = 1; frames <= 17; frames += 4) {
            GainEfx gain;
            gain.SetParam(kWidth, c.width, false);
            gain.SetParam(kPan, c.pan, false);
            gain.SetParam(kFlipLeft, c.flipLeft ? 0.001f : 0.0f, false);  // anything but zero flips
            gain.SetParam(kFlipRight, c.flipRight ? 1.0f : 0.0f, false);
            ForBothSamples([&]<typename Sample>(Sample) {
                std::vector<Sample> input;
                for (int i = 1; i <= frames; ++i) input.insert(input.end(), {Sample(i), Sample(0.5 * i)});
                const auto output = Render(gain, input, Format<Sample>(), {frames});
                for (std::size_t i = 0; i < output.size(); ++i)
                    EXPECT_NEAR(output[i], (i % 2 ? c.right : c.left) * static_cast<double>(i / 2 + 1), 2e-4)
                        << c.what << ", " << i << " of " << frames;
            });
        }
}

// Catches a stride or channel mistake: only the first channel of a stream that is not stereo is scaled, and
// nothing of samples that are neither float nor double.
TEST(GainEfx, ScalesTheFirstChannelOfOtherLayouts) {
    GainEfx gain;
    gain.SetParam(kGain, 0.75f, false);
    auto format = Format<float>(3);
    std::array<float, 6> block{1, 2, 3, 4, 5, 6};
    ProcessBlock(gain, block.data(), 2, format);
    EXPECT_EQ(block, (std::array<float, 6>{5.5f, 2, 3, 22, 5, 6}));
    format.wBitsPerSample = 16;
    ProcessBlock(gain, block.data(), 2, format);
    EXPECT_EQ(block, (std::array<float, 6>{5.5f, 2, 3, 22, 5, 6}));
}

// Catches a typed value that shows its neighbour, because a tenth lies on the edge of what shows it.
TEST(GainEfx, ATypedTenthShowsItself) {
    GainEfx gain;
    for (int tenths = -799; tenths <= 200; ++tenths) {
        char text[16];
        std::snprintf(text, sizeof text, "%.1f dB", tenths / 10.0);
        gain.SetParam(0, gain.GetParamValueNormalizedFromText(0, text), false);
        EXPECT_EQ(Text(gain, 0), text);
    }
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
    // Whether the controls of this stream have to be rebuilt.
    const auto rebuilds = [&](const tWAVEFORMATEX& format) {
        gain.SetUpdateUiFromScratch(false);
        gain.CheckCookProperties(&format, false);
        return gain.WantsUpdateUiFromScratch();
    };
    EXPECT_TRUE(rebuilds(stereo));
    EXPECT_EQ(knob(kFlipLeft).label, "Flip phase L");
    EXPECT_TRUE(knob(kFlipLeft).is_switch && !knob(kPan).is_switch && !knob(kPan).hidden);
    EXPECT_FALSE(rebuilds(stereo)) << "nothing changed";
    EXPECT_TRUE(rebuilds(mono));
    EXPECT_EQ(knob(kFlipLeft).label, "Flip phase");
    EXPECT_TRUE(knob(kPan).hidden && knob(kWidth).hidden && knob(kFlipRight).hidden && !knob(kGain).hidden);
    gain.SetSettingsChunk(std::vector<std::uint8_t>(20));
    EXPECT_TRUE(rebuilds(mono)) << "a loaded chunk rebuilds the controls";
}
