#include "Spectrum/Scales/SpectrumScales.h"

#include <algorithm>

namespace Corvo {
namespace {

// Mean value and mean square of each window over its period.
struct WindowShape {
    double mean, meanSquare;
};
constexpr WindowShape kWindows[kWindowTypes] = {
    {1.0, 1.0},
    {0.5, 1.0 / 3.0},
    {0.5, 0.5 * 0.5 + 0.5 * 0.5 / 2.0},
    {0.54, 0.54 * 0.54 + 0.46 * 0.46 / 2.0},
    {0.42, 0.42 * 0.42 + 0.5 * 0.5 / 2.0 + 0.08 * 0.08 / 2.0},
};

const WindowShape& ShapeOf(const SpectrumSettings& settings) {
    const int type = settings.window_type;
    return kWindows[type >= 0 && type < kWindowTypes ? type : 0];
}

double WindowLength(const SpectrumSettings& settings) {
    return std::max(std::min(settings.window_length, settings.fft_length), 1);
}

int Within(int value, int first, int last, int otherwise) {
    return value >= first && value <= last ? value : otherwise;
}

}  // namespace

FrequencyScale FrequencyScaleOf(const SpectrumSettings& settings) {
    return static_cast<FrequencyScale>(Within(settings.view_option_a, -1, 5, 1));
}

LevelScale LevelScaleOf(const SpectrumSettings& settings) {
    return static_cast<LevelScale>(Within(settings.view_option_b, 0, 2, 0));
}

CurveStyle CurveStyleOf(const SpectrumSettings& settings) {
    return static_cast<CurveStyle>(Within(settings.view_option_e, 1, 3, 1));
}

float VerticalRangeOf(const SpectrumSettings& settings) {
    constexpr float kRanges[] = {60.0f, 90.0f, 120.0f, 144.0f};
    return kRanges[Within(settings.view_option_d, 0, 3, 1)];
}

double FullScalePower(const SpectrumSettings& settings) {
    const double peak = ShapeOf(settings).mean * WindowLength(settings) / 2.0;
    return peak * peak;
}

double Padding(const SpectrumSettings& settings) {
    return std::max(settings.fft_length, 1) / WindowLength(settings);
}

double NoiseBandwidth(const SpectrumSettings& settings) {
    const WindowShape& shape = ShapeOf(settings);
    return shape.meanSquare / (shape.mean * shape.mean) * Padding(settings);
}

}  // namespace Corvo
