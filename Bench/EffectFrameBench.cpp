#include "DSP/Effects/Tube/TubeDistorsion.h"
#include "EffectRun.h"
#include "Support/EffectCases.h"

// What does the frame itself cost per block, before any effect does anything?
namespace {

class NoEffect : public Corvo::DSP::CorvoEffectBase {
public:
    float GetParam(int) override { return 0.0f; }
    int GetParamCountReal() override { return 16; }
    std::string GetName() override { return "nothing"; }

protected:
    bool DoSetParam(int, float, bool) override { return false; }
    void ProcessInternal(double*, int, const tWAVEFORMATEX* format,
                         Corvo::DSP::ProcessFlags& flags) override {
        if (m_cook.load(std::memory_order_relaxed)) CheckCookProperties(format, flags.force_cook);
    }
};

void BM_FramePerBlock(benchmark::State& state) {
    NoEffect effect;
    const auto format = TestSupport::Format<float>();
    float sample[2]{};
    Corvo::DSP::ProcessFlags flags;
    for (auto _ : state) {
        effect.Process(reinterpret_cast<double*>(sample), 1, &format, flags);
        benchmark::ClobberMemory();
    }
}
BENCHMARK(BM_FramePerBlock);

template <typename Sample>
void BM_BlockCopy(benchmark::State& state) {
    const auto frames = static_cast<std::size_t>(state.range(0));
    TestSupport::BlockCopy block(TestSupport::Noise<Sample>(2 * frames));
    for (auto _ : state) {
        benchmark::DoNotOptimize(block.Fresh());
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * state.range(0));
}
BENCHMARK_TEMPLATE(BM_BlockCopy, float)->Arg(512);
BENCHMARK_TEMPLATE(BM_BlockCopy, double)->Arg(512);

// What does every effect cost at the preset that a host starts from? The README shows these.
[[maybe_unused]] const bool kEveryEffect = [] {
    for (const auto& row : TestSupport::AllEffects())
        benchmark::RegisterBenchmark((std::string("BM_EveryEffect/") + row.name).c_str(),
                                     [&row](benchmark::State& state) {
                                         const auto effect = row.Make();
                                         effect->SetPreset(effect->GetDefaultPreset());
                                         RunEffect<float>(state, *effect);
                                     })
            ->Arg(512);
    benchmark::RegisterBenchmark("BM_EveryEffect/Tube distortion at 8x", [](benchmark::State& state) {
        Corvo::DSP::TubeDistorsion tube;
        tube.SetPreset(1);
        tube.SetParam(9, 0.64f, false);
        RunEffect<float>(state, tube);
    })->Arg(512);
    return true;
}();

}  // namespace
