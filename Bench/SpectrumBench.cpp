#include <benchmark/benchmark.h>

#include <cmath>
#include <vector>

#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Scales/CoordinatesAndFrequencies.h"
#include "Spectrum/Scales/PowerToDecibels.h"
#include "Spectrum/kivspectrum.h"
#include "Support/Signals.h"

// What does the analyser cost per frame (window, transform, power) and per sample fed? Beside a frame stands
// FFTW's bare float transform (BM_FftPeerFftw<float>), beside levels in decibels a loop over the library's
// logarithm.
namespace {

constexpr int kRate = 48000;

void BM_SpectrumFrame(benchmark::State& state) {
    kivspectrum::settings = {};
    kivspectrum::settings.window_length = static_cast<std::int32_t>(state.range(0));
    kivspectrum::settings.hop_length = 1;
    kivspectrum analyser;
    analyser.SetOn(true);
    const auto noise = TestSupport::Noise<float>(static_cast<std::size_t>(state.range(0)));
    analyser.Feed(noise.data(), static_cast<int>(noise.size()), 1, 1);
    const bool whole = state.range(1) != 0;
    for (auto _ : state) {
        if (whole) {
            analyser.Feed(noise.data(), 1, 1, 1);
            benchmark::DoNotOptimize(analyser.PrepareFFTForDrawing(kRate, true, false, false, false));
        } else {
            analyser.PerformFFT();
        }
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * state.range(0));
    state.SetLabel(whole ? "feed, window, transform, power, smoothing" : "window and transform");
    kivspectrum::settings = {};
}
BENCHMARK(BM_SpectrumFrame)->Args({4096, 0})->Args({4096, 1})->Args({65536, 1});

void BM_SpectrumFeed(benchmark::State& state) {
    kivspectrum::settings = {};
    kivspectrum::settings.window_length = static_cast<std::int32_t>(state.range(0));
    kivspectrum analyser;
    const auto stereo = TestSupport::Noise<float>(2 * 512);
    for (auto _ : state) {
        analyser.Feed(stereo.data(), 512, 2, 2);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * 512);
    kivspectrum::settings = {};
}
BENCHMARK(BM_SpectrumFeed)->Arg(4096)->Arg(524288);

std::vector<float> Powers() {
    auto powers = TestSupport::Noise<float>(2048, 1.0);
    for (float& power : powers) power *= power;
    return powers;
}

void BM_PowerToDecibels(benchmark::State& state) {
    const auto power = Powers();
    std::vector<float> level(power.size());
    for (auto _ : state) {
        Corvo::PowerToDecibels(power.data(), level.data(), power.size(), 0.0f);
        benchmark::ClobberMemory();
    }
}
BENCHMARK(BM_PowerToDecibels);

void BM_PowerToDecibelsPeerLibrary(benchmark::State& state) {
    const auto power = Powers();
    std::vector<float> level(power.size());
    for (auto _ : state) {
        for (std::size_t k = 0; k < power.size(); ++k) level[k] = 10.0f * std::log10(power[k] + 1e-30f);
        benchmark::ClobberMemory();
    }
}
BENCHMARK(BM_PowerToDecibelsPeerLibrary);

void BM_SpectrumPoints(benchmark::State& state) {
    kivspectrum::settings = {};
    kivspectrum analyser;
    analyser.SetOn(true);
    const auto noise = TestSupport::Noise<float>(4096);
    analyser.Feed(noise.data(), 4096, 1, 1);
    analyser.PrepareFFTForDrawing(kRate, true, false, false, false);
    const Corvo::RectF rectangle{0.0f, 0.0f, 1000.0f, 300.0f};
    const CoordinatesAndFrequencies map(rectangle, 20.0, 20000.0,
                                        static_cast<Corvo::FrequencyScale>(state.range(0)),
                                        Corvo::LevelScale::Decibels, 90.0f);
    int count = 0;
    for (auto _ : state) {
        analyser.GetSpectrumDrawer()->ComputeSpectrumPoints(rectangle, nullptr, count, map,
                                                            kivspectrum::display_spectrum, 0, 0.0f);
        benchmark::ClobberMemory();
    }
}
BENCHMARK(BM_SpectrumPoints)->DenseRange(0, 5);

}  // namespace
