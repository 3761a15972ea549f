#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <numbers>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Drawing/Views/ShownAnalyser.h"
#include "Drawing/Views/Views.h"
#include "Support/RecordingDrawing.h"

// What can be read off the pictures: labels, needle, arrows, lines and readouts against what was heard.

using namespace Corvo;
using TestSupport::DrawingSurface;
using TestSupport::RecordingDrawing;

namespace {

constexpr RectF kWhole{0, 0, 1280, 720};

// What a label or readout says: its first number, times 1000 behind a "k".
std::optional<double> ValueOf(const std::string& text) {
    constexpr std::string_view kMinus = "\u2212";
    const bool negative = text.starts_with(kMinus);
    const char* const begin = text.c_str() + (negative ? kMinus.size() : 0);
    char* end = nullptr;
    const double size = std::strtod(begin, &end);
    if (end == begin) return std::nullopt;
    const std::string_view unit(end);
    return (negative ? -size : size) * (unit.starts_with("k") || unit.starts_with(" k") ? 1000.0 : 1.0);
}

// The part of a readout, whose parts stand three blanks apart, that ends with the unit.
std::optional<double> Reading(const std::string& readout, std::string_view unit) {
    constexpr std::string_view kApart = "   ";
    for (std::size_t from = 0; from < readout.size();) {
        const std::size_t end = std::min(readout.find(kApart, from), readout.size());
        const std::string part = readout.substr(from, end - from);
        if (part.ends_with(unit)) return ValueOf(part);
        from = end + kApart.size();
    }
    return std::nullopt;
}

double Cents(double hz, double cents) { return hz * std::exp2(cents / 1200.0); }

}  // namespace

template <typename Drawing>
class Readings : public ViewTest {
protected:
    using Target = typename RecordingDrawing<Drawing>::DrawTarget;
    using Drawn = typename RecordingDrawing<Drawing>::Drawn;

    // What draw(target) drew.
    template <typename Draw>
    Drawn Record(Draw draw) {
        Drawn drawn;
        m_surface.Paint(96.0f, [&](auto& inner) {
            Target target(inner);
            draw(target);
            drawn = target;
        });
        return drawn;
    }
    void Tune(double hz) {
        m_shown.analyser.SetTunerOn(true);
        m_shown.analyser.ObserverUpdate();
        m_shown.Hear(hz, 0.5, 1.0);
        ASSERT_TRUE(m_shown.analyser.GetTuner()->IsTuned());
    }
    // A sonogram of a sine, drawn with its scales, and where its picture stands.
    Drawn ShowSine(double hz, double amplitude) {
        m_shown.analyser.ShowSonogram(true);
        const auto draw = [&](Target& t) {
            m_shown.analyser.template DrawSonogramComponents<RecordingDrawing<Drawing>>(t, kWhole);
        };
        Record(draw);
        m_shown.Hear(hz, amplitude, 1.0);
        const Drawn drawn = Record(draw);
        m_plot = drawn.images.front().box;
        return drawn;
    }
    // How far up the sonogram's picture a frequency is.
    float SonogramY(double hz) const {
        const auto& sonogram = *m_shown.analyser.GetSonogram();
        const float rows = static_cast<float>(sonogram.GetBitmap().height);
        return Bottom(m_plot) - sonogram.GetFrequencyMap().FrequencyToX(hz) * m_plot.height / rows;
    }
    // At least three labels are where stands(box) says, and each of them where place(value) puts it.
    template <typename Stands, typename Place>
    static void ExpectLabels(const Drawn& drawn, bool upright, Stands stands, Place place) {
        int labels = 0;
        for (const auto& [text, box, middle] : drawn.texts) {
            const auto value = ValueOf(text);
            if (!value || !stands(box)) continue;
            EXPECT_NEAR(upright ? middle.y : middle.x, place(*value), 1.0f) << text;
            ++labels;
        }
        EXPECT_GE(labels, 3);
    }

