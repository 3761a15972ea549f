#include "DSP/Effects/Compressor/CompressorPresets.h"

#include <algorithm>
#include <cmath>
#include <numbers>

#include "DSP/Effects/Compressor/CompressorCurve.h"

namespace Corvo::DSP::CompressorPrivate {
namespace {

constexpr double kDbPerNeper = 20.0 * std::numbers::log10e;
// A chord leaves a power law x^p by p(p - 1)/8 times the square of its logarithmic width; this much of it,
// 0.026 dB, is allowed.
constexpr double kChordError = 0.003;
constexpr int kUnityOctaves = 15;

double Level(double db) { return std::exp(db / kDbPerNeper); }

double OutputDb(const CompressorPreset& preset, double inputDb) {
    double output = inputDb;
    if (preset.ratio != 1.0)
        output += (1.0 / preset.ratio - 1.0) * KneeRamp(inputDb - preset.threshold, preset.knee);
    const auto& gate = preset.gate;
    if (gate.range > 0.0)
        output -= std::min((gate.slope - 1.0) * KneeRamp(gate.threshold - inputDb, gate.knee), gate.range);
    return output;
}

class CurveDrawer {
public:
    explicit CurveDrawer(const CompressorPreset& preset) : m_preset(preset) { m_curve.Add(0.0, 0.0); }

    void Point(double db) {
        // The threshold reads as it was noted down.
        const double x = db == m_preset.threshold
                             ? LevelFromTenths(static_cast<std::int32_t>(std::lround(db * 10.0)))
                             : Level(db);
        m_curve.Add(x, x * Level(OutputDb(m_preset, db) - db));
    }

    // From one level to another with both ends, fine enough for a line of this slope in decibels.
    void Line(double fromDb, double toDb, double slope, int atLeast) {
        const double width =
            kDbPerNeper * std::sqrt(8.0 * kChordError / std::max(std::abs(slope * (slope - 1.0)), 0.01));
        const int pieces = std::max(static_cast<int>(std::ceil((toDb - fromDb) / width)), atLeast);
        for (int i = 0; i <= pieces; ++i) Point(fromDb + (toDb - fromDb) * i / pieces);
    }

    // A point per octave where output equals input. At powers of two the curve's arithmetic is exact, so
    // the gain is 1 to the last bit.
    void Unity(double fromLevel, double toLevel) {
        for (int octave = kUnityOctaves; octave >= 0; --octave)
            if (const double level = std::ldexp(1.0, -octave); level > fromLevel && level < toLevel)
                m_curve.Add(level, level);
    }

    TransferCurve Finish() {
        m_curve.UpdateSlopes();
        return m_curve;
    }

private:
    const CompressorPreset& m_preset;
    TransferCurve m_curve;
};

}  // namespace

TransferCurve DrawCurve(const CompressorPreset& preset) {
    CurveDrawer draw(preset);
    double unityFrom = 0.0;
    if (const auto& gate = preset.gate; gate.range > 0.0) {
        // Under this level the range is reached, and the curve is parallel to unity: a line to the origin.
        const double floorDb = gate.threshold - gate.range / (gate.slope - 1.0);
        const double openDb = gate.threshold + gate.knee / 2.0;
        draw.Line(floorDb, openDb, gate.slope, 8);
        unityFrom = Level(openDb);
    }
    if (preset.ratio == 1.0) {
        draw.Unity(unityFrom, 2.0);
        return draw.Finish();
    }
    const double bendDb = preset.threshold - preset.knee / 2.0;
    draw.Unity(unityFrom, Level(bendDb));
    if (preset.knee > 0.0)
        draw.Line(bendDb, preset.threshold, 2.0, 8);
    else
        draw.Point(preset.threshold);
    // The point that stands twice marks the threshold.
    draw.Line(preset.threshold, 0.0, 1.0 / preset.ratio, 32);
    return draw.Finish();
}

}  // namespace Corvo::DSP::CompressorPrivate
