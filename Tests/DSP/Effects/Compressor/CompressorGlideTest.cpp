#include "DSP/Effects/Compressor/CompressorGlide.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <vector>

#include "DSP/Effects/Compressor/CompressorPresets.h"
#include "Support/Signals.h"

using namespace Corvo::DSP::CompressorPrivate;

// What is heard while curves glide.
namespace {

constexpr double kSmoothing = 0.0013;  // at 48 kHz

std::vector<double> Ladder(double stepDb) {
    std::vector<double> levels;
    for (double db = -95.0; db <= 0.0; db += stepDb) levels.push_back(std::pow(10.0, db / 20.0));
    return levels;
}

std::vector<double> Heard(const GlidingMap& map, const std::vector<double>& levels) {
    std::vector<double> outputs;
    const auto& curve = map.m_comp_map[0];
    for (const double level : levels) {
        const int i = map.SegmentAt(0, level);
        const double x = curve.X(i, map.factor), y = curve.Y(i, map.factor);
        const double width = curve.X(i + 1, map.factor) - x;
        outputs.push_back(y + (level - x) * (width > 0.0 ? (curve.Y(i + 1, map.factor) - y) / width : 1.0));
    }
    return outputs;
}

double DbApart(double a, double b) { return a == b ? 0.0 : std::abs(20.0 * std::log10(a / b)); }

CompMapStereo Both(const TransferCurve& curve) {
    CompMapStereo map;
    map.m_comp_map.fill(curve);
    return map;
}

std::vector<TransferCurve> Presets() {
    std::vector<TransferCurve> curves;
    for (const auto& preset : kCompressorPresets) curves.push_back(DrawCurve(preset));
    return curves;
}

// As many points as a curve can have, at random places of a bend.
TransferCurve Full(TestSupport::Random& random) {
    std::vector<double> levels{1.0};
    while (levels.size() + 1 < TransferCurve::kMaxPoints)
        levels.push_back(std::pow(10.0, -4.5 * random.Unit()));
    std::ranges::sort(levels);
    const double slope = 0.3 + 0.7 * random.Unit();
    TransferCurve curve;
    curve.Add(0.0, 0.0);
    for (const double level : levels) curve.Add(level, std::pow(level, slope));
    curve.UpdateSlopes();
    return curve;
}

}  // namespace

// Catches a first edit that redraws what is heard at once, and a glide that jumps on its way or at its end. A
// glide adds its share of the way, not of the level, every frame: steps are measured against the louder end.
TEST(CompressorGlide, BetweenAnyTwoPresetsNothingSteps) {
    const auto levels = Ladder(6.7);
    const auto presets = Presets();
    for (const auto& from : presets)
        for (const auto& to : presets) {
            GlidingMap map;
            map.SetOutFor(Both(to), kSmoothing);
            map.Arrive();
            const auto end = Heard(map, levels);
            map = {};
            map.SetOutFor(Both(from), kSmoothing);
            map.Arrive();
            const auto start = Heard(map, levels);
            map.SetOutFor(Both(to), kSmoothing);
            auto last = start;
            for (int frame = 0; frame < 150; ++frame) {
                const auto now = Heard(map, levels);
                for (std::size_t i = 0; i < levels.size(); ++i) {
                    const double step = std::abs(now[i] - last[i]) / std::max(start[i], end[i]);
                    ASSERT_LT(20.0 * std::log10(1.0 + step), frame == 0 ? 1e-9 : 0.1)
                        << &from - presets.data() << " to " << &to - presets.data() << ", level " << levels[i]
                        << ", frame " << frame;
                }
                last = now;
                map.factor *= 1.0 - kSmoothing;
            }
            map.factor = 1e-14;
            last = Heard(map, levels);
            map.Arrive();
            EXPECT_EQ(map.m_comp_map[0].count, to.count);
            for (std::size_t i = 0; i < levels.size(); ++i) ASSERT_LT(DbApart(end[i], last[i]), 1e-6);
        }
}

// Catches edits in the middle of a glide that jump, and a room that runs over.
TEST(CompressorGlide, EditsOnTheWayChangeNothingAtOnce) {
    const auto levels = Ladder(0.9);
    const auto presets = Presets();
    TestSupport::Random random(7);
    GlidingMap map;
    auto target = presets[1];
    map.SetOutFor(Both(target), kSmoothing);
    for (int edit = 0; edit < 400; ++edit) {
        map.factor *= std::pow(1.0 - kSmoothing, random.Below(100));
        if (edit % 3 == 0)
            target.MoveThreshold(-800 + random.Below(790));
        else
            target = edit % 2 ? Full(random) : presets[static_cast<std::size_t>(random.Below(42))];
        const auto before = Heard(map, levels);
        map.SetOutFor(Both(target), kSmoothing);
        const auto after = Heard(map, levels);
        for (std::size_t i = 0; i < levels.size(); ++i) ASSERT_LT(DbApart(before[i], after[i]), 0.1) << edit;
        ASSERT_LE(static_cast<std::size_t>(map.m_comp_map[0].count), GlidingCurve::kRoom) << edit;
    }
}
