#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <numbers>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "Drawing/Views/Look.h"
#include "Drawing/Views/Rectangles.h"
#include "Drawing/Views/ShownAnalyser.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Support/RecordingDrawing.h"

// What can be read off the pictures: labels, curve, needle, arrows, lines and readouts against what was
// heard.

using namespace Corvo;
using Recording = TestSupport::RecordingDrawing;

namespace {

constexpr RectF kWhole{0, 0, 1280, 720};
constexpr double kRange = 90.0;  // dB, of the settings at the start

constexpr double kNothing = 999.0;

// What a label or readout says: its first number, times 1000 behind a "k"; kNothing without one.
double ValueOf(std::string text) {
    if (text.starts_with("\u2212")) text.replace(0, std::string_view("\u2212").size(), "-");
    char* end = nullptr;
    const double value = std::strtod(text.c_str(), &end);
    const std::string_view unit(end);
    if (end == text.c_str()) return kNothing;
    return unit.starts_with("k") || unit.starts_with(" k") ? 1000.0 * value : value;
}

// The part of a readout, whose parts stand three blanks apart, that ends with the unit.
double Reading(const std::string& readout, const std::string& unit) {
    const std::size_t end = (readout + "   ").find(unit + "   "), before = readout.rfind("   ", end);
    const std::size_t from = before == std::string::npos ? 0 : before + 3;
    return end == std::string::npos ? kNothing : ValueOf(readout.substr(from));
}

double Cents(double hz, double cents) { return hz * std::exp2(cents / 1200.0); }

class Readings : public ViewTest {
protected:
    using Target = Recording::DrawTarget;
    using Drawn = Recording::Drawn;

    Drawn Show(void (kivspectrum::*draw)(Target&, const RectF&), const RectF& rectangle = kWhole) {
        Target target;
        (analyser.*draw)(target, rectangle);
        return target;
    }
    static RectF PlotOf(const Drawn& drawn) {
        return std::ranges::find_if(drawn.rectangles, [](const auto& r) { return r.colour == Look::kPlot; })
            ->box;
    }
    Drawn ShowSpectrum() {
        const Drawn drawn = Show(&kivspectrum::DoDrawSpectrum<Recording>);
        m_plot = PlotOf(drawn);
        return drawn;
    }
    Drawn ShowSonogram() {
        const Drawn drawn = Show(&kivspectrum::DrawSonogramComponents<Recording>);
        m_plot = drawn.images.front().box;
        return drawn;
    }
    void Tune(double hz) {
        analyser.SetTunerOn(true);
        analyser.ObserverUpdate();
        m_shown.Hear(hz, 0.5, 1.0);
        ASSERT_TRUE(analyser.GetTuner()->IsTuned());
    }
    void HearIntoSonogram(double hz, double amplitude) {
        analyser.ShowSonogram(true);
        ShowSonogram();  // its size
        m_shown.Hear(hz, amplitude, 1.0);
    }
    CoordinatesAndFrequencies Map() const {
        return SpectrumMap(m_plot, kivspectrum::settings, ShownAnalyser::kRate);
    }
    float LevelY(double level) const { return m_plot.y - static_cast<float>(level / kRange) * m_plot.height; }
    // How far up the sonogram's picture a frequency is.
    float SonogramY(double hz) const {
        const auto& sonogram = *analyser.GetSonogram();
        const float rows = static_cast<float>(sonogram.GetBitmap().height);
        return Bottom(m_plot) - sonogram.GetFrequencyMap().FrequencyToX(hz) * m_plot.height / rows;
    }
    float SonogramX(double seconds) const {
        return Right(m_plot) + static_cast<float>(seconds * Sonogram::GetColumnsPerSecond());
    }
    // Several labels are where stands(box) says, and each of them where place(value) puts it.
    template <typename Stands, typename Place>
    static void ExpectLabels(const Drawn& drawn, bool upright, Stands stands, Place place) {
        int labels = 0;
        for (const auto& [text, box, middle] : drawn.texts) {
            if (ValueOf(text) == kNothing || !stands(box)) continue;
            EXPECT_NEAR(upright ? middle.y : middle.x, place(ValueOf(text)), 1.0f) << text;
            ++labels;
        }
        EXPECT_GE(labels, 5);
    }