    ShownAnalyser m_shown;
    DrawingSurface<Drawing> m_surface{16, 16};
    RectF m_plot{};
};
TYPED_TEST_SUITE(Readings, TestSupport::DrawingBackends);

// Catches scales that run the wrong way or by other values than their labels say.
TYPED_TEST(Readings, SpectrumLabelsStandAtTheirPlaces) {
    using Recording = RecordingDrawing<TypeParam>;
    for (const int scale : {0, 1, 4}) {
        SCOPED_TRACE(scale);
        kivspectrum::settings.view_option_a = scale;
        const auto drawn = this->Record(
            [&](auto& t) { this->m_shown.analyser.template DoDrawSpectrum<Recording>(t, kWhole); });
        const RectF plot = drawn.rectangles.at(1).box;
        const auto map = SpectrumMap(plot, kivspectrum::settings, ShownAnalyser::kRate);
        this->ExpectLabels(
            drawn, false, [&](const RectF& b) { return b.y > Bottom(plot); },
            [&](double hz) { return map.FrequencyToX(hz); });
        this->ExpectLabels(
            drawn, true, [&](const RectF& b) { return Right(b) < plot.x; },
            [&](double level) { return plot.y - static_cast<float>(level) / 90.0f * plot.height; });
    }
}

TYPED_TEST(Readings, SonogramLabelsStandAtTheirPlaces) {
    const auto drawn = this->ShowSine(1000.0, 0.5);
    const RectF plot = this->m_plot;
    const auto beside = [&](const RectF& b) { return b.y < Bottom(plot) + 2.0f; };
    this->ExpectLabels(
        drawn, true, [&](const RectF& b) { return beside(b) && Right(b) < plot.x; },
        [&](double hz) { return this->SonogramY(hz); });
    this->ExpectLabels(
        drawn, true, [&](const RectF& b) { return beside(b) && b.x > Right(plot); },
        [&](double level) { return plot.y - static_cast<float>(level) / 90.0f * plot.height; });
    this->ExpectLabels(
        drawn, false, [&](const RectF& b) { return !beside(b); },
        [&](double seconds) {
            return Right(plot) + static_cast<float>(seconds * Sonogram::GetColumnsPerSecond());
        });
}

// Catches a trace that is missing, upside down or without regard to time.
TYPED_TEST(Readings, TraceStandsInThePitchsRow) {
    this->Tune(440.0);
    const auto drawn = this->ShowSine(440.0, 0.5);
    std::vector<PointF> trace;
    for (const auto& [points, colour] : drawn.lines)
        if (colour == Look::kTrace && points.size() > trace.size()) trace = points;
    ASSERT_GE(trace.size(), 10u);
    for (const PointF& point : trace) EXPECT_NEAR(point.y, this->SonogramY(440.0), 1.0f);
    EXPECT_NEAR(trace.back().x, Right(this->m_plot), 2.0f);
    kivspectrum::settings = {};
    this->m_shown.analyser.SetTunerOn(false);
    for (const auto& line : this->ShowSine(440.0, 0.5).lines) EXPECT_NE(line.colour, Look::kTrace);
}

// Catches a dial or a needle that is mirrored, and one whose labels are not the needle's.
TYPED_TEST(Readings, NeedleLeansToTheErrorsSide) {
    using Recording = RecordingDrawing<TypeParam>;
    for (const double cents : {-40.0, -20.0, 0.0, 20.0, 40.0}) {
        SCOPED_TRACE(cents);
        this->Tune(Cents(440.0, cents));
        const auto drawn =
            this->Record([&](auto& t) { this->m_shown.analyser.template DrawNeedle<Recording>(t, kWhole); });
        const PointF pivot = Centre(drawn.rectangles.back().box);  // of the hub
        const auto degrees = [&](PointF p) {
            return std::atan2(p.x - pivot.x, pivot.y - p.y) * 180.0f / std::numbers::pi_v<float>;
        };
        const PointF tip = drawn.polygons.back().points.at(0);
        EXPECT_GT(pivot.y, tip.y);
        EXPECT_NEAR(degrees(tip), cents, 1.5);
        for (const auto& [text, box, middle] : drawn.texts)
            EXPECT_NEAR(degrees(middle), ValueOf(text).value_or(999.0), 1.0) << text;
        EXPECT_GE(drawn.texts.size(), 3u);
    }
}

