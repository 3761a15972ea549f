#include "Drawing/Views/SpectrumView.h"

#include <algorithm>
#include <cmath>
#include <mutex>
#include <vector>

#include "Drawing/Views/AxisDrawing.h"
#include "Drawing/Views/Look.h"
#include "Drawing/Views/Rectangles.h"
#include "Drawing/Views/ViewAccess.h"
#include "Drawing/Views/Views.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Tuner/Tuner.h"

namespace Corvo {
namespace {

void DrawSpectrumScales(DrawTarget& target, const RectF& rectangle, const SpectrumLayout& layout,
                        const CoordinatesAndFrequencies& map, const SpectrumSettings& settings) {
    const RectF& plot = layout.plot;
    AxisTicks frequencies = FrequencyTicks(map, RoomAlong(target, plot.width), settings.view_flag_d);
    AxisTicks levels = LevelTicks(map, RoomForLevels(target, plot.height));
    frequencies.Place([&](double hz) { return map.FrequencyToX(hz); });
    levels.Place([&](double level) { return map.LevelToY(level); });
    if (settings.view_option_c != 0) {
        DrawGrid(target, plot, frequencies, true);
        DrawGrid(target, plot, levels, false);
    }
    if (!layout.labels) return;
    DrawLabelRow(target, frequencies, rectangle.x, Right(rectangle), RowBaseline(target, Bottom(plot)));
    DrawLabelColumn(target, levels, rectangle.y, Bottom(rectangle), plot.x - Look::kGap * target.Scale(),
                    TextAlign::Right);
}

bool ShowsBands(const CoordinatesAndFrequencies& map) {
    return map.GetFrequencyScale() == FrequencyScale::Octaves ||
           map.GetFrequencyScale() == FrequencyScale::ThirdOctaves;
}

// The area under the points, down to `ground`.
void CloseToGround(const std::vector<PointF>& points, float ground, std::vector<PointF>& outline) {
    outline.assign(points.begin(), points.end());
    outline.push_back({points.back().x, ground});
    outline.push_back({points.front().x, ground});
}

// Bars of equal width, each as high as the highest point over it; bands are bars already.
void DrawBars(DrawTarget& target, const RectF& plot, const std::vector<PointF>& points, bool bands, Ink ink) {
    const float gap = std::max(std::round(target.Scale()), 1.0f);
    const float pitch = bands ? 0.0f : 5.0f * gap;
    for (std::size_t i = 0; i < points.size();) {
        std::size_t end = i + 1;
        float top = points[i].y, right = points[i].x;
        const auto within = [&](const PointF& p) { return bands ? end % 2 == 1 : p.x < points[i].x + pitch; };
        while (end < points.size() && within(points[end])) {
            top = std::min(top, points[end].y);
            right = points[end].x;
            ++end;
        }
        const float left = std::floor(points[i].x);
        const float width = bands ? std::floor(right) - left - gap : pitch - gap;
        target.FillRectangle({left, top, std::max(width, 1.0f), Bottom(plot) - top}, ink);
        i = end;
    }
}

void DrawCurve(DrawTarget& target, const RectF& plot, const CoordinatesAndFrequencies& map,
               const std::vector<PointF>& points, CurveStyle style, std::vector<PointF>& outline) {
    if (points.empty()) return;
    const auto count = static_cast<int>(points.size());
    if (style == CurveStyle::Bars) {
        DrawBars(target, plot, points, ShowsBands(map), {Look::kCurve, 200});
        return;
    }
    if (style == CurveStyle::Filled) {
        CloseToGround(points, Bottom(plot), outline);
        target.FillPolygon(outline.data(), static_cast<int>(outline.size()), {Look::kCurve, 70});
    }
    target.Polyline(points.data(), count, {{Look::kCurve}, Look::kCurveWidth * target.Scale()});
}

// The pointer's frequency and the curve's level there, with a hair-cross; without a pointer over the plot the
// curve's highest peak, in its colour, where that does not hide much of it. A band's level is not its highest
// bin's.
void DrawSpectrumInfo(kivspectrum& analyser, DrawTarget& target, const RectF& plot,
                      const CoordinatesAndFrequencies& map) {
    const PointF pointer = ViewAccess::Pointer(analyser);
    if (Contains(plot, pointer)) {
        const Stroke hair{{Look::kPointer, 110}, std::max(std::round(target.Scale()), 1.0f)};
        const AnalyserReading pointed = ViewAccess::PointedAt(analyser);
        const float level = map.LevelToY(pointed.level);
        target.Line({pointer.x, plot.y}, {pointer.x, Bottom(plot)}, hair);
        target.Line({plot.x, level}, {Right(plot), level}, hair);
        const ShortText text = DescribeSpectrum(pointed.frequency, pointed.level, map.GetLevelScale());
        const ShortText difference =
            DescribeDifference(ViewAccess::Marker(analyser), pointed, map.GetLevelScale());
        return DrawPointerBox(target, plot, pointer, text.View(), difference.View());
    }
    const SpectrumDrawer& drawer = *analyser.GetSpectrumDrawer();
    const SpectrumPeak peak = drawer.HighestPeak(map.GetLowest());
    if (ShowsBands(map) || !(peak.level > -VerticalRangeOf(drawer.GetSettings()))) return;
    if (peak.frequency > map.GetHighest()) return;
    ShortText text;
    text.Add("Peak   ").Add(DescribeSpectrum(peak.frequency, peak.level, LevelScale::Decibels).View());
    constexpr float kMostOfWidth = 0.35f;
    if (InfoBoxOf(target, text.View()).width > kMostOfWidth * plot.width) return;
    const float gap = Look::kGap * target.Scale();
    DrawInfoBox(target, Shrunk(plot, gap, gap, gap, gap), {Right(plot), plot.y}, text.View(), {Look::kCurve});
}

}  // namespace

CoordinatesAndFrequencies ShownMap(const RectF& rectangle, const SpectrumSettings& settings, int samplingRate,
                                   const FrequencySpan& span) {
    const CoordinatesAndFrequencies whole = SpectrumMap(rectangle, settings, samplingRate);
    const double lowest = std::max(span.lowest, whole.GetLowest());
    const double highest = std::min(span.highest, whole.GetHighest());
    if (!(lowest < highest)) return whole;
    return {rectangle,
            lowest,
            highest,
            whole.GetFrequencyScale(),
            whole.GetLevelScale(),
            VerticalRangeOf(settings)};
}

bool IsLargeEnough(const RectF& plot, float scale) {
    return plot.width >= Look::kLeastPlot * scale && plot.height >= Look::kLeastPlot * scale;
}

bool ShowsNotes(const SpectrumSettings& settings) {
    return settings.view_flag_d || FrequencyScaleOf(settings) == FrequencyScale::Notes;
}

SpectrumLayout LayOutSpectrum(DrawTarget& target, const RectF& rectangle, const SpectrumSettings& settings) {
    const LabelMargins margins = MarginsFor(target, ShowsNotes(settings));
    const RectF inner = Snapped(Shrunk(rectangle, margins.left, margins.top, margins.right, margins.bottom));
    if (settings.view_flag_b == 0 || !IsLargeEnough(inner, target.Scale()))
        return {Snapped(rectangle), false};
    return {inner, true};
}

ShortText DescribeSpectrum(double hz, double level, LevelScale scale) {
    ShortText text;
    text.AddFrequency(hz).Add("   ");
    const std::size_t before = text.View().size();
    text.AddNote(hz);
    if (text.View().size() > before) text.Add("   ");
    if (scale == LevelScale::Decibels) return text.AddNumber(level, 1).Add(" dB");
    return text.AddNumber(level, 4);
}

ShortText DescribeDifference(const AnalyserReading& marker, const AnalyserReading& pointed,
                             LevelScale scale) {
    using Plot = AnalyserReading::Plot;
    ShortText text;
    if (marker.plot == Plot::None || pointed.plot == Plot::None) return text;
    text.Add("\u0394   ").AddDifference(pointed.frequency - marker.frequency, 1).Add(" Hz");
    if (marker.frequency > 0.0 && pointed.frequency > 0.0)
        text.Add("   ").AddDifference(12.0 * std::log2(pointed.frequency / marker.frequency), 2).Add(" st");
    if (marker.plot != pointed.plot) return text;
    const bool decibels = pointed.plot == Plot::Sonogram || scale == LevelScale::Decibels;
    text.Add("   ").AddDifference(pointed.level - marker.level, decibels ? 1 : 4).Add(decibels ? " dB" : "");
    if (pointed.plot == Plot::Sonogram)
        text.Add("   ").AddDifference(pointed.since - marker.since, 2).Add(" s");
    return text;
}

void DrawSpectrumAs(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle,
                    const SpectrumSettings& view) {
    if (!IsDrawable(rectangle)) return;
    const std::lock_guard lock(ViewAccess::Lock(analyser));
    SpectrumDrawer& drawer = *analyser.GetSpectrumDrawer();
    const SpectrumLayout layout = LayOutSpectrum(target, rectangle, view);
    const RectF& plot = layout.plot;
    const int prepared = drawer.GetSamplingFrequency();
    const CoordinatesAndFrequencies map = ShownMap(
        plot, view, prepared > 0 ? prepared : ViewAccess::SamplingRate(analyser), ViewAccess::Span(analyser));
    ViewAccess::Shown(analyser).spectrum = plot;
    ViewAccess::Shown(analyser).map = map;
    target.PushClip(rectangle);
    DrawGround(target, rectangle, plot);
    target.FillRectangle(plot, {Look::kPlot});
    DrawSpectrumScales(target, rectangle, layout, map, view);
    target.PushClip(plot);
    int count = 0;
    constexpr auto kMode = kivspectrum::display_spectrum;
    const auto other = [&](const std::vector<float>& power, ColourReference colour) {
        drawer.ComputeSpectrumPoints(plot, nullptr, count, map, kMode, 0, 0.0f, &power);
        const auto& points = drawer.GetXYPoints();
        target.Polyline(points.data(), static_cast<int>(points.size()),
                        {{colour}, Look::kHairline * target.Scale()});
    };
    if (!analyser.GetFrozen()) drawer.AgePeaks();
    if (view.peak_hold_mode != 0) other(drawer.GetPeaks(), Look::kPeaks);
    const std::vector<float>& denoised = analyser.GetTuner()->GetDenoisedSpectrum();
    if (analyser.GetTunerOn() && Tuner::GetShowDenoisedSpectrum() && !denoised.empty())
        other(denoised, Look::kTrace);
    drawer.ComputeSpectrumPoints(plot, nullptr, count, map, kMode, 0, 0.0f, &drawer.GetPowerSmoothed());
    DrawCurve(target, plot, map, drawer.GetXYPoints(), CurveStyleOf(view), ViewAccess::Outline(analyser));
    target.PopClip();
    const AnalyserReading& marker = ViewAccess::Marker(analyser);
    if (marker.plot != AnalyserReading::Plot::None)
        DrawMarker(target, plot,
                   {map.FrequencyToX(marker.frequency),
                    marker.plot == AnalyserReading::Plot::Spectrum ? map.LevelToY(marker.level) : -1.0f},
                   true);
    if (analyser.IsShowInfoBox() && view.view_flag_c != 0) DrawSpectrumInfo(analyser, target, plot, map);
    target.PopClip();
}

void DrawSpectrum(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle) {
    ViewAccess::ForgetPlots(analyser);
    DrawSpectrumAs(analyser, target, rectangle, kivspectrum::GetSettings());
}

}  // namespace Corvo
