#include "DSP/Effects/Gain/GainEfx.h"
#include "EffectRun.h"
#include "FfmpegPeer.h"

// How does gain scale with block size, precision and layout?
namespace {

using Corvo::DSP::GainEfx::GainEfx;

void Prepare(GainEfx& gain) {
    gain.SetParam(0, 0.4f, false);
    gain.SetParam(1, 0.7f, false);
    gain.SetParam(2, 0.6f, false);
}

template <typename Sample>
void BM_Gain(benchmark::State& state) {
    GainEfx gain;
    Prepare(gain);
    RunEffect<Sample>(state, gain);
}
BENCHMARK_TEMPLATE(BM_Gain, float)->RangeMultiplier(4)->Range(32, 4096)->Arg(512);
BENCHMARK_TEMPLATE(BM_Gain, double)->RangeMultiplier(4)->Range(32, 4096)->Arg(512);

template <typename Sample>
void BM_GainPlanar(benchmark::State& state) {
    const auto frames = static_cast<std::size_t>(state.range(0));
    const auto format = TestSupport::Format<Sample>();
    GainEfx gain;
    Prepare(gain);
    gain.InitProcessing(static_cast<int>(frames), &format);
    TestSupport::BlockCopy block(TestSupport::Noise<Sample>(2 * frames));
    Corvo::DSP::ProcessFlags flags;
    for (auto _ : state) {
        Sample* const left = block.Fresh();
        double* const channels[] = {reinterpret_cast<double*>(left),
                                    reinterpret_cast<double*>(left + frames)};
        gain.ProcessNoninterleaved(channels, static_cast<int>(frames), &format, flags);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * state.range(0));
}
BENCHMARK_TEMPLATE(BM_GainPlanar, float)->RangeMultiplier(4)->Range(32, 4096);
BENCHMARK_TEMPLATE(BM_GainPlanar, double)->RangeMultiplier(4)->Range(32, 4096);

#if DSP_HAVE_LIBAVFILTER
void BM_FfmpegGraphAlone(benchmark::State& state) { RunFfmpeg<float>(state, "anull", "flt"); }
BENCHMARK(BM_FfmpegGraphAlone)->Arg(512)->Arg(4096);
void BM_FfmpegExtrastereo(benchmark::State& state) { RunFfmpeg<float>(state, "extrastereo=m=1.5", "flt"); }
BENCHMARK(BM_FfmpegExtrastereo)->Arg(512)->Arg(4096);
#endif

}  // namespace
