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

// Catches edits that change at once what is heard, in the middle of a glide too, ends that jump or keep
// points of the way, and a room that runs over.
TEST(CompressorGlide, NothingJumpsWhereItSetsOutOrArrives) {
    std::vector<double> levels;
    for (double db = -95.0; db <= 0.0; db += 0.9) levels.push_back(std::pow(10.0, db / 20.0));
    TestSupport::Random random(7);
    GlidingMap map;
    auto target = DrawCurve(kCompressorPresets[1]);
    map.SetOutFor(Both(target), kSmoothing);
    const auto expectNoJump = [&](double most, auto change) {
        const auto before = Heard(map, levels);
        change();
        const auto after = Heard(map, levels);
        for (std::size_t i = 0; i < levels.size(); ++i) ASSERT_LT(DbApart(before[i], after[i]), most);
    };
    for (int edit = 0; edit < 2000 && !testing::Test::HasFailure(); ++edit) {
        SCOPED_TRACE(edit);
        map.factor *= edit % 3 == 2 ? 1e-14 : std::pow(1.0 - kSmoothing, random.Below(100));
        if (edit % 3 == 2) {
            expectNoJump(1e-6, [&] { map.Arrive(); });
            EXPECT_EQ(map.m_comp_map[0].count, target.count);
        }
        const bool few = target.count < 200;
        if (random.Below(3) == 0)
            target.MoveThreshold(-800 + random.Below(790));
        else
            target = random.Below(2)
                         ? Full(random)
                         : DrawCurve(kCompressorPresets[static_cast<std::size_t>(random.Below(42))]);
        // Where points are many, some are left out.
        const bool exact = edit % 3 == 2 && few && target.count < 200;
        expectNoJump(exact ? 1e-9 : 0.1, [&] { map.SetOutFor(Both(target), kSmoothing); });
        ASSERT_LE(static_cast<std::size_t>(map.m_comp_map[0].count), GlidingCurve::kRoom);
    }
}
