#include <benchmark/benchmark.h>

#include <array>
#include <stdexcept>
#include <string>
#include <vector>

#include "DSP/Resampler/SamplingFrequencyConverter.h"
#include "Support/Signals.h"

#if DSP_HAVE_SOXR
#include <soxr.h>
#endif
#if DSP_HAVE_LIBSWRESAMPLE
extern "C" {
#include <libavutil/channel_layout.h>
#include <libswresample/swresample.h>
}
#endif

// What does a stereo input frame cost, float to float, beside the usual converters?
namespace {

constexpr std::size_t kFrames = 512;

struct Rates {
    int in, out;
};
constexpr std::array kRates{Rates{44100, 48000}, Rates{48000, 44100}, Rates{48000, 96000},
                            Rates{96000, 44100}};

Rates SetRates(benchmark::State& state) {
    const Rates rates = kRates[static_cast<std::size_t>(state.range(0))];
    state.SetLabel(std::to_string(rates.in) + " -> " + std::to_string(rates.out));
    return rates;
}

// Converts the same block again and again; the output is as large as any of the rates needs.
template <typename Convert>
void Run(benchmark::State& state, const std::vector<float>& input, Convert convert) {
    std::vector<float> output(2 * (4 * input.size() + 64));
    for (auto _ : state) {
        convert(input.data(), output.data(), output.size() / 2);
        benchmark::DoNotOptimize(output.data());
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * static_cast<std::int64_t>(input.size() / 2));
}

std::vector<float> StereoNoise(std::size_t frames = kFrames) { return TestSupport::Noise<float>(2 * frames); }

template <typename In, typename Out>
void Convert(SamplingFrequencyConverter& converter, const void* in, void* out, std::size_t frames,
             CDither<double>* dither = nullptr) {
    converter.sfreq_conversion_core_block<In, Out>(
        static_cast<int>(frames), const_cast<char*>(static_cast<const char*>(in)), static_cast<char*>(out), 2,
        2 * In::kBytes, 2 * Out::kBytes, dither);
}

void RunConverter(benchmark::State& state, SamplingFrequencyConverter& converter,
                  const std::vector<float>& input) {
    converter.Init(2);
    Run(state, input, [&](const float* in, float* out, std::size_t) {
        Convert<tipo_floatbit, tipo_floatbit_outd>(converter, in, out, input.size() / 2);
    });
    converter.FreeRings();
}

void BM_Converter(benchmark::State& state) {
    const Rates rates = SetRates(state);
    SamplingFrequencyConverter converter;
    converter.InitConversion(rates.in, rates.out);
    RunConverter(state, converter, StereoNoise());
}
BENCHMARK(BM_Converter)->DenseRange(0, kRates.size() - 1);

void BM_ConverterSmallBlocks(benchmark::State& state) {
    const Rates rates = SetRates(state);
    SamplingFrequencyConverter converter;
    converter.InitConversion(rates.in, rates.out);
    RunConverter(state, converter, StereoNoise(64));
}
BENCHMARK(BM_ConverterSmallBlocks)->DenseRange(0, kRates.size() - 1);

// The exact ratio, for files: does its larger table still fit?
void BM_ConverterExact147To160(benchmark::State& state) {
    SamplingFrequencyConverter converter;
    converter.InitConversionByFactors(160, 147);
    RunConverter(state, converter, StereoNoise());
}
BENCHMARK(BM_ConverterExact147To160);

// Digital silence after sound: the filter rings out into denormals.
void BM_ConverterSilence(benchmark::State& state) {
    SamplingFrequencyConverter converter;
    converter.InitConversion(44100, 48000);
    converter.Init(2);
    const auto sound = StereoNoise();
    std::vector<float> output(8 * kFrames);
    Convert<tipo_floatbit, tipo_floatbit_outd>(converter, sound.data(), output.data(), kFrames);
    RunConverter(state, converter, std::vector<float>(2 * kFrames));
}
BENCHMARK(BM_ConverterSilence);

template <typename In, typename Out>
void BM_ConverterFormats(benchmark::State& state) {
    SamplingFrequencyConverter converter;
    converter.InitConversion(44100, 48000);
    converter.Init(2);
    const auto dithered = static_cast<DitherCurve>(state.range(0));
    std::array dither{MakeDither(dithered, 8 * Out::kBytes), MakeDither(dithered, 8 * Out::kBytes)};
    const auto input = TestSupport::Noise<double>(2 * kFrames);
    std::vector<char> in(2 * kFrames * In::kBytes);
    for (std::size_t i = 0; i < input.size(); ++i) In::Write(input[i], &in[i * In::kBytes]);
    Run(state, StereoNoise(), [&](const float*, float* out, std::size_t) {
        Convert<In, Out>(converter, in.data(), out, kFrames, dither.data());
    });
    converter.FreeRings();
}
BENCHMARK_TEMPLATE(BM_ConverterFormats, tipo_16bit, tipo_16bit_outd)->DenseRange(0, 3);
BENCHMARK_TEMPLATE(BM_ConverterFormats, tipo_24bit, tipo_24bit_outd)->Arg(0);
BENCHMARK_TEMPLATE(BM_ConverterFormats, tipo_doublebit, tipo_doublebit_outd)->Arg(0);

#if DSP_HAVE_SOXR
void BM_PeerSoxr(benchmark::State& state) {
    const Rates rates = SetRates(state);
    const auto quality = soxr_quality_spec(SOXR_HQ, 0);
    const auto runtime = soxr_runtime_spec(1);
    soxr_t soxr = soxr_create(rates.in, rates.out, 2, nullptr, nullptr, &quality, &runtime);
    if (!soxr) throw std::runtime_error("soxr_create");
    Run(state, StereoNoise(), [&](const float* in, float* out, std::size_t limit) {
        std::size_t read = 0, written = 0;
        soxr_process(soxr, in, kFrames, &read, out, limit, &written);
    });
    soxr_delete(soxr);
}
BENCHMARK(BM_PeerSoxr)->DenseRange(0, kRates.size() - 1);
#endif

#if DSP_HAVE_LIBSWRESAMPLE
void BM_PeerSwresample(benchmark::State& state) {
    const Rates rates = SetRates(state);
    AVChannelLayout stereo = AV_CHANNEL_LAYOUT_STEREO;
    SwrContext* swr = nullptr;
    if (swr_alloc_set_opts2(&swr, &stereo, AV_SAMPLE_FMT_FLT, rates.out, &stereo, AV_SAMPLE_FMT_FLT, rates.in,
                            0, nullptr) < 0 ||
        swr_init(swr) < 0)
        throw std::runtime_error("swr_init");
    Run(state, StereoNoise(), [&](const float* in, float* out, std::size_t limit) {
        const auto* inBytes = reinterpret_cast<const std::uint8_t*>(in);
        auto* outBytes = reinterpret_cast<std::uint8_t*>(out);
        swr_convert(swr, &outBytes, static_cast<int>(limit), &inBytes, kFrames);
    });
    swr_free(&swr);
}
BENCHMARK(BM_PeerSwresample)->DenseRange(0, kRates.size() - 1);
#endif

}  // namespace
