#include <gtest/gtest.h>

#include <climits>

#include "DSP/Effects/Framework/CorvoEffectBase.h"
#include "Support/Signals.h"

using namespace Corvo::DSP;

namespace {

// Writes 1 wherever it may; with `counts` it rings 100 frames on the left and 70 on the right.
class Ringer : public CorvoEffectBase {
public:
    explicit Ringer(bool counts) : m_counts(counts) {}
    float GetParam(int) override { return 0.0f; }
    int GetParamCountReal() override { return 0; }
    std::string GetName() override { return "ringer"; }

    // Frames of output per channel since the start.
    std::array<int, 2> written{};

protected:
    bool DoSetParam(int, float, bool) override { return false; }
    void ProcessInternal(double*, int frames, const tWAVEFORMATEX*, ProcessFlags&) override {
        if (m_tail.TakeRestart()) m_left = {100, 70};
        const auto allowed = m_counts ? m_tail.Limit(frames, m_left) : std::array{frames, frames};
        for (std::size_t channel = 0; channel < 2; ++channel) written[channel] += allowed[channel];
    }

private:
    bool m_counts;
    std::array<int, 2> m_left{};
};

struct Case {
    const char* fault;
    bool counts;
    std::int64_t limit;
    std::array<int, 2> written;
    int blocks;
};

}  // namespace

TEST(TailRecord, RingsAsLongAsTheEffectAndTheHostAllow) {
    constexpr Case kCases[] = {
        {"the longer channel is cut or the shorter one goes on", true, LLONG_MAX, {100, 70}, 4},
        {"the host's limit is overlooked", true, 50, {50, 50}, 2},
        {"an effect that does not count never ends", false, 50, {50, 50}, 2},
        {"a tail of nothing never ends", true, 0, {0, 0}, 1},
        {"a limit below 0 reads as no tail", false, -5, {0, 0}, 1},
    };
    const auto format = TestSupport::Format<double>();
    ProcessFlags flags;
    for (const auto& c : kCases) {
        Ringer effect(c.counts);
        effect.InitProcessing(32, &format);
        effect.RequestTailRestart();
        effect.Process(nullptr, 32, &format, flags);  // the stream: uncounted, never finished
        EXPECT_EQ(effect.TailFramesProduced(), 32) << c.fault;
        EXPECT_FALSE(effect.TailFinished()) << c.fault;
        effect.written = {};

        effect.StartTail(c.limit);
        int blocks = 0, produced = 0;
        do {
            effect.Process(nullptr, 32, &format, flags);
            produced += effect.TailFramesProduced();
        } while (++blocks < 10 && !effect.TailFinished());
        EXPECT_EQ(blocks, c.blocks) << c.fault;
        EXPECT_EQ(effect.written, c.written) << c.fault;
        EXPECT_EQ(produced, c.written[0]) << c.fault;

        effect.EndTail();
        effect.Process(nullptr, 32, &format, flags);
        EXPECT_EQ(effect.TailFramesProduced(), 32) << c.fault;
    }
}