// Catches arrows exchanged or turned round: they stand on the error's side and point to where the note has to
// go, so that most of their ink is on the outer side.
TYPED_TEST(Readings, ArrowStandsOnTheErrorsSide) {
    using Recording = RecordingDrawing<TypeParam>;
    for (const double cents : {-20.0, 20.0}) {
        SCOPED_TRACE(cents);
        this->Tune(Cents(440.0, cents));
        const auto drawn = this->Record(
            [&](auto& t) { this->m_shown.analyser.template DrawNeedleInfo<Recording>(t, kWhole); });
        ASSERT_EQ(drawn.images.size(), 1u);
        const auto& [bitmap, box] = drawn.images[0];
        const auto& error = drawn.texts.at(0);
        EXPECT_NEAR(ValueOf(error.text).value_or(0.0), cents, 1.5) << error.text;
        EXPECT_EQ(Right(box) < error.box.x, cents < 0.0);
        EXPECT_EQ(box.x > Right(error.box), cents > 0.0);
        int balance = 0;
        for (int y = 0; y < bitmap->height; ++y)
            for (int x = 0; x < bitmap->width; ++x)
                if (bitmap->Row(y)[x] >> 24 > 128) balance += 2 * x < bitmap->width ? -1 : 1;
        EXPECT_EQ(balance < 0, cents < 0.0);
        EXPECT_NEAR(ValueOf(drawn.texts.at(1).text).value_or(0.0), Cents(440.0, cents), 1.0);
    }
}

// Catches a readout that names another place than the pointer's: it is set where labels say what is there.
TYPED_TEST(Readings, PointerReadsWhatTheLabelsSay) {
    using Recording = RecordingDrawing<TypeParam>;
    kivspectrum& analyser = this->m_shown.analyser;
    const auto readoutAt = [&](double hz, double level) {
        const auto draw = [&](auto& t) { analyser.template DoDrawSpectrum<Recording>(t, kWhole); };
        const RectF plot = this->Record(draw).rectangles.at(1).box;
        const auto map = SpectrumMap(plot, kivspectrum::settings, ShownAnalyser::kRate);
        analyser.SetPointer(map.FrequencyToX(hz), map.LevelToY(level));
        return this->Record(draw).texts.back().text;
    };
    for (const auto& [hz, level] : {std::pair{1000.0, -40.0}, {50.0, -10.0}, {10000.0, -80.0}}) {
        const std::string text = readoutAt(hz, level);
        EXPECT_NEAR(Reading(text, "Hz").value_or(0.0), hz, 0.01 * hz) << text;
        EXPECT_NEAR(Reading(text, "dB").value_or(99.0), level, 0.5) << text;
    }
    constexpr double kBin = 85.0 * ShownAnalyser::kRate / 4096.0;
    kivspectrum::settings.time_smoothing = 0;
    this->ShowSine(kBin, 0.1);
    for (const double seconds : {-0.25, -3.0}) {
        analyser.SetPointer(
            Right(this->m_plot) + static_cast<float>(seconds * Sonogram::GetColumnsPerSecond()),
            this->SonogramY(kBin));
        const std::string text =
            this->Record([&](auto& t) { analyser.template DrawSonogramComponents<Recording>(t, kWhole); })
                .texts.back()
                .text;
        EXPECT_NEAR(Reading(text, "Hz").value_or(0.0), kBin, 15.0) << text;
        EXPECT_NEAR(Reading(text, "dB").value_or(99.0), seconds > -1.0 ? -20.0 : -90.0, 1.0) << text;
        EXPECT_NEAR(Reading(text, " s").value_or(99.0), seconds, 0.02) << text;
    }
}

