#include <benchmark/benchmark.h>

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Drawer/VectorInterpolationFilterFloat.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Support/Signals.h"

// What does a refresh of the sonogram cost? Column and scroll together (BM_SonogramStep/3) may take twice a
// move of the picture's pixels (BM_SonogramPeerMemmove).
namespace {

constexpr int kWidth = 1280, kHeight = 720;
constexpr Corvo::RectF kRectangle{0.0f, 0.0f, kWidth, kHeight};

std::vector<float> Spectrum(std::size_t bins) {
    auto spectrum = TestSupport::Noise<float>(bins, 1000.0);
    for (float& power : spectrum) power *= power;
    return spectrum;
}

void BM_SonogramPeerMemmove(benchmark::State& state) {
    std::vector<std::uint32_t> pixels(kWidth * kHeight);
    for (auto _ : state) {
        std::memmove(pixels.data(), pixels.data() + 1, (pixels.size() - 1) * sizeof pixels[0]);
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(pixels.size() * 4));
}
BENCHMARK(BM_SonogramPeerMemmove);

void BM_SonogramScroll(benchmark::State& state) {
    Corvo::Sonogram sonogram;
    sonogram.CheckPixelBufferSize(kRectangle, 0);
    for (auto _ : state) {
        sonogram.ScrollPixels();
        benchmark::ClobberMemory();
    }
}
BENCHMARK(BM_SonogramScroll);

// By the number of bins.
void BM_SonogramColumn(benchmark::State& state) {
    Corvo::Sonogram sonogram;
    const auto spectrum = Spectrum(static_cast<std::size_t>(state.range(0)));
    for (auto _ : state) {
        sonogram.ComputeColumn(spectrum, kHeight);
        benchmark::ClobberMemory();
    }
}
BENCHMARK(BM_SonogramColumn)->Arg(2048)->Arg(262144);

// By speed index, a new spectrum every refresh.
void BM_SonogramStep(benchmark::State& state) {
    Corvo::Sonogram::SetSpeedIndex(static_cast<int>(state.range(0)));
    Corvo::SpectrumSettings settings;
    settings.time_smoothing = 0;
    SpectrumDrawer drawer(settings);
    drawer.UpdateSamplingFrequency(48000);
    VectorInterpolationFilterFloat none;
    drawer.SmoothFftSpectrum(Spectrum(2048), 1.0f, none);
    Corvo::Sonogram sonogram;
    sonogram.CheckPixelBufferSize(kRectangle, 0);
    for (auto _ : state) {
        benchmark::DoNotOptimize(sonogram.Step(drawer, true, 440.0f));
        benchmark::ClobberMemory();
    }
    state.SetLabel(std::to_string(1 - std::min(sonogram.GetDrawCounter(), 0)) + " columns");
    Corvo::Sonogram::SetSpeedIndex(3);
}
BENCHMARK(BM_SonogramStep)->Arg(3)->Arg(4)->Arg(8);

void BM_SonogramRecolour(benchmark::State& state) {
    Corvo::Sonogram sonogram;
    sonogram.CheckPixelBufferSize(kRectangle, 0);
    int scheme = 0;
    for (auto _ : state) {
        Corvo::Sonogram::SetColourScheme(scheme ^= 1);
        sonogram.CheckPixelBufferSize(kRectangle, 0);
        benchmark::ClobberMemory();
    }
    Corvo::Sonogram::SetColourScheme(0);
}
BENCHMARK(BM_SonogramRecolour);

void BM_SonogramResize(benchmark::State& state) {
    Corvo::Sonogram sonogram;
    int width = kWidth;
    for (auto _ : state) {
        width ^= 1;
        sonogram.CheckPixelBufferSize({0.0f, 0.0f, static_cast<float>(width), kHeight}, 0);
        benchmark::ClobberMemory();
    }
}
BENCHMARK(BM_SonogramResize);

}  // namespace
