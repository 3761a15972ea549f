#include "DSP/Effects/PitchShift/PitchShift.h"

#include <gtest/gtest.h>

#include "DSP/Pitch/PitchAdapter.h"
#include "Support/AudioThreadRules.h"
#include "Support/EffectRun.h"
#include "Support/TwoThreads.h"

using Corvo::DSP::PitchAdapter;
using Corvo::DSP::PitchShift;
using namespace TestSupport;

namespace {

// A prepared effect and the noise it works on.
class PitchShiftTest : public testing::Test {
protected:
    PitchShiftTest() { m_effect.InitProcessing(500, &m_format); }

    void Process() { ProcessBlock(m_effect, m_block.data(), 500, m_format); }
    // The default preset's words with pitches and a back-end of choice.
    void Load(int left, int right, int backEnd) {
        const int words[] = {0,    left, right, 1000, 1000, 4,    4,    3, 3, 0, 0,      -900,
                             -900, 20,   20,    2000, 2000, -960, -960, 0, 0, 0, backEnd};
        const auto* const bytes = reinterpret_cast<const std::uint8_t*>(words);
        m_effect.SetSettingsChunk({bytes, bytes + sizeof words});
    }

    const tWAVEFORMATEX m_format = Format<float>();
    PitchShift m_effect;
    std::vector<float> m_block = Noise<float>(2 * 500);
};

// Catches settings that do not reach the back-end, or reach it in another way than a host would set it up.
TEST_F(PitchShiftTest, DrivesTheBackEndItsRecordNames) {
    for (const int backEnd : {0, 1}) {
        Load(3300, 2500, backEnd);
        const std::unique_ptr<PitchAdapter> adapter(PitchAdapter::CreateAdapter(backEnd));
        adapter->SetChannelsNum(2);
        adapter->SetSampleRate(48000);
        adapter->SetPitchFactor(0, 1.1f);
        adapter->SetPitchFactor(1, static_cast<float>(2500 * 0.0003333333333333333));
        adapter->SetFFTSize(3);
        adapter->SetQuality(4);
        adapter->CookFactors();
        for (int i = 0; i < 30; ++i) {
            auto expected = m_block = Noise<float>(2 * 500, 0.25, static_cast<std::uint64_t>(i + 2));
            Process();
            adapter->ProcessInPlace(expected.data(), 500);
            ASSERT_EQ(m_block, expected) << "back-end " << backEnd << ", block " << i;
        }
        EXPECT_EQ(m_effect.GetLatency(), adapter->GetLatency());
        m_effect.Cleanup();
        EXPECT_EQ(m_effect.GetLatency(), 0);
        Process();  // makes a new one
        EXPECT_EQ(m_effect.GetLatency(), adapter->GetLatency());
    }
}

// Catches a back-end that is configured, made or freed, and an engine that grows its buffers, by the block
// that takes an edit, or by the largest blocks at either end of the pitch. "New", which all presets name,
// locks.
TEST_F(PitchShiftTest, OnlyNewLocksWhileItProcesses) {
    if (!AudioThreadRules::CanCount()) GTEST_SKIP() << "no counters on this build";
    for (const int rate : {8000, 48000}) {
        const auto format = Format<float>(2, rate);
        m_effect.SetPreset(0);
        m_effect.InitProcessing(4096, &format);
        m_block.resize(2 * 4096);
        Random random(3);
        int backEnd = 1;
        for (int i = 0; i < 1000; ++i) {
            if (i % 100 == 10) m_effect.SetPreset(random.Below(m_effect.NumPresets())), backEnd = 1;
            if (i % 100 == 60) m_effect.SetParam(0, static_cast<float>(random.Unit()), false);
            if (i % 20 == 19) Load(2000 + i, 2500, backEnd = 1 - backEnd);
            const int frames = i % 2 ? 64 : 1 + random.Below(4096);
            const auto broken = BrokenBy([&] { ProcessBlock(m_effect, m_block.data(), frames, format); });
            const bool locksOnly = broken.ends_with("locks") && broken.find(',') == broken.npos;
            ASSERT_TRUE(backEnd == 1 ? locksOnly : broken.empty()) << broken << ", block " << i;
        }
        m_block.resize(2 * 8192);
        for (const int channels : {1, 2, 15})
            for (const float pitch : {0.0f, 0.5f, 1.0f}) {
                const auto wide = Format<float>(channels, rate);
                const int frames = 2 * 8192 / channels;
                PitchShift effect;
                effect.SetPreset(0);
                effect.SetParam(0, pitch, false);
                effect.InitProcessing(frames, &wide);
                for (int i = 0; i < 20; ++i) {
                    const auto broken = BrokenBy([&] { ProcessBlock(effect, m_block.data(), frames, wide); });
                    ASSERT_EQ(broken.find("alloc"), broken.npos) << channels << ", " << pitch << ", " << i;
                }
            }
    }
}

// Catches a back-end freed in use, and one that is taken but not the record's in the end.
TEST_F(PitchShiftTest, TakesBackEndsFromAnotherThread) {
    for (const int last : {0, 1}) {
        WhileAnotherThread(
            [&](int round) {
                Load(2000 + round % 3000, 3000, round % 2);
                m_effect.SetParam(0, 0.4f, false);
                m_effect.GetLatency();
            },
            [&] {
                for (int i = 0; i < 100; ++i) Process();
            });
        Load(2000, 3000, last);
        Process();
        EXPECT_EQ(m_effect.GetLatency() > 0, last == 1) << "only New has a latency to report";
    }
}

// Catches an edit that waits for the next block: a host asks for the latency right behind it.
TEST(PitchShift, SendsAnEditAtOnce) {
    const auto format = Format<float>();
    PitchShift effect;
    effect.SetPreset(0);
    effect.InitProcessing(128, &format);
    const int before = effect.GetLatency();
    effect.SetParam(0, 1.0f, false);
    EXPECT_NE(effect.GetLatency(), before);
    EXPECT_FALSE(effect.GetParameterFormattedText(1, 0.5).empty()) << "either side has its text";
}

}  // namespace
