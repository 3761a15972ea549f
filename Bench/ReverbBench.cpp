#include "DSP/Effects/Reverb/Reverb.h"

#include "EffectRun.h"
#include "LadspaPeer.h"
#include "Plain/PlainReverb.h"

// What does a frame of reverb cost, beside the plain loop and a peer with eight combs and four all-passes per
// channel? The argument is the block's size. Small is a room of the smallest size, whose short combs cut the
// block into small pieces.
namespace {

template <typename Sample, bool Small = false>
void BM_Reverb(benchmark::State& state) {
    Corvo::DSP::Reverb reverb;
    for (const int room : {4, 5})
        if (Small) reverb.SetParam(room, 0.0f, false);
    RunEffect<Sample>(state, reverb);
}
BENCHMARK_TEMPLATE(BM_Reverb, float)->Arg(64)->Arg(512)->Arg(4096);
BENCHMARK_TEMPLATE(BM_Reverb, double)->Arg(512);
BENCHMARK_TEMPLATE(BM_Reverb, float, true)->Arg(512);

template <typename Sample>
void BM_ReverbPlain(benchmark::State& state) {
    const auto frames = static_cast<int>(state.range(0));
    TestSupport::BlockCopy block(TestSupport::Noise<Sample>(2 * static_cast<std::size_t>(frames)));
    const Corvo::DSP::ReverbPrivate::_transform_props largeHall{
        {0, 2},     {717, 717},   {2836, 2836}, {-75, -75}, {-25, -25},
        {300, 300}, {1786, 1584}, {1049, 762},  0,          0};
    const Corvo::DSP::ReverbDesign design(largeHall, 48000.0);
    Plain::Reverb<Sample> left(design, 0, 48000), right(design, 1, 48000);
    for (auto _ : state) {
        Sample* const samples = block.Fresh();
        left.Run(samples, frames, 2);
        right.Run(samples + 1, frames, 2);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * state.range(0));
}
BENCHMARK_TEMPLATE(BM_ReverbPlain, float)->Arg(512);

#if DSP_HAVE_LADSPA
void BM_GuitarixFreeverb(benchmark::State& state) {
    RunLadspa(state, "guitarix_freeverb.so", "guitarix_freeverb");
}
BENCHMARK(BM_GuitarixFreeverb)->Arg(512);
#endif

}  // namespace
