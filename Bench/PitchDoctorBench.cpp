#include <benchmark/benchmark.h>

#include <algorithm>
#include <chrono>
#include <vector>

#include "DSP/Effects/PitchDoctor/PitchDoctor.h"
#include "DSP/Pitch/VoicePitchDetector.h"
#include "EffectRun.h"
#include "Support/Voice.h"

// What does the correction of a sung voice cost, and the detector alone? A host has to make room for the
// slowest block: BM_PitchDoctorBlocks says how much slower than the median it is. The arguments are the
// block's size, the lowest pitch (0 55, 1 75, 2 110, 3 160 Hz) and whether formants are moved.
namespace {

constexpr int kRate = 48000;

std::vector<double> Voice() {
    return TestSupport::Sing(4.0, kRate, [](double t) {
        return 220.0 * std::exp2(std::floor(2.0 * t) / 12.0 + 0.02 * std::sin(35.0 * t));
    });
}

void Prepare(Corvo::DSP::PitchDoctor& effect, int lowest, bool formants) {
    effect.SetPreset(4);  // all of the error, at once
    effect.SetParam(25, static_cast<float>(lowest) / 3.0f, false);
    if (formants) effect.SetParam(22, 0.625f, false);
}

template <typename Sample>
std::vector<Sample> Stereo() {
    std::vector<Sample> stereo;
    for (const double sample : Voice()) stereo.insert(stereo.end(), 2, static_cast<Sample>(sample));
    return stereo;
}

template <typename Sample>
void BM_PitchDoctor(benchmark::State& state) {
    const auto frames = static_cast<std::size_t>(state.range(0));
    Corvo::DSP::PitchDoctor effect;
    Prepare(effect, static_cast<int>(state.range(1)), state.range(2) != 0);
    const auto format = TestSupport::Format<Sample>();
    effect.InitProcessing(static_cast<int>(frames), &format);
    const auto voice = Stereo<Sample>();
    std::vector<Sample> block(2 * frames);
    Corvo::DSP::ProcessFlags flags;
    std::size_t at = 0;
    for (auto _ : state) {
        std::copy_n(voice.begin() + static_cast<std::ptrdiff_t>(at), block.size(), block.begin());
        effect.Process(reinterpret_cast<double*>(block.data()), static_cast<int>(frames), &format, flags);
        if ((at += block.size()) + block.size() > voice.size()) at = 0;
    }
    state.SetItemsProcessed(state.iterations() * static_cast<std::int64_t>(frames));
}
BENCHMARK_TEMPLATE(BM_PitchDoctor, float)
    ->Args({512, 1, 0})
    ->Args({512, 0, 0})
    ->Args({512, 3, 0})
    ->Args({512, 1, 1});
BENCHMARK_TEMPLATE(BM_PitchDoctor, double)->Args({512, 1, 0});

// Each block's fastest time of several passes, so that what else the machine does is left out.
void BM_PitchDoctorBlocks(benchmark::State& state) {
    constexpr std::size_t kFrames = 64;
    constexpr int kPasses = 9;
    const auto voice = Stereo<float>();
    std::vector<double> fastest(voice.size() / (2 * kFrames), 1.0);
    for (auto _ : state)
        for (int pass = 0; pass < kPasses; ++pass) {
            Corvo::DSP::PitchDoctor effect;
            Prepare(effect, static_cast<int>(state.range(0)), false);
            const auto format = TestSupport::Format<float>();
            effect.InitProcessing(kFrames, &format);
            auto samples = voice;
            Corvo::DSP::ProcessFlags flags;
            for (std::size_t i = 0; i < fastest.size(); ++i) {
                const auto start = std::chrono::steady_clock::now();
                effect.Process(samples.data() + 2 * kFrames * i, kFrames, &format, flags);
                const std::chrono::duration<double> took = std::chrono::steady_clock::now() - start;
                fastest[i] = std::min(fastest[i], took.count());
            }
        }
    std::ranges::sort(fastest);
    const double median = fastest[fastest.size() / 2];
    state.counters["median_us"] = 1e6 * median;
    state.counters["slowest_to_median"] = fastest.back() / median;
}
BENCHMARK(BM_PitchDoctorBlocks)->DenseRange(0, 3)->Iterations(1)->Unit(benchmark::kMillisecond);

void BM_VoicePitchDetector(benchmark::State& state) {
    constexpr int kFrames = 512;
    Corvo::DSP::VoicePitchDetector detector({});
    const auto voice = Voice();
    std::size_t at = 0;
    for (auto _ : state) {
        detector.Push(voice.data() + at, kFrames);
        Corvo::DSP::VoicePitchFrame frame;
        while (detector.Take(frame)) benchmark::DoNotOptimize(frame);
        if ((at += kFrames) + kFrames > voice.size()) at = 0;
    }
    state.SetItemsProcessed(state.iterations() * kFrames);
}
BENCHMARK(BM_VoicePitchDetector);

}  // namespace
