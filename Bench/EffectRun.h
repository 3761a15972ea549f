#pragma once

#include <benchmark/benchmark.h>

#include "BlockCopy.h"
#include "DSP/Effects/Framework/CorvoEffectBase.h"
#include "Support/Signals.h"

// Runs an effect over stereo noise in blocks of state.range(0) frames and reports frames per second. The
// block is copied afresh each time: fed back, it would fade or grow and the run would time something else.
// BM_BlockCopy is what to subtract.
template <typename Sample>
void RunEffect(benchmark::State& state, Corvo::DSP::CorvoEffectBase& effect) {
    const auto frames = static_cast<int>(state.range(0));
    const auto format = TestSupport::Format<Sample>();
    effect.InitProcessing(frames, &format);
    TestSupport::BlockCopy block(TestSupport::Noise<Sample>(2 * static_cast<std::size_t>(frames)));
    Corvo::DSP::ProcessFlags flags;
    for (auto _ : state) {
        effect.Process(reinterpret_cast<double*>(block.Fresh()), frames, &format, flags);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * frames);
}
