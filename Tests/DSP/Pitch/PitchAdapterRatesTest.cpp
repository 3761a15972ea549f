#include <gtest/gtest.h>

#include <memory>

#include "DSP/Pitch/PitchAdapter.h"
#include "Support/Signals.h"

using namespace Corvo::DSP;

namespace {

// Catches a rate at which the engine hangs. The latency depends on the rate that the engine was given, and is
// asked for before any sample: where the rate is wrong the test fails before it could hang.
TEST(PitchAdapterNew, PlaysAtEveryRate) {
    const auto made = [](int rate) {
        std::unique_ptr<PitchAdapter> adapter(PitchAdapter::CreateAdapter(PitchAdapterInfo::SoundTouch));
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
                auto block = TestSupport::Noise<float>(2000);
                const int taken = adapter->ProcessInPlaceNoPadding(block.data(), 2000);
                adapter->Flush();
                EXPECT_EQ(taken + adapter->GetNumSamplesAvailable(), 2000 / speed) << rate << ", " << pitch;
            }
}

}  // namespace
