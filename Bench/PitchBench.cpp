#include <SoundTouch.h>

#include <memory>

#include "DSP/Pitch/PitchAdapter.h"
#include "EffectRun.h"
#include "LadspaPeer.h"
#include "Plain/PlainClassicPitch.h"

// What do the back-ends cost over the engine alone, and over the definition of "Classic"?
namespace {

using Corvo::DSP::PitchAdapter;

constexpr float kFactor = 1.2f;

void BM_PitchNew(benchmark::State& state) {
    const std::unique_ptr<PitchAdapter> adapter(PitchAdapter::CreateAdapter(1));
    adapter->SetChannelsNum(2);
    adapter->SetSampleRate(48000);
    adapter->SetPitchFactor(0, kFactor);
    adapter->SetQuality(static_cast<int>(state.range(0)));
    TestSupport::BlockCopy block(TestSupport::Noise<float>(2 * 512));
    for (auto _ : state) adapter->ProcessInPlace(block.Fresh(), 512);
    state.SetItemsProcessed(state.iterations() * 512);
}
BENCHMARK(BM_PitchNew)->Arg(0)->Arg(4)->Arg(9);

void BM_PitchEngineAlone(benchmark::State& state) {
    const auto quality = static_cast<int>(state.range(0));
    soundtouch::SoundTouch engine;
    engine.setChannels(2);
    engine.setSampleRate(48000);
    engine.setPitch(kFactor);
    engine.setSetting(SETTING_USE_AA_FILTER, quality >= 3);
    engine.setSetting(SETTING_AA_FILTER_LENGTH, quality <= 4 ? 32 : quality == 5 ? 64 : 128);
    engine.setSetting(SETTING_USE_QUICKSEEK, quality < 4);
    TestSupport::BlockCopy block(TestSupport::Noise<float>(2 * 512));
    for (auto _ : state) {
        float* const samples = block.Fresh();
        engine.putSamples(samples, 512);
        if (engine.numSamples() >= 512) engine.receiveSamples(samples, 512);
    }
    state.SetItemsProcessed(state.iterations() * 512);
}
BENCHMARK(BM_PitchEngineAlone)->Arg(0)->Arg(4)->Arg(9);

void BM_PitchClassic(benchmark::State& state) {
    const std::unique_ptr<PitchAdapter> adapter(PitchAdapter::CreateAdapter(0));
    adapter->SetChannelsNum(2);
    adapter->SetSampleRate(48000);
    for (const int channel : {0, 1}) adapter->SetPitchFactor(channel, kFactor);
    adapter->SetFFTSize(3);
    adapter->SetQuality(2);
    adapter->CookFactors();
    TestSupport::BlockCopy block(TestSupport::Noise<float>(2 * 512));
    for (auto _ : state) adapter->ProcessInPlace(block.Fresh(), 512);
    state.SetItemsProcessed(state.iterations() * 512);
}
BENCHMARK(BM_PitchClassic);

void BM_PitchClassicPlain(benchmark::State& state) {
    Plain::ClassicPitch left(2048, 4, 48000), right = left;
    TestSupport::BlockCopy block(TestSupport::Noise<float>(2 * 512));
    for (auto _ : state) {
        float* const samples = block.Fresh();
        left.Run(samples, 512, 2, kFactor);
        right.Run(samples + 1, 512, 2, kFactor);
    }
    state.SetItemsProcessed(state.iterations() * 512);
}
BENCHMARK(BM_PitchClassicPlain);

#if DSP_HAVE_LADSPA
void BM_SwhPitchScale(benchmark::State& state) {
    RunLadspa(state, "pitch_scale_1193.so", "pitchScale", {{"Pitch co-efficient", kFactor}});
}
BENCHMARK(BM_SwhPitchScale)->Arg(512);
#endif

}  // namespace
