#include "DSP/Effects/Tube/TubeDistorsion.h"
#include "EffectRun.h"
#include "FfmpegPeer.h"
#include "LadspaPeer.h"

// What does the distortion cost, plain and oversampled, beside others of its kind?
namespace {

using Corvo::DSP::TubeDistorsion;

// "Tube Distortion" with the oversampling of state.range(1).
void Prepare(TubeDistorsion& tube, benchmark::State& state) {
    tube.SetPreset(1);
    tube.SetParam(9, tube.GetParamValueNormalizedFromText(9, std::to_string(state.range(1))), false);
    if (state.range(1) == 1) tube.SetParam(9, 0.0f, false);
}

template <typename Sample>
void BM_Tube(benchmark::State& state) {
    TubeDistorsion tube;
    Prepare(tube, state);
    RunEffect<Sample>(state, tube);
}
BENCHMARK_TEMPLATE(BM_Tube, float)->ArgsProduct({{512}, {1, 2, 4, 8, 12, 16}})->Args({64, 1})->Args({64, 8});
BENCHMARK_TEMPLATE(BM_Tube, double)->Args({512, 1})->Args({512, 8});

// With the tone filter, and with another function on each side.
void BM_TubeTone(benchmark::State& state) {
    TubeDistorsion tube;
    tube.SetPreset(4);
    tube.SetParam(9, 0.0f, false);
    RunEffect<float>(state, tube);
}
BENCHMARK(BM_TubeTone)->Arg(512);

void BM_TubeSides(benchmark::State& state) {
    TubeDistorsion tube;
    tube.SetPreset(1);
    tube.SetParam(7, 0.6f, false);
    RunEffect<float>(state, tube);
}
BENCHMARK(BM_TubeSides)->Arg(512);

// Digital silence after sound.
void BM_TubeSilence(benchmark::State& state) {
    TubeDistorsion tube;
    Prepare(tube, state);
    const auto format = TestSupport::Format<float>();
    tube.InitProcessing(512, &format);
    auto block = TestSupport::Noise<float>(2 * 512);
    Corvo::DSP::ProcessFlags flags;
    tube.Process(reinterpret_cast<double*>(block.data()), 512, &format, flags);
    for (auto _ : state) {
        std::ranges::fill(block, 0.0f);
        tube.Process(reinterpret_cast<double*>(block.data()), 512, &format, flags);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * 512);
}
BENCHMARK(BM_TubeSilence)->Args({512, 1})->Args({512, 16});

#if DSP_HAVE_LADSPA
void BM_TubePeerFoverdrive(benchmark::State& state) { RunLadspa(state, "foverdrive_1196.so", "foverdrive"); }
void BM_TubePeerSaturate8x(benchmark::State& state) { RunLadspa(state, "caps.so", "Saturate"); }
BENCHMARK(BM_TubePeerFoverdrive)->Arg(512);
BENCHMARK(BM_TubePeerSaturate8x)->Arg(512);
#endif
#if DSP_HAVE_LIBAVFILTER
void BM_TubePeerAsoftclip(benchmark::State& state) {
    RunFfmpeg<float>(state, "asoftclip=type=hard:oversample=" + std::to_string(state.range(1)), "flt");
}
BENCHMARK(BM_TubePeerAsoftclip)->Args({512, 1})->Args({512, 8})->Args({512, 16});
#endif

}  // namespace
