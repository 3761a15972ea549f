#include <gtest/gtest.h>

#include <memory>

#include "DSP/Pitch/PitchAdapter.h"
#include "Support/Signals.h"

using namespace Corvo::DSP;

namespace {

// Catches a rate that the engine never comes back from. Its latency tells the rate it was given while it has
// no channels, and so before it is given samples: where that is wrong, nothing runs that would hang.
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
