#include <gtest/gtest.h>

#include <climits>

#include "DSP/Effects/Echo/Echo.h"
#include "DSP/Effects/Gain/GainEfx.h"
#include "Support/EffectRun.h"

using namespace Corvo::DSP;
using namespace TestSupport;

namespace {

constexpr int kBlock = 16;

// At 1 kHz the echo's delays are 100 and 61 samples of both channels: 50 and 30 frames.
std::unique_ptr<CorvoEffectBase> Echoing() {
    auto echo = std::make_unique<Echo>();
    echo->SetParam(2, 0.0f, false);  // milliseconds
    echo->SetParam(0, 0.01005f, false);
    echo->SetParam(1, 0.00615f, false);
    return echo;
}
std::unique_ptr<CorvoEffectBase> Uncounted() { return std::make_unique<GainEfx::GainEfx>(); }

}  // namespace

TEST(TailRecord, RingsAsLongAsTheEffectAndTheHostAllow) {
    constexpr struct {
        const char* fault;
        std::unique_ptr<CorvoEffectBase> (*make)();
        std::int64_t limit;
        int frames, blocks, restart;  // in front of this block; 0 is never
        std::array<int, 2> left;      // frames of each side that are not silence any more
    } kCases[] = {
        {"the longer side is cut or the shorter one goes on", Echoing, LLONG_MAX, 50, 4, 0, {50, 30}},
        {"a restart does not begin a whole pass", Echoing, LLONG_MAX, 82, 6, 2, {}},
        {"the host's limit is overlooked", Echoing, 20, 20, 2, 0, {20, 20}},
        {"an effect that does not count never ends", Uncounted, 50, 50, 4, 0, {}},
        {"a tail of nothing never ends", Echoing, 0, 0, 1, 0, {}},
        {"a limit below 0 reads as no tail", Uncounted, -5, 0, 1, 0, {}},
    };
    const auto format = Format<double>(2, 1000);
    for (const auto& c : kCases) {
        const auto effect = c.make();
        effect->InitProcessing(64, &format);
        auto block = Noise<double>(2 * 64);
        ProcessBlock(*effect, block.data(), 64, format);  // the stream: uncounted, never finished
        EXPECT_EQ(effect->TailFramesProduced(), 64) << c.fault;
        EXPECT_FALSE(effect->TailFinished()) << c.fault;

        effect->StartTail(c.limit);
        int blocks = 0, produced = 0;
        std::array<int, 2> sounding{};
        do {
            if (blocks > 0 && blocks == c.restart) effect->RequestTailRestart();
            std::vector<double> silence(2 * kBlock);
            ProcessBlock(*effect, silence.data(), kBlock, format);
            for (std::size_t i = 0; i < silence.size(); ++i) sounding[i % 2] += silence[i] != 0.0;
            produced += effect->TailFramesProduced();
        } while (++blocks < 10 && !effect->TailFinished());
        EXPECT_EQ(blocks, c.blocks) << c.fault;
        EXPECT_EQ(produced, c.frames) << c.fault;
        if (c.left[0] > 0) {
            EXPECT_EQ(sounding, c.left) << c.fault;
        }
        effect->EndTail();
        ProcessBlock(*effect, block.data(), 32, format);
        EXPECT_EQ(effect->TailFramesProduced(), 32) << c.fault;
    }
}
