#include <algorithm>
#include <cmath>
#include <string>

#include "DSP/Equalizer/ParEQ.h"
#include "EffectRun.h"
#include "FfmpegPeer.h"
#include "Plain/PlainParEQ.h"
#include "Platform/DenormalGuard.h"

// What does a stereo frame cost, by the number of bands (the argument), settled and with every coefficient of
// every band gliding? Beside it the plain form and a peer's cascade in double. Blocks of 512 frames.
namespace {

using Corvo::DSP::builtin_effects_data;

constexpr int kFrames = 512, kRate = 48000, kChannels = 2;

int Frequency(int band) { return 60 + 900 * band; }

builtin_effects_data Peaks(int bands, int boost) {
    builtin_effects_data data;
    data.numBands = bands;
    for (int i = 0; i < bands; ++i)
        data.SetEqData(i, {Corvo::DSP::EQ_PEAK, Frequency(i), i % 2 ? boost : -boost, 150});
    return data;
}

// The library's class and the plain one under one name.
struct Library {
    template <typename Sample>
    void Process(Sample* samples, builtin_effects_data* records) {
        eq.Process(samples, kFrames, kChannels, false, records);
    }
    void Cook(bool smooth, builtin_effects_data& data) { eq.Cook(smooth, false, &data, kRate, kChannels); }
    Corvo::DSP::ParEQ eq;
};

struct PlainForm {
    template <typename Sample>
    void Process(Sample* samples, builtin_effects_data* records) {
        const Corvo::DenormalGuard guard;
        eq.Process(samples, kFrames, kChannels, records);
    }
    void Cook(bool smooth, builtin_effects_data& data) { eq.Cook(smooth, false, data, kRate); }
    Plain::ParEQ<Plain::ExponentialProgress> eq{kChannels};
};

template <typename Eq, typename Sample, bool Gliding>
void RunEq(benchmark::State& state) {
    const auto bands = static_cast<int>(state.range(0));
    builtin_effects_data records[] = {Peaks(bands, 60), Peaks(bands, 60)}, other = Peaks(bands, 30);
    Eq eq;
    eq.Cook(false, records[0]);
    TestSupport::BlockCopy block(TestSupport::Noise<Sample>(kFrames * kChannels));
    bool turn = false;
    for (auto _ : state) {
        // A glide outlasts the block; a new target every block keeps all of them on the move.
        if (Gliding) eq.Cook(true, (turn = !turn) ? other : records[0]);
        eq.Process(block.Fresh(), records);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * kFrames);
}
template <typename Sample>
void BM_Eq(benchmark::State& state) {
    RunEq<Library, Sample, false>(state);
}
template <typename Sample>
void BM_EqGliding(benchmark::State& state) {
    RunEq<Library, Sample, true>(state);
}
void BM_EqPlain(benchmark::State& state) { RunEq<PlainForm, float, false>(state); }
void BM_EqGlidingPlain(benchmark::State& state) { RunEq<PlainForm, float, true>(state); }
BENCHMARK_TEMPLATE(BM_Eq, float)->Arg(3)->Arg(8)->Arg(20);
BENCHMARK_TEMPLATE(BM_Eq, double)->Arg(3)->Arg(8)->Arg(20);
BENCHMARK(BM_EqPlain)->Arg(3)->Arg(8)->Arg(20);
BENCHMARK_TEMPLATE(BM_EqGliding, float)->Arg(1)->Arg(8)->Arg(20);
BENCHMARK_TEMPLATE(BM_EqGliding, double)->Arg(8);
BENCHMARK(BM_EqGlidingPlain)->Arg(1)->Arg(8)->Arg(20);

// One channel of an interleaved pair at a time, as a host with separate buffers calls it.
void BM_EqSingle(benchmark::State& state) {
    const auto bands = static_cast<int>(state.range(0));
    builtin_effects_data record = Peaks(bands, 60);
    Corvo::DSP::ParEQ eq;
    eq.Cook(false, false, &record, kRate, 1);
    TestSupport::BlockCopy block(TestSupport::Noise<float>(kFrames));
    for (auto _ : state) {
        eq.ProcessSingle(block.Fresh(), kFrames, 1, false, 0, &record);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * kFrames);
}
BENCHMARK(BM_EqSingle)->Arg(3)->Arg(8)->Arg(20);

#if DSP_HAVE_LIBAVFILTER
void BM_FfmpegEqualizer(benchmark::State& state) {
    std::string chain;
    for (int i = 0; i < state.range(0); ++i) {
        if (i > 0) chain += ',';
        chain.append("equalizer=t=o:w=1.1:g=6:a=dii:r=f64:f=").append(std::to_string(Frequency(i)));
    }
    FfmpegPeer peer(chain, "dblp", kRate, kFrames);
    const auto input = TestSupport::Noise<double>(kFrames * kChannels);
    for (auto _ : state) peer.Run(input.data());
    state.SetItemsProcessed(state.iterations() * kFrames);
}
BENCHMARK(BM_FfmpegEqualizer)->Arg(3)->Arg(8)->Arg(20);
#endif

}  // namespace