// Catches a peak told at another frequency or level than the sine's.
TYPED_TEST(Readings, PeakIsTheSines) {
    using Recording = RecordingDrawing<TypeParam>;
    kivspectrum::settings.time_smoothing = 0;
    for (const auto& [hz, level] : {std::pair{1000.0, -20.0}, {6000.0, 0.0}, {187.5, -60.0}}) {
        this->m_shown.Hear(hz, std::pow(10.0, level / 20.0));
        const auto drawn = this->Record(
            [&](auto& t) { this->m_shown.analyser.template DoDrawSpectrum<Recording>(t, kWhole); });
        const std::string text = drawn.texts.back().text;
        EXPECT_TRUE(text.starts_with("Peak")) << text;
        EXPECT_NEAR(Reading(text, "Hz").value_or(0.0), hz, 2.0) << text;
        EXPECT_NEAR(Reading(text, "dB").value_or(99.0), level, 0.3) << text;
    }
}

// Catches a strip that is missing, that covers what is below it, or that stays when the tuner is off.
TYPED_TEST(Readings, TunerHasAStripAboveTheRest) {
    using Recording = RecordingDrawing<TypeParam>;
    kivspectrum& analyser = this->m_shown.analyser;
    for (const bool tuner : {true, false})
        for (const int mode :
             {kivspectrum::display_spectrum, kivspectrum::display_sonogram, kivspectrum::display_both}) {
            while (analyser.GetDisplayMode() != mode) analyser.ToggleDisplayMode();
            analyser.SetTunerOn(tuner);
            this->m_shown.Hear(440.0, 0.5, 0.1);
            const auto drawn = this->Record([&](auto& t) { analyser.template DoDraw<Recording>(t, kWhole); });
            float strip = 0.0f, rest = Bottom(kWhole);
            for (const auto& [bitmap, box] : drawn.images)
                if (bitmap == &kivspectrum::mainWitheCirleBitmap ||
                    bitmap == &kivspectrum::mainWitheCirleBitmapBase)
                    strip = Bottom(box);
                else if (bitmap == &analyser.GetSonogram()->GetBitmap())
                    rest = std::min(rest, box.y);
            for (const auto& [points, colour] : drawn.lines)
                if (colour == Look::kCurve)
                    for (const PointF& p : points) rest = std::min(rest, p.y);
            EXPECT_EQ(strip > 0.0f, tuner) << mode;
            EXPECT_GE(rest, strip) << mode;
            EXPECT_LT(rest, Bottom(kWhole)) << mode;
        }
}

// Catches images put between pixels, where copying them would blur their edges.
TYPED_TEST(Readings, PanelImagesLieOnWholePixels) {
    using Recording = RecordingDrawing<TypeParam>;
    this->Tune(Cents(440.0, 20.0));
    kivspectrum::needPrepareBitmap = true;
    for (const RectF& r : {RectF{0, 0, 641, 360}, RectF{0.5f, 3.25f, 333, 277}}) {
        kivspectrum::needPrepareBitmap = true;
        const auto drawn = this->Record(
            [&](auto& t) { this->m_shown.analyser.template DrawTunerBigLetter<Recording>(t, r); });
        ASSERT_EQ(drawn.images.size(), 9u);
        for (const auto& [bitmap, box] : drawn.images) {
            EXPECT_EQ(box.x, std::floor(box.x));
            EXPECT_EQ(box.y, std::floor(box.y));
            EXPECT_EQ(box.width, static_cast<float>(bitmap->width));
            EXPECT_EQ(box.height, static_cast<float>(bitmap->height));
        }
    }
}
