#include <benchmark/benchmark.h>

#include <vector>

#include "Spectrum/Fft/CorvoFFT.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Spectrum/kivspectrum.h"
#include "Support/Signals.h"

#if DSP_HAVE_AUBIO
#include <aubio/aubio.h>
#endif

// What does one tuning of a window of 8192 samples cost? The peers take samples and transform them inside, so
// that BM_TunerFrame (windowing, transform, power and method) is what stands beside them. BM_Tuner is the
// method alone.
namespace {

constexpr int kRate = 44100, kLength = 8192;

enum Sound { kSawtooth, kSawtoothInNoise, kNoise, kSine };
constexpr const char* kSoundNames[] = {"sawtooth", "sawtooth in noise", "noise", "sine"};

std::vector<float> Samples(int sound) {
    constexpr double kHz = 110.3;
    std::vector<float> samples(kLength);
    if (sound == kSawtoothInNoise || sound == kNoise)
        samples = TestSupport::Noise<float>(kLength, sound == kNoise ? 0.25 : 0.1);
    if (sound == kNoise) return samples;
    const int partials = sound == kSine ? 1 : static_cast<int>(0.45 * kRate / kHz);
    for (int n = 1; n <= partials; ++n) {
        const auto partial = TestSupport::Sine<float>(kLength, kHz * n, kRate, 0.5 / n);
        for (std::size_t i = 0; i < samples.size(); ++i) samples[i] += partial[i];
    }
    return samples;
}

// An analyser whose tuner is on; its settings are class-wide.
struct Analyser : kivspectrum {
    explicit Analyser(const std::vector<float>& samples) {
        settings = {};
        settings.hop_length = 1;
        ToggleTuner();
        set_parameters(kRate);
        Feed(samples.data(), kLength, 1, 1);
    }
    ~Analyser() {
        settings = {};
        Tuner::SetDetectionMethod(0);
    }
};

void BM_Tuner(benchmark::State& state) {
    const auto samples = Samples(static_cast<int>(state.range(1)));
    Analyser analyser(samples);
    analyser.Refresh();
    const std::vector<float> power = analyser.GetPower(), transform(kLength);
    Tuner::SetDetectionMethod(static_cast<int>(state.range(0)));
    Tuner tuner;
    for (auto _ : state) {
        tuner.Tune(power, transform, kLength, kLength, kLength, kRate, true, false);
        benchmark::ClobberMemory();
    }
    state.SetLabel(kSoundNames[state.range(1)]);
}
BENCHMARK(BM_Tuner)
    ->ArgNames({"method", ""})
    ->ArgsProduct({{0, 1, 2, 3, 4}, {kSawtooth, kSawtoothInNoise}})
    ->Args({0, kNoise})
    ->Args({0, kSine});

void BM_TunerFrame(benchmark::State& state) {
    const auto samples = Samples(static_cast<int>(state.range(1)));
    Analyser analyser(samples);
    Tuner::SetDetectionMethod(static_cast<int>(state.range(0)));
    for (auto _ : state) {
        analyser.Feed(samples.data(), kLength, 1, 1);
        benchmark::DoNotOptimize(analyser.Refresh());
    }
    state.SetLabel(kSoundNames[state.range(1)]);
}
BENCHMARK(BM_TunerFrame)
    ->ArgNames({"method", ""})
    ->ArgsProduct({{0, 1, 2, 3, 4}, {kSawtooth, kSawtoothInNoise}});

#if DSP_HAVE_AUBIO
void BM_TunerPeerAubio(benchmark::State& state, const char* method, int sound) {
    const auto samples = Samples(sound);
    aubio_pitch_t* const pitch = new_aubio_pitch(method, kLength, kLength, kRate);
    fvec_t* const in = new_fvec(kLength);
    fvec_t* const out = new_fvec(1);
    for (std::size_t i = 0; i < samples.size(); ++i) in->data[i] = samples[i];
    for (auto _ : state) {
        aubio_pitch_do(pitch, in, out);
        benchmark::DoNotOptimize(out->data[0]);
    }
    state.SetLabel(kSoundNames[sound]);
    del_fvec(out);
    del_fvec(in);
    del_aubio_pitch(pitch);
}
BENCHMARK_CAPTURE(BM_TunerPeerAubio, yinfft, "yinfft", kSawtooth);
BENCHMARK_CAPTURE(BM_TunerPeerAubio, yinfft_in_noise, "yinfft", kSawtoothInNoise);
BENCHMARK_CAPTURE(BM_TunerPeerAubio, yinfast, "yinfast", kSawtooth);
BENCHMARK_CAPTURE(BM_TunerPeerAubio, yin, "yin", kSawtooth);
#endif

}  // namespace
