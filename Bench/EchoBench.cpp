#include "DSP/Effects/Echo/Echo.h"
#include "EffectRun.h"
#include "FfmpegPeer.h"
#include "Plain/PlainEcho.h"

// What does a frame of echo cost, beside the plain loop and a peer with one tap? The argument is the block's
// size. In the default preset both sides have one delay; Split gives them two, which wrap apart.
namespace {

template <typename Sample, bool Split = false>
void BM_Echo(benchmark::State& state) {
    Corvo::DSP::Echo echo;
    if (Split) echo.SetParam(0, 0.4f, false);
    RunEffect<Sample>(state, echo);
}
BENCHMARK_TEMPLATE(BM_Echo, float)->Arg(64)->Arg(512)->Arg(4096);
BENCHMARK_TEMPLATE(BM_Echo, double)->Arg(512);
BENCHMARK_TEMPLATE(BM_Echo, float, true)->Arg(512);

template <typename Sample>
void BM_EchoPlain(benchmark::State& state) {
    const auto frames = static_cast<int>(state.range(0));
    TestSupport::BlockCopy block(TestSupport::Noise<Sample>(2 * static_cast<std::size_t>(frames)));
    Plain::Echo echo;
    echo.SetSides({{{0.45, 0.03, 0.5, 2.0, 14400}, {0.45, 0.03, 0.5, 2.0, 14400}}});
    for (auto _ : state) {
        echo.Run(block.Fresh(), frames, 2);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * state.range(0));
}
BENCHMARK_TEMPLATE(BM_EchoPlain, float)->Arg(512);

#if DSP_HAVE_LIBAVFILTER
void BM_FfmpegAecho(benchmark::State& state) { RunFfmpeg<float>(state, "aecho=0.8:0.9:300:0.4", "fltp"); }
BENCHMARK(BM_FfmpegAecho)->Arg(512);
#endif

}  // namespace
