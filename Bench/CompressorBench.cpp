#include "DSP/Effects/Compressor/Compressor.h"
#include "EffectRun.h"
#include "FfmpegPeer.h"
#include "LadspaPeer.h"
#include "Plain/PlainCompressor.h"

// What do the sixteen ways through the core cost, beside the plain form and beside others?
namespace {

using Corvo::DSP::Compressor;

enum Glide { kStanding, kCurve, kGain, kBoth, kMerged };

// The left parameters of threshold, ratio and out gain; the right ones follow.
constexpr int kOutGain = 4, kThreshold = 6, kRatio = 8, kStereoLink = 10;

void SetBoth(Compressor& compressor, int index, float value) {
    compressor.SetParam(index, value, false);
    compressor.SetParam(index + 1, value, false);
}

// Blocks of noise while nothing glides, while edits keep the curve or the out gain on their way, or while
// presets of other points do: then the curve has the points of both.
template <typename Sample>
void BM_Compressor(benchmark::State& state) {
    const auto frames = static_cast<int>(state.range(0));
    const auto glide = static_cast<Glide>(state.range(2));
    const auto format = TestSupport::Format<Sample>();
    Compressor compressor;
    compressor.SetPreset(2);
    SetBoth(compressor, kRatio, 0.75f);
    compressor.SetParam(kStereoLink, state.range(1) != 0 ? 1.0f : 0.0f, false);
    compressor.InitProcessing(frames, &format);
    TestSupport::BlockCopy block(TestSupport::Noise<Sample>(2 * static_cast<std::size_t>(frames)));
    Corvo::DSP::ProcessFlags flags;
    int round = 0;
    for (auto _ : state) {
        // A glide lasts half a second, so an edit every 32 blocks of 512 keeps it going.
        if (glide != kStanding && round++ % 32 == 0) {
            const float value = round % 64 < 32 ? 0.6f : 0.7f;
            if (glide == kMerged) compressor.SetPreset(round % 64 < 32 ? 1 : 13);
            if (glide == kCurve || glide == kBoth) SetBoth(compressor, kThreshold, value);
            if (glide == kGain || glide == kBoth) SetBoth(compressor, kOutGain, value);
        }
        compressor.Process(reinterpret_cast<double*>(block.Fresh()), frames, &format, flags);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * frames);
}
BENCHMARK_TEMPLATE(BM_Compressor, float)
    ->ArgNames({"", "linked", "glide"})
    ->ArgsProduct({{512}, {0, 1}, {kStanding, kCurve, kGain, kBoth}})
    ->Args({512, 1, kMerged})
    ->Args({64, 1, kStanding});
BENCHMARK_TEMPLATE(BM_Compressor, double)
    ->ArgNames({"", "linked", "glide"})
    ->ArgsProduct({{512}, {0, 1}, {kStanding, kCurve, kGain, kBoth}});

// The plain form, linked, with a curve of the same shape: 35 points, 0.75 of the way to a flat line.
template <typename Sample>
void BM_CompressorPlain(benchmark::State& state) {
    const auto frames = static_cast<std::size_t>(state.range(0));
    Plain::Compressor plain;
    for (auto& curve : plain.curve) {
        curve.push_back({0.0, 0.0});
        for (int i = 0; i <= 33; ++i) {
            const double x = std::pow(10.0, -1.0 + std::max(i - 1, 0) / 32.0);
            curve.push_back({x, 0.1 * std::pow(x / 0.1, 0.25)});
        }
    }
    plain.attack = {0.0060, 0.0060};
    plain.release = {0.00032, 0.00032};
    plain.outGain = plain.appliedGain = {1.0, 1.0};
    plain.smoothing = state.range(1) != 0 ? 0.0013 : 0.0;
    TestSupport::BlockCopy block(TestSupport::Noise<Sample>(2 * frames));
    for (auto _ : state) {
        plain.Run(block.Fresh(), frames, true);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * state.range(0));
}
BENCHMARK_TEMPLATE(BM_CompressorPlain, float)->ArgNames({"", "glide"})->ArgsProduct({{512}, {0, 1}});

// What an automated threshold adds per block: the edit, the cook and the way back to the editor.
void BM_CompressorAutomated(benchmark::State& state) {
    const auto frames = static_cast<int>(state.range(0));
    const auto format = TestSupport::Format<float>();
    Compressor compressor;
    compressor.InitProcessing(frames, &format);
    TestSupport::BlockCopy block(TestSupport::Noise<float>(2 * static_cast<std::size_t>(frames)));
    Corvo::DSP::ProcessFlags flags;
    float threshold = 0.0f;
    for (auto _ : state) {
        threshold = threshold < 1.0f ? threshold + 0.001f : 0.0f;
        compressor.SetParam(kThreshold, threshold, true);
        compressor.SetParam(kThreshold + 1, threshold, true);
        compressor.Process(reinterpret_cast<double*>(block.Fresh()), frames, &format, flags);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * frames);
}
BENCHMARK(BM_CompressorAutomated)->Arg(64)->Arg(512);

#if DSP_HAVE_LADSPA
void BM_SwhSc4(benchmark::State& state) {
    RunLadspa(state, "sc4_1882.so", "sc4",
              {{"RMS", 0.0f}, {"Attack", 8.0f}, {"Release", 150.0f}, {"Threshold", -20.0f}, {"Ratio", 4.0f}});
}
BENCHMARK(BM_SwhSc4)->Arg(512);
#endif
#if DSP_HAVE_LIBAVFILTER
void BM_FfmpegAcompressor(benchmark::State& state) {
    RunFfmpeg<double>(state, "acompressor=threshold=0.1:ratio=4:attack=8:release=150:knee=1", "dbl");
}
BENCHMARK(BM_FfmpegAcompressor)->Arg(512);
#endif

}  // namespace
