#include "DSP/Effects/Denoiser/ReducerTables.h"

#include <algorithm>
#include <cmath>
#include <numbers>
#include <vector>

#include "DSP/Parts/SharedTables.h"
#include "Spectrum/Fft/SplitTransform.h"

namespace Corvo::DSP::Denoising {
namespace {

// The frequency response of a window that is shorter than the tracker's, at that one's bins, from its middle
// upwards, squared and scaled so that it turns the noise's power in the one's bins into that in the other's.
Floats Response(const WindowShape& track, const WindowShape& shorter) {
    Fft::SplitTransform transform;
    transform.Prepare(track.length);
    const auto length = static_cast<std::size_t>(track.length);
    Floats window(length), re(length / 2), im(length / 2), work(transform.WorkFloats(track.length));
    std::ranges::copy(shorter.analysis, window.begin());
    transform.Forward(window.data(), re.data(), im.data(), work.data());
    im[0] = 0.0f;  // the highest bin's place
    const auto ratio = static_cast<std::size_t>(track.length / shorter.length);
    const float scale = static_cast<float>(shorter.length) / static_cast<float>(track.length);
    // By Parseval: the sum over all bins is length * sum(window^2).
    const double total = 0.5 * static_cast<double>(shorter.length) * track.length;
    Floats response(kResponseBins * ratio + 1);
    for (std::size_t i = 0; i < response.size(); ++i)
        response[i] = scale * (re[i] * re[i] + im[i] * im[i]) / static_cast<float>(total);
    return response;
}

}  // namespace

void WindowShape::Prepare(int samples) {
    length = samples;
    const auto count = static_cast<std::size_t>(samples);
    analysis.resize(count);
    synthesis.resize(count);
    for (std::size_t i = 0; i < count; ++i) {
        const double turn = 2.0 * std::numbers::pi * static_cast<double>(i) / static_cast<double>(count);
        const double window = std::sqrt(0.5 - 0.5 * std::cos(turn));
        analysis[i] = static_cast<float>(window);
        synthesis[i] = static_cast<float>(0.5 * window);  // four squared windows add up to 2
    }
}

ReducerTables::ReducerTables(double forRate) : rate(forRate), scale(Scale::Of(forRate)) {
    ReserveFor(m_memory, [&](Arena& arena) {
        for (std::size_t i = 0; i < kLengths; ++i) bins[i].Prepare(arena, scale(kLearnedLengths[i]));
    });
    for (std::size_t i = 0; i < kLengths; ++i) {
        shapes[i].Prepare(bins[i].length);
        bins[i].SetRate(rate, scale(kBlendLength));
    }
    for (std::size_t i = 0; i < kTrackIndex; ++i) responses[i] = Response(shapes[kTrackIndex], shapes[i]);
    tracker.Prepare(static_cast<std::size_t>(shapes[kTrackIndex].length) / 2 + 1);
}

std::shared_ptr<const ReducerTables> TablesFor(double rate) { return SharedTables<ReducerTables>(rate); }

}  // namespace Corvo::DSP::Denoising
