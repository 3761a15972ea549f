#include "DSP/Effects/Compressor/CompressorCore.h"

#include <algorithm>
#include <cmath>

namespace Corvo::DSP::CompressorPrivate {

int GlidingCurve::SegmentAt(double level, double factor) const {
    int i = 0;
    while (i < count - 2 && level > X(i + 1, factor)) ++i;
    return i;
}

double GlidingCurve::LevelAt(double level, double factor) const {
    const int i = SegmentAt(level, factor);
    const double from = X(i, factor), out = Y(i, factor), width = X(i + 1, factor) - from;
    return (level - from) * (width > 0.0 ? (Y(i + 1, factor) - out) / width : 1.0) + out;
}

int GlideFrames(double factor, double smoothing) {
    constexpr double kEnd = 1e-14;
    if (!(factor > kEnd)) return 0;
    if (!(smoothing < 1.0)) return 1;
    return static_cast<int>(std::min(std::ceil(std::log(kEnd / factor) / std::log1p(-smoothing)), 1e9));
}

bool GlidingMap::SetOutFor(const CompMapStereo& target, double smoothing) {
    const auto same = [](const GlidingCurve& curve, const TransferCurve& wanted) {
        if (curve.count != wanted.count) return false;
        std::size_t i = 0;
        return std::all_of(wanted.begin(), wanted.end(), [&](const CurvePoint& point) {
            const bool equal = curve.x[i] == point.x && curve.y[i] == point.y;
            ++i;
            return equal;
        });
    };
    if (same(m_comp_map[0], target.m_comp_map[0]) && same(m_comp_map[1], target.m_comp_map[1])) return false;

    bool replaced = false;
    for (std::size_t channel = 0; channel < 2; ++channel) {
        auto& curve = m_comp_map[channel];
        const auto& wanted = target.m_comp_map[channel];
        const auto count = static_cast<std::size_t>(wanted.count);
        const bool otherPlaces = curve.count != wanted.count;
        if (otherPlaces) {
            for (std::size_t i = 0; i < count; ++i)
                m_levels[i] =
                    curve.count < 2 ? wanted.points[i].y : curve.LevelAt(wanted.points[i].x, factor);
        }
        for (std::size_t i = 0; i < count; ++i) {
            const auto& point = wanted.points[i];
            const int at = static_cast<int>(i);
            curve.offsetX[i] = otherPlaces ? 0.0 : curve.X(at, factor) - static_cast<double>(point.x);
            curve.offsetY[i] =
                (otherPlaces ? m_levels[i] : curve.Y(at, factor)) - static_cast<double>(point.y);
            curve.x[i] = point.x;
            curve.y[i] = point.y;
        }
        curve.count = wanted.count;
        for (std::size_t i = 0; i + 1 < count; ++i) {
            const double width = curve.x[i + 1] - curve.x[i];
            curve.slope[i] = width > 0.0 ? (curve.y[i + 1] - curve.y[i]) / width : 1.0;
        }
        replaced = replaced || otherPlaces;
    }
    factor = 1.0;
    framesLeft = GlideFrames(factor, smoothing);
    return replaced;
}

void GlidingMap::Arrive() {
    factor = 0.0;
    framesLeft = 0;
}

}  // namespace Corvo::DSP::CompressorPrivate
