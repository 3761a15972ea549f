#include "DSP/Effects/Tremolo/Autovol.h"
#include "EffectRun.h"
#include "FfmpegPeer.h"
#include "LadspaPeer.h"
#include "Plain/PlainTremolo.h"

// What does a moving level cost beside a library sine for every sample, and beside others?
namespace {

using Corvo::DSP::Autovol;

template <typename Sample>
void BM_Tremolo(benchmark::State& state) {
    Autovol tremolo;
    RunEffect<Sample>(state, tremolo);
}
BENCHMARK_TEMPLATE(BM_Tremolo, float)->Arg(32)->Arg(512)->Arg(4096);
BENCHMARK_TEMPLATE(BM_Tremolo, double)->Arg(512);

// A cook in front of every block, as automation causes.
void BM_TremoloAutomated(benchmark::State& state) {
    const auto frames = static_cast<int>(state.range(0));
    const auto format = TestSupport::Format<float>();
    Autovol tremolo;
    tremolo.InitProcessing(frames, &format);
    TestSupport::BlockCopy block(TestSupport::Noise<float>(2 * static_cast<std::size_t>(frames)));
    Corvo::DSP::ProcessFlags flags;
    float rate = 0.0f;
    for (auto _ : state) {
        rate = rate < 1.0f ? rate + 0.001f : 0.0f;
        tremolo.SetParam(2, rate, true);
        tremolo.SetParam(3, rate, true);
        tremolo.Process(reinterpret_cast<double*>(block.Fresh()), frames, &format, flags);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * frames);
}
BENCHMARK(BM_TremoloAutomated)->Arg(512);

template <typename Sample>
void BM_TremoloPlain(benchmark::State& state) {
    const auto frames = static_cast<int>(state.range(0));
    Plain::Tremolo left{1.0, 1.0, 0.5, 0.0, 1.0, 0.06283185307179587 * 600 / 48000}, right = left;
    TestSupport::BlockCopy block(TestSupport::Noise<Sample>(2 * static_cast<std::size_t>(frames)));
    for (auto _ : state) {
        Sample* const samples = block.Fresh();
        left.Run(samples, frames, 2);
        right.Run(samples + 1, frames, 2);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * frames);
}
BENCHMARK_TEMPLATE(BM_TremoloPlain, float)->Arg(512);
BENCHMARK_TEMPLATE(BM_TremoloPlain, double)->Arg(512);

#if DSP_HAVE_LIBAVFILTER
void BM_FfmpegTremolo(benchmark::State& state) { RunFfmpeg<double>(state, "tremolo=f=6:d=0.9", "dbl"); }
BENCHMARK(BM_FfmpegTremolo)->Arg(512)->Arg(4096);
#endif
#if DSP_HAVE_LADSPA
void BM_TapTremolo(benchmark::State& state) {
    RunLadspa(state, "tap_tremolo.so", "tap_tremolo", {{"Frequency", 6.0f}, {"Depth", 90.0f}});
}
BENCHMARK(BM_TapTremolo)->Arg(512);
#endif

}  // namespace
