// Conversion: a stream at 44.1 kHz becomes one at 48 kHz, from floats to 16 bits, dithered.
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <numbers>
#include <vector>

#include "DSP/Resampler/AlignedConverter.h"

static double Sine(double seconds) { return 0.5 * std::sin(2.0 * std::numbers::pi * 1000.0 * seconds); }

int main() {
    AlignedConverter converter({.inRate = 44100,
                                .outRate = 48000,
                                .channels = 1,
                                .in = StoredSample::Float,
                                .out = StoredSample::Int16,
                                .dither = DitherCurve::Flat});

    // A second of a sine, in blocks of any size. The converter keeps what it needs between them.
    constexpr int block = 441;
    std::vector<float> in(block);
    std::vector<std::int16_t> piece(static_cast<std::size_t>(converter.MostFrames(block))), out;
    const auto keep = [&](int frames) { out.insert(out.end(), piece.begin(), piece.begin() + frames); };
    for (int position = 0; position < 44100; position += block) {
        for (int i = 0; i < block; ++i) in[i] = static_cast<float>(Sine((position + i) / 44100.0));
        keep(converter.Convert(in.data(), block, piece.data()));
    }
    // The filter still holds the end.
    while (const int frames = converter.Finish(piece.data(), static_cast<int>(piece.size()))) keep(frames);

    // The filter's delay is taken out, so the output is the same sine at the other rate. Without the ends:
    double error = 0.0;
    for (int i = 480; i < 47520; ++i) error += std::pow(out[i] / 32768.0 - Sine(i / 48000.0), 2);
    const double decibels = 10.0 * std::log10(error / (47520 - 480));
    std::printf("44100 frames became %zu, times %d / %d; what differs from the ideal: %.0f dB\n", out.size(),
                converter.Up(), converter.Down(), decibels);
    return out.size() == 48000 && decibels < -50.0 ? 0 : 1;
}
