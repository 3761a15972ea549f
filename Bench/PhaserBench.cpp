#include "DSP/Effects/Phaser/Phaser.h"
#include "EffectRun.h"
#include "FfmpegPeer.h"
#include "LadspaPeer.h"
#include "Plain/PlainPhaser.h"

// What does a swept chain of all-passes cost per stage, beside the plain form and beside others? The
// arguments are the block's size and the number of stages. A chain with feedback is one long dependence, so
// that its latency is the floor.
namespace {

template <typename Sample>
void BM_Phaser(benchmark::State& state) {
    Corvo::DSP::Phaser phaser;
    phaser.SetParam(6, (static_cast<float>(state.range(1)) - 0.5f) / 29.0f, false);
    RunEffect<Sample>(state, phaser);
}
BENCHMARK_TEMPLATE(BM_Phaser, float)->ArgsProduct({{512}, {6, 12, 30}})->Args({32, 6});
BENCHMARK_TEMPLATE(BM_Phaser, double)->ArgsProduct({{512}, {6, 30}});

template <typename Sample>
void BM_PhaserPlain(benchmark::State& state) {
    const auto frames = static_cast<int>(state.range(0));
    TestSupport::BlockCopy block(TestSupport::Noise<Sample>(2 * static_cast<std::size_t>(frames)));
    Plain::Phaser left(48000, 0.05f, 0.7f, 0.5f, 440, 1600, static_cast<std::size_t>(state.range(1)));
    Plain::Phaser right = left;
    for (auto _ : state) {
        Sample* const samples = block.Fresh();
        left.Run(samples, frames, 2);
        right.Run(samples + 1, frames, 2);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * frames);
}
BENCHMARK_TEMPLATE(BM_PhaserPlain, float)->ArgsProduct({{512}, {6, 12, 30}});

#if DSP_HAVE_LADSPA
// Six stages, swept by an oscillator.
void BM_SwhLfoPhaser(benchmark::State& state) {
    RunLadspa(state, "phasers_1217.so", "lfoPhaser", {{"LFO rate", 6.0f}, {"Feedback", 0.7f}});
}
BENCHMARK(BM_SwhLfoPhaser)->Arg(512);
// Twelve.
void BM_CapsPhaser(benchmark::State& state) { RunLadspa(state, "caps.so", "PhaserII", {{"rate", 0.3f}}); }
BENCHMARK(BM_CapsPhaser)->Arg(512);
#endif
#if DSP_HAVE_LIBAVFILTER
// A swept delay rather than a chain.
void BM_FfmpegAphaser(benchmark::State& state) { RunFfmpeg<float>(state, "aphaser=speed=0.3", "fltp"); }
BENCHMARK(BM_FfmpegAphaser)->Arg(512);
#endif

}  // namespace
