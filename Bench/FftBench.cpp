#include <benchmark/benchmark.h>

#include <vector>

#include "Spectrum/Fft/CorvoFFT.h"
#include "Support/Signals.h"

#if DSP_HAVE_FFTW3 && DSP_HAVE_FFTW3F
#include <fftw3.h>
#endif

// What does a real forward transform cost beside FFTW's (estimated plans)? Ours works in place and gets a
// fresh copy of its input each time; BM_FftCopy is what to subtract.
namespace {

constexpr int kShortest = 256, kLongest = 65536;

template <typename T>
std::vector<T> Input(const benchmark::State& state) {
    return TestSupport::Noise<T>(static_cast<std::size_t>(state.range(0)));
}

template <typename T>
void BM_Fft(benchmark::State& state) {
    const auto input = Input<T>(state);
    CorvoFFT fft;
    fft.AllocateReal(static_cast<int>(state.range(0)), 0);
    auto data = input;
    for (auto _ : state) {
        data = input;
        fft.DoFFTReal(data.data(), 0, 0);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * state.range(0));
}
BENCHMARK_TEMPLATE(BM_Fft, float)->RangeMultiplier(2)->Range(kShortest, kLongest);
BENCHMARK_TEMPLATE(BM_Fft, double)->RangeMultiplier(2)->Range(kShortest, kLongest);

template <typename T>
void BM_FftCopy(benchmark::State& state) {
    const auto input = Input<T>(state);
    auto data = input;
    for (auto _ : state) {
        data = input;
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * state.range(0));
}
BENCHMARK_TEMPLATE(BM_FftCopy, float)->RangeMultiplier(2)->Range(kShortest, kLongest);
BENCHMARK_TEMPLATE(BM_FftCopy, double)->RangeMultiplier(2)->Range(kShortest, kLongest);

template <typename T>
void BM_FftThereAndBackComplex(benchmark::State& state) {
    const int points = static_cast<int>(state.range(0));
    CorvoFFT fft;
    fft.Allocate(points, 1);
    auto data = TestSupport::Noise<T>(2 * static_cast<std::size_t>(points));
    for (auto _ : state) {
        fft.DoFFT(data.data(), 0, 0);
        fft.DoIFFT(data.data(), 0, 0);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * state.range(0));
}
BENCHMARK_TEMPLATE(BM_FftThereAndBackComplex, float)->Arg(4096);
BENCHMARK_TEMPLATE(BM_FftThereAndBackComplex, double)->Arg(4096);

#if DSP_HAVE_FFTW3 && DSP_HAVE_FFTW3F
template <typename T>
struct Fftw;
template <>
struct Fftw<float> {
    using Plan = fftwf_plan;
    static Plan Make(int n, float* in, float* out) {
        return fftwf_plan_dft_r2c_1d(n, in, reinterpret_cast<fftwf_complex*>(out), FFTW_ESTIMATE);
    }
    static void Run(Plan plan) { fftwf_execute(plan); }
    static void Destroy(Plan plan) { fftwf_destroy_plan(plan); }
};
template <>
struct Fftw<double> {
    using Plan = fftw_plan;
    static Plan Make(int n, double* in, double* out) {
        return fftw_plan_dft_r2c_1d(n, in, reinterpret_cast<fftw_complex*>(out), FFTW_ESTIMATE);
    }
    static void Run(Plan plan) { fftw_execute(plan); }
    static void Destroy(Plan plan) { fftw_destroy_plan(plan); }
};

template <typename T>
void BM_FftPeerFftw(benchmark::State& state) {
    auto input = Input<T>(state);
    std::vector<T> output(input.size() + 2);
    const auto plan = Fftw<T>::Make(static_cast<int>(state.range(0)), input.data(), output.data());
    for (auto _ : state) {
        Fftw<T>::Run(plan);
        benchmark::ClobberMemory();
    }
    Fftw<T>::Destroy(plan);
    state.SetItemsProcessed(state.iterations() * state.range(0));
}
BENCHMARK_TEMPLATE(BM_FftPeerFftw, float)->RangeMultiplier(2)->Range(kShortest, kLongest);
BENCHMARK_TEMPLATE(BM_FftPeerFftw, double)->RangeMultiplier(2)->Range(kShortest, kLongest);
#endif

}  // namespace
