#include "DSP/Effects/Chorus/Chorus.h"
#include "EffectRun.h"
#include "FfmpegPeer.h"
#include "LadspaPeer.h"
#include "Plain/PlainChorus.h"

// What does a swept delay cost as a chorus (40 ms, barely moving) and as a flanger (7 ms, all of it moving),
// beside a library sine for every sample, and beside others with one voice?
namespace {

using Settings = Plain::Chorus::Settings;
enum Preset { kChorus, kFlanger, kScratch = 7 };

template <typename Sample, Preset Number>
void BM_Chorus(benchmark::State& state) {
    Corvo::DSP::Chorus chorus;
    chorus.SetPreset(Number);
    RunEffect<Sample>(state, chorus);
}
BENCHMARK_TEMPLATE(BM_Chorus, float, kChorus)->Arg(32)->Arg(512)->Arg(4096);
BENCHMARK_TEMPLATE(BM_Chorus, double, kChorus)->Arg(512);
BENCHMARK_TEMPLATE(BM_Chorus, float, kFlanger)->Arg(512);
BENCHMARK_TEMPLATE(BM_Chorus, float, kScratch)->Arg(512);

void RunPlain(benchmark::State& state, const Settings& settings) {
    const auto frames = static_cast<int>(state.range(0));
    TestSupport::BlockCopy block(TestSupport::Noise<float>(2 * static_cast<std::size_t>(frames)));
    Plain::Chorus chorus;
    chorus.Cook(settings, 48000, 2, true);
    for (auto _ : state) {
        chorus.Run(block.Fresh(), frames);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * frames);
}
void BM_ChorusPlain(benchmark::State& state) {
    RunPlain(state, {{80, 80}, {400, 400}, {-44, -44}, {-60, -60}, {30, 30}});
}
BENCHMARK(BM_ChorusPlain)->Arg(512);
void BM_FlangerPlain(benchmark::State& state) {
    RunPlain(state, {{10, 10}, {70, 70}, {-30, -30}, {-30, -30}, {1000, 1000}});
}
BENCHMARK(BM_FlangerPlain)->Arg(512);

#if DSP_HAVE_LIBAVFILTER
void BM_FfmpegChorus(benchmark::State& state) {
    RunFfmpeg<float>(state, "chorus=0.5:0.9:40:0.4:0.8:1.2", "fltp");
}
BENCHMARK(BM_FfmpegChorus)->Arg(512)->Arg(4096);
void BM_FfmpegFlanger(benchmark::State& state) {
    RunFfmpeg<double>(state, "flanger=delay=0:depth=7:regen=0:speed=0.1:interp=linear", "dblp");
}
BENCHMARK(BM_FfmpegFlanger)->Arg(512)->Arg(4096);
#endif
#if DSP_HAVE_LADSPA
void BM_TapChorus(benchmark::State& state) {
    RunLadspa(state, "tap_chorusflanger.so", "tap_chorusflanger", {{"Frequency", 0.8f}, {"Delay", 40.0f}});
}
BENCHMARK(BM_TapChorus)->Arg(512);
#endif

}  // namespace