    ShownAnalyser m_shown;
    kivspectrum& analyser = m_shown.analyser;
    RectF m_plot{};
};

// Catches scales that run the wrong way or by other values than their labels say.
TEST_F(Readings, SpectrumLabelsStandAtTheirPlaces) {
    for (const int scale : {0, 1, 4}) {
        SCOPED_TRACE(scale);
        kivspectrum::settings.view_option_a = scale;
        const auto drawn = ShowSpectrum();
        ExpectLabels(
            drawn, false, [&](const RectF& b) { return b.y > Bottom(m_plot); },
            [&](double hz) { return Map().FrequencyToX(hz); });
        ExpectLabels(
            drawn, true, [&](const RectF& b) { return Right(b) < m_plot.x; },
            [&](double level) { return LevelY(level); });
    }
}

// The same, and a picture whose empty part is taken for silence.
TEST_F(Readings, SonogramLabelsStandAtTheirPlaces) {
    HearIntoSonogram(1000.0, 0.5);
    const auto drawn = ShowSonogram();
    const auto beside = [&](const RectF& b) { return b.y < Bottom(m_plot) + 2.0f; };
    ExpectLabels(
        drawn, true, [&](const RectF& b) { return beside(b) && Right(b) < m_plot.x; },
        [&](double hz) { return SonogramY(hz); });
    ExpectLabels(
        drawn, true, [&](const RectF& b) { return beside(b) && b.x > Right(m_plot); },
        [&](double level) { return LevelY(level); });
    ExpectLabels(
        drawn, false, [&](const RectF& b) { return !beside(b); },
        [&](double seconds) { return SonogramX(seconds); });
    const RectF empty = PlotOf(drawn);
    EXPECT_NEAR(Right(empty), SonogramX(-1.0), 3.0f);
}

// Catches an area that is not closed on the ground, and bars of another height than the curve.
TEST_F(Readings, CurveHasItsStyle) {
    kivspectrum::settings.time_smoothing = 0;
    m_shown.Hear(1000.0, 0.1);
    kivspectrum::settings.view_option_e = 2;
    const auto filled = ShowSpectrum();
    ASSERT_EQ(filled.polygons.size(), 1u);
    const auto& area = filled.polygons[0].points;
    ASSERT_EQ(area.size(), filled.lines.back().points.size() + 2);
    EXPECT_EQ(area.back().x, filled.lines.back().points.front().x);
    EXPECT_EQ(area.back().y, Bottom(m_plot));
    kivspectrum::settings.view_option_e = 3;
    float top = Bottom(m_plot);
    for (const auto& [box, colour] : ShowSpectrum().rectangles)
        if (colour == Look::kCurve) top = std::min(top, box.y);
    EXPECT_NEAR(top, LevelY(-20.0), 5.0f);
}

// Catches a trace that is missing, upside down or without regard to time.
TEST_F(Readings, TraceStandsInThePitchsRow) {
    Tune(440.0);
    HearIntoSonogram(440.0, 0.5);
    std::vector<PointF> heard;
    for (const auto& [points, colour] : ShowSonogram().lines)
        if (colour == Look::kTrace && points.size() > heard.size()) heard = points;
    ASSERT_GE(heard.size(), 10u);
    for (const PointF& point : heard) EXPECT_NEAR(point.y, SonogramY(440.0), 1.0f);
    EXPECT_NEAR(heard.back().x, Right(m_plot), 2.0f);
}

// Catches gaps where a note went unheard for a tenth of a second, lines across silence or to another note, a
// line for what sounded for a moment only, one without its beginning, and one that ends at a moment of
// something else.
TEST_F(Readings, TraceGoesOnOverAMoment) {
    HearIntoSonogram(440.0, 0.5);
    analyser.SetTunerOn(true);
    const std::pair<float, int> refreshes[] = {{440, 5}, {0, 3},   {440, 1}, {0, 4},   {440, 3},
                                               {500, 4}, {100, 3}, {0, 9},   {200, 6}, {700, 2},
                                               {200, 1}, {400, 7}, {0, 5},   {100, 5}};
    for (const auto& [speed, columns] : {std::pair{3, 1u}, {6, 5u}}) {
        Sonogram::SetSpeedIndex(speed);
        analyser.GetSonogram()->Clear();
        for (const auto& [hz, count] : refreshes)
            for (int i = 0; i < count; ++i)
                analyser.GetSonogram()->Step(*analyser.GetSpectrumDrawer(), true, hz);
        std::vector<std::size_t> lengths;
        for (const auto& [points, colour] : ShowSonogram().lines)
            if (colour == Look::kTrace) lengths.push_back(points.size());
        EXPECT_EQ(lengths, (std::vector<std::size_t>{6 * columns, 4 * columns, 7 * columns, 5 * columns}))
            << "the second 440 Hz did not last, nor did the octave";
    }
}

// Catches a dial, a needle or an arrow that is mirrored, and labels that are not the needle's.
TEST_F(Readings, NeedleAndArrowAreOnTheErrorsSide) {
    for (const double cents : {-40.0, 0.0, 20.0}) {
        SCOPED_TRACE(cents);
        Tune(Cents(440.0, cents));
        const auto dial = Show(&kivspectrum::DrawNeedle<Recording>);
        const PointF pivot = Centre(dial.rectangles.back().box);  // of the hub
        const auto degrees = [&](PointF p) {
            return std::atan2(p.x - pivot.x, pivot.y - p.y) * 180.0f / std::numbers::pi_v<float>;
        };
        const PointF tip = dial.polygons.back().points.at(0);
        EXPECT_GT(pivot.y, tip.y);
        EXPECT_NEAR(degrees(tip), cents, 1.5);
        for (const auto& [text, box, middle] : dial.texts)
            EXPECT_NEAR(degrees(middle), ValueOf(text), 1.0) << text;
        EXPECT_GE(dial.texts.size(), 3u);

        const auto info = Show(&kivspectrum::DrawNeedleInfo<Recording>);
        const auto& error = info.texts.at(0);
        EXPECT_NEAR(ValueOf(error.text), cents, 1.5) << error.text;
        EXPECT_NEAR(ValueOf(info.texts.at(1).text), Cents(440.0, cents), 1.0);
        ASSERT_EQ(info.images.size(), cents == 0.0 ? 0u : 1u);
        if (cents == 0.0) continue;
        const RectF& box = info.images[0].box;
        EXPECT_TRUE(cents < 0.0 ? Right(box) < error.box.x : box.x > Right(error.box));
    }
}

// Catches ripples lit on the wrong side or too many of them, the circle that stays dark in tune, and a panel
// without a note that still shows one.
TEST_F(Readings, RipplesLightUpOnTheErrorsSide) {
    const struct {
        const char* what;
        double hz;
        int left, right;
        bool circle;
    } cases[] = {{"silence", 0.0, 0, 0, false},
                 {"flat", Cents(440.0, -20.0), 3, 0, false},
                 {"sharp", Cents(440.0, 36.0), 0, 4, false},
                 {"in tune", 440.0, 0, 0, true}};
    for (const auto& c : cases) {
        SCOPED_TRACE(c.what);
        if (c.hz > 0.0) Tune(c.hz);
        const RectF panel{0, 0, 641, 360};
        const auto drawn = Show(&kivspectrum::DrawTunerBigLetter<Recording>, panel);
        EXPECT_EQ(drawn.images.size(), 9u);
        int left = 0, right = 0;
        for (const auto& [bitmap, box] : drawn.images) {
            const bool lit = std::ranges::count(kivspectrum::leftItems, bitmap) > 0 ||
                             std::ranges::count(kivspectrum::rightItems, bitmap) > 0;
            (Right(box) < Centre(panel).x ? left : right) += lit ? 1 : 0;
        }
        EXPECT_EQ(left, c.left);
        EXPECT_EQ(right, c.right);
        EXPECT_EQ(drawn.images[0].bitmap == &kivspectrum::mainWitheCirleBitmap, c.circle);
    }
}

// Catches a readout that names another place than the pointer's, or the pointer's height for the curve's
// level.
TEST_F(Readings, PointerReadsWhatIsUnderIt) {
    constexpr double kBin = 85.0 * ShownAnalyser::kRate / 4096.0;
    kivspectrum::settings.time_smoothing = 0;
    for (const int scale : {1, 4, 5})
        for (const auto& [hz, level] : {std::pair{kBin, -20.0}, {100.0, -kRange}}) {
            kivspectrum::settings.view_option_a = scale;
            m_shown.Hear(kBin, 0.1);
            ShowSpectrum();
            analyser.SetPointer(Map().FrequencyToX(hz), Map().LevelToY(-50.0));
            const auto [text, box, middle] = ShowSpectrum().texts.back();
            const float x = Map().FrequencyToX(hz);
            EXPECT_EQ(middle.x > x, x < Centre(m_plot).x) << "on the side with more room";
            EXPECT_NEAR(Reading(text, "Hz"), hz, 0.01 * hz) << text;
            EXPECT_NEAR(Reading(text, "dB"), level, 0.5) << text;
        }
    kivspectrum::settings.view_option_a = 0;
    HearIntoSonogram(kBin, 0.1);
    for (const double seconds : {-0.25, -3.0}) {
        analyser.SetPointer(SonogramX(seconds), SonogramY(kBin));
        const std::string text = ShowSonogram().texts.back().text;
        EXPECT_NEAR(Reading(text, "Hz"), kBin, 15.0) << text;
        EXPECT_NEAR(Reading(text, "dB"), seconds > -1.0 ? -20.0 : -kRange, 1.0) << text;
        EXPECT_NEAR(Reading(text, " s"), seconds, 0.02) << text;
    }
}

// Catches a place that reads as another where a stretch of the axis is shown, and a marker that does not tell
// how far it is or does not scroll with the picture.
TEST_F(Readings, MarkerTellsTheDistance) {
    kivspectrum::settings.time_smoothing = 0;
    analyser.SetFrequencySpan({500.0, 2000.0});
    HearIntoSonogram(1000.0, 0.5);
    m_plot = Show(&kivspectrum::DoDrawSonogramAndSpectrum<Recording>).images.front().box;
    const auto reading = analyser.GetReading(1200.0f, SonogramY(1000.0));
    EXPECT_NEAR(reading.frequency, 1000.0, 10.0);
    EXPECT_NEAR(reading.level, -6.0, 2.0);  // between bins
    analyser.SetMarker(reading);
    m_shown.Hear(1000.0, 0.5, 1.0);
    analyser.SetPointer(1200.0f, 330.0f);
    const std::string difference = Show(&kivspectrum::DoDrawSonogramAndSpectrum<Recording>).texts.back().text;
    EXPECT_TRUE(difference.starts_with("\u0394")) << difference;
    EXPECT_NEAR(Reading(difference, " s"), 1.0, 0.04) << difference;
    analyser.SetFrequencySpan({7.0, 7.0});
    EXPECT_EQ(analyser.GetFrequencySpan(), Corvo::FrequencySpan{});
}

// Catches a curve or a readout that has its peak at another frequency or level than the sine, and columns
// without a point, wherever bins are denser or wider than pixels.
TEST_F(Readings, PeakIsTheSines) {
    auto& settings = kivspectrum::settings;
    settings.time_smoothing = 0;
    for (const int scale : {0, 1, 4, 5})
        for (const int levels : {0, 1, 2})
            for (const auto& [hz, level] : {std::pair{1000.0, -20.0}, {6000.0, 0.0}, {187.5, -60.0}}) {
                SCOPED_TRACE(testing::Message() << "scale " << scale << ", levels " << levels << ", " << hz);
                settings.view_option_a = scale;
                settings.view_option_b = levels;
                m_shown.Hear(hz, std::pow(10.0, level / 20.0));
                const auto drawn = ShowSpectrum();
                const auto& [text, box, middle] = drawn.texts.back();
                EXPECT_TRUE(text.starts_with("Peak")) << text;
                EXPECT_NEAR(Reading(text, "Hz"), hz, 2.0) << text;
                EXPECT_NEAR(levels == 0 ? Reading(text, "dB") : level, level, 0.3) << text;
                const auto& [curve, colour] = drawn.lines.back();
                EXPECT_EQ(colour, Look::kCurve);
                EXPECT_NEAR(static_cast<float>(curve.size()), m_plot.width, 2.0f);
                const auto top = std::ranges::min_element(curve, {}, &PointF::y);
                EXPECT_NEAR(top->x, Map().FrequencyToX(hz), 6.0f);
                const double linear = std::pow(10.0, level / (levels == 1 ? 10.0 : 20.0));
                const double down = levels == 0 ? -level / kRange : 1.0 - linear;
                EXPECT_NEAR(top->y, m_plot.y + static_cast<float>(down) * m_plot.height,
                            5.0f);  // between bins
                const auto bin = analyser.GetSpectrumDrawer()
                                     ->GetFFTPoints()[static_cast<std::size_t>(top - curve.begin())];
                EXPECT_NEAR(bin, hz * 4096.0 / ShownAnalyser::kRate, 0.51);
            }
    settings.gain = 0.5f;
    settings.view_option_b = 2;
    m_shown.Hear(6000.0, 1.0);
    const auto halved = ShowSpectrum();
    EXPECT_NEAR(std::ranges::min(halved.lines.back().points, {}, &PointF::y).y, Centre(m_plot).y, 1.0f);
}

// The sine's whole power is in its band, and only there.
TEST_F(Readings, BandsCollectTheirPower) {
    kivspectrum::settings.time_smoothing = 0;
    m_shown.Hear(85.0 * ShownAnalyser::kRate / 4096.0, 1.0);  // 996 Hz
    for (const int scale : {2, 3}) {
        kivspectrum::settings.view_option_a = scale;
        const auto curve = ShowSpectrum().lines.back().points;
        const auto top = std::ranges::min_element(curve, {}, &PointF::y);
        const double half = std::exp2(scale == 2 ? 1.0 / 2.0 : 1.0 / 6.0);
        EXPECT_NEAR(top[0].y, m_plot.y, 0.5f);
        EXPECT_NEAR(top[0].x, Map().FrequencyToX(1000.0 / half), 1.0f);
        EXPECT_NEAR(top[1].x, Map().FrequencyToX(1000.0 * half), 1.0f);
        EXPECT_EQ(top[1].y, top[0].y);
        EXPECT_GT(top[2].y, LevelY(-60.0));
    }
}

// Catches a spike where the curve ends: half the rate has no bin there, but its neighbours get some of it.
TEST_F(Readings, CurveEndsWithoutASpike) {
    std::vector<float> alternating(4096, 0.001f);
    for (std::size_t i = 1; i < alternating.size(); i += 2) alternating[i] *= -1.0f;
    kivspectrum::settings.time_smoothing = kivspectrum::settings.fft_length_auto = 0;
    for (const std::int32_t length : {4096, 32768}) {
        kivspectrum::settings.view_option_a = 0;
        kivspectrum::settings.fft_length = length;
        analyser.init();
        analyser.Feed(alternating.data(), 4096, 1, 1);
        ASSERT_TRUE(analyser.Refresh());
        const auto drawn = ShowSpectrum();
        auto end = drawn.lines.back().points;
        std::erase_if(end, [&](const PointF& p) { return p.x < Centre(m_plot).x; });
        for (const PointF& point : end) EXPECT_EQ(point.y, Bottom(m_plot)) << point.x;
    }
}

}  // namespace
