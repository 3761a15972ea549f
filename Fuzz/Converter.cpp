// The sample-rate converter: any factors, formats, strides and cuts, with copies and restarts between.
#include "DSP/Resampler/SamplingFrequencyConverter.h"
#include "Target.h"

namespace {

using Fuzz::Input;

struct Stream {
    Input& input;
    SamplingFrequencyConverter& converter;
    int channels;
    std::vector<CDither<double>> dithers{};

    template <typename In, typename Out>
    void Convert() {
        const int frames = input.Between(0, 300);
        const int inStride = channels * In::kBytes + (input.Flag() ? 0 : channels * input.Between(0, 5));
        const int outStride = channels * Out::kBytes;
        const auto most = static_cast<std::int64_t>(frames) * converter.up / std::max(converter.down, 1) + 1;
        if (most > 1 << 20) return;
        auto in = input.Samples<float>(static_cast<std::size_t>(frames * inStride) / sizeof(float) + 1);
        std::vector<char> out(static_cast<std::size_t>(most * outStride));
        auto* const dither = dithers.empty() ? nullptr : dithers.data();
        const int written = converter.sfreq_conversion_core_block<In, Out>(
            frames, reinterpret_cast<char*>(in.data()), out.data(), channels, inStride, outStride, dither);
        Fuzz::Require(written >= 0 && written <= most, "no more is written than announced");
    }
};

constexpr void (Stream::*kFormats[])() = {
    &Stream::Convert<tipo_floatbit, tipo_floatbit_outd>,
    &Stream::Convert<tipo_doublebit, tipo_doublebit_outd>,
    &Stream::Convert<tipo_16bit, tipo_16bit_outd>,
    &Stream::Convert<tipo_24bit, tipo_24bit_outd>,
    &Stream::Convert<tipo_floatbit, tipo_16bit_outd>,
    &Stream::Convert<tipo_doublebit, tipo_24bit_outd>,
};

bool SetUp(Input& input, SamplingFrequencyConverter& converter) {
    static constexpr int kRates[]{44100, 48000, 8000, 96000, 192000, 11025, 1, 0, -1};
    const int kind = input.Between(0, 2);
    const auto number = [&] {
        return kind == 0 ? input.OneOf(kRates) : input.Between(-1, kind == 1 ? 60000 : 400);
    };
    const int from = number(), to = number();
    return (kind < 2 ? converter.InitConversion(from, to) : converter.InitConversionByFactors(from, to)) == 1;
}

const Fuzz::Target target("Converter", [](Input& input) {
    static constexpr DitherCurve kCurves[]{DitherCurve::Flat, DitherCurve::Gentle, DitherCurve::Strong};
    SamplingFrequencyConverter converter, design;
    if (!SetUp(input, converter)) return;
    Stream stream{.input = input, .converter = converter, .channels = input.Between(1, 6)};
    converter.Init(stream.channels);
    if (input.Flag()) {
        const auto curve = input.OneOf(kCurves);
        stream.dithers.assign(static_cast<std::size_t>(stream.channels),
                              MakeDither(curve, input.Flag() ? 16 : 24));
    }
    design = converter;
    for (int step = 0; step < 60 && !input.AtEnd(); ++step) switch (input.Between(0, 9)) {
            case 0:
                converter.Restart(design);
                break;
            case 1: {
                // Zeroed histories start a channel afresh.
                const auto channel = static_cast<std::size_t>(input.Between(0, stream.channels - 1));
                std::ranges::fill(converter.inputHistory[channel], 0.0);
                std::ranges::fill(converter.outputHistory[channel], 0.0);
                break;
            }
            default:
                (stream.*input.OneOf(kFormats))();
        }
    converter.FreeRings();
});

}  // namespace
