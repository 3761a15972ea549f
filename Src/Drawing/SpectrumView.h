#pragma once

#include <mutex>
#include <vector>

#include "Drawing/AxisDrawing.h"
#include "Drawing/ShortText.h"
#include "Spectrum/SpectrumDrawer.h"
#include "Spectrum/SpectrumScales.h"
#include "Spectrum/Tuner.h"
#include "Spectrum/kivspectrum.h"

// The spectrum's curve with its scales.
namespace Corvo {

// Where the parts of a spectrum stand: labels to the left of the plot and below it, where they are wanted and
// leave room.
struct SpectrumLayout {
    RectF plot;
    bool labels;
};

template <typename Target>
SpectrumLayout LayOutSpectrum(Target& target, const RectF& rectangle, const SpectrumSettings& settings) {
    const float scale = target.Scale(), size = Look::kLabelSize * scale, gap = Look::kGap * scale;
    const TextMetrics line = target.MeasureText("0", size);
    const float left = LabelWidth(target, false) + 2.0f * gap, bottom = line.ascent + line.descent + gap;
    const RectF inner = Snapped(Shrunk(rectangle, left, gap, gap, bottom));
    const float least = Look::kLeastPlot * scale;
    if (settings.view_flag_b == 0 || inner.width < least || inner.height < least)
        return {Snapped(rectangle), false};
    return {inner, true};
}

inline bool ShowsNotes(const SpectrumSettings& settings) {
    return settings.view_flag_d || FrequencyScaleOf(settings) == FrequencyScale::Notes;
}

template <typename Target>
void DrawSpectrumScales(Target& target, const SpectrumLayout& layout, const CoordinatesAndFrequencies& map,
                        const SpectrumSettings& settings) {
    const RectF& plot = layout.plot;
    const float scale = target.Scale(), size = Look::kLabelSize * scale, gap = Look::kGap * scale;
    const TextMetrics line = target.MeasureText("0", size);
    const AxisTicks frequencies = FrequencyTicks(map, plot.width, 6.0f * scale, settings.view_flag_d);
    const AxisTicks levels = LevelTicks(map, plot.height, Look::kLevelPitch * (line.ascent + line.descent));
    const auto xOf = [&](double hz) { return map.FrequencyToX(hz); };
    const auto yOf = [&](double level) { return map.LevelToY(level); };
    if (settings.view_option_c != 0) {
        DrawGrid(target, plot, frequencies, true, xOf);
        DrawGrid(target, plot, levels, false, yOf);
    }
    if (!layout.labels) return;
    DrawLabelRow(target, frequencies, plot.x, Right(plot), Bottom(plot) + gap / 2.0f + line.ascent, xOf);
    if (!ShowsNotes(settings))
        target.Text("Hz", {plot.x - gap, Bottom(plot) + gap / 2.0f + line.ascent}, TextAlign::Right, size,
                    {Look::kLabel});
    DrawLabelColumn(target, levels, plot.y, Bottom(plot), plot.x - gap, TextAlign::Right, yOf);
}

// The area under the points, down to `ground`.
inline void CloseToGround(const std::vector<PointF>& points, float ground, std::vector<PointF>& outline) {
    outline.assign(points.begin(), points.end());
    outline.push_back({points.back().x, ground});
    outline.push_back({points.front().x, ground});
}

// Bars of equal width, each as high as the highest point over it; bands are bars already.
template <typename Target>
void DrawBars(Target& target, const RectF& plot, const std::vector<PointF>& points, bool bands, Ink ink) {
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
        const float width = bands ? right - points[i].x - gap : pitch - gap;
        target.FillRectangle({points[i].x, top, std::max(width, 1.0f), Bottom(plot) - top}, ink);
        i = end;
    }
}

template <typename Target>
void DrawCurve(Target& target, const RectF& plot, const CoordinatesAndFrequencies& map,
               const std::vector<PointF>& points, CurveStyle style, std::vector<PointF>& outline) {
    if (points.empty()) return;
    const auto count = static_cast<int>(points.size());
    if (style == CurveStyle::Bars) {
        const bool bands = map.GetFrequencyScale() == FrequencyScale::Octaves ||
                           map.GetFrequencyScale() == FrequencyScale::ThirdOctaves;
        DrawBars(target, plot, points, bands, {Look::kCurve, 200});
        return;
    }
    if (style == CurveStyle::Filled) {
        CloseToGround(points, Bottom(plot), outline);
        target.FillPolygon(outline.data(), static_cast<int>(outline.size()), {Look::kCurve, 70});
    }
    target.Polyline(points.data(), count, {{Look::kCurve}, Look::kCurveWidth * target.Scale()});
}

// What the pointer is over or, without one, the highest peak.
inline ShortText DescribeSpectrum(double hz, double level, LevelScale scale) {
    ShortText text;
    text.AddFrequency(hz).Add("   ");
    const std::size_t before = text.View().size();
    text.AddNote(hz);
    if (text.View().size() > before) text.Add("   ");
    if (scale == LevelScale::Decibels) return text.AddNumber(level, 1).Add(" dB");
    return text.AddNumber(level, 4);
}

}  // namespace Corvo

template <class Drawing>
void kivspectrum::DoDrawSpectrum(typename Drawing::DrawTarget& target, const Corvo::RectF& rectangle) {
    using namespace Corvo;
    if (!IsDrawable(rectangle)) return;
    const spectrum_settings view = GetSettings();
    const std::lock_guard lock(m_instanceLock);
    const SpectrumLayout layout = LayOutSpectrum(target, rectangle, view);
    const RectF& plot = layout.plot;
    const CoordinatesAndFrequencies map = SpectrumMap(plot, view, m_samplingRate);
    target.PushClip(rectangle);
    target.FillRectangle(rectangle, {Look::kGround});
    target.FillRectangle(plot, {Look::kPlot});
    DrawSpectrumScales(target, layout, map, view);
    target.PushClip(plot);
    int count = 0;
    const auto other = [&](const std::vector<float>& power, ColourReference colour) {
        m_drawer->ComputeSpectrumPoints(plot, nullptr, count, map, display_spectrum, 0, 0.0f, &power);
        const auto& points = m_drawer->GetXYPoints();
        target.Polyline(points.data(), static_cast<int>(points.size()),
                        {{colour}, Look::kHairline * target.Scale()});
    };
    if (view.peak_hold_mode != 0) other(m_drawer->GetPeaks(), Look::kPeaks);
    if (m_tunerOn && Tuner::GetShowDenoisedSpectrum() && !m_tuner->GetDenoisedSpectrum().empty())
        other(m_tuner->GetDenoisedSpectrum(), Look::kTrace);
    m_drawer->ComputeSpectrumPoints(plot, nullptr, count, map, display_spectrum, 0, 0.0f);
    DrawCurve(target, plot, map, m_drawer->GetXYPoints(), CurveStyleOf(view), m_outline);
    target.PopClip();
    if (m_showInfoBox && view.view_flag_c != 0) DrawSpectrumInfo<Drawing>(target, plot, map);
    target.PopClip();
}

// The pointer's frequency and level, with a hair-cross; without a pointer over the plot, the highest peak's.
template <class Drawing>
void kivspectrum::DrawSpectrumInfo(typename Drawing::DrawTarget& target, const Corvo::RectF& plot,
                                   const CoordinatesAndFrequencies& map) {
    using namespace Corvo;
    const float gap = Look::kGap * target.Scale();
    const PointF pointer{m_pointerX, m_pointerY};
    if (Contains(plot, pointer)) {
        const Stroke hair{{Look::kPointer, 110}, std::max(std::round(target.Scale()), 1.0f)};
        target.Line({pointer.x, plot.y}, {pointer.x, Bottom(plot)}, hair);
        target.Line({plot.x, pointer.y}, {Right(plot), pointer.y}, hair);
        const ShortText text =
            DescribeSpectrum(map.XToFrequency(pointer.x), map.YToLevel(pointer.y), map.GetLevelScale());
        const bool rightwards = pointer.x < Centre(plot).x;
        const float x = pointer.x + (rightwards ? 2.0f : -2.0f) * gap;
        DrawInfoBox(target, Shrunk(plot, gap, gap, gap, gap), {x, pointer.y + 2.0f * gap}, rightwards,
                    text.View());
        return;
    }
    const SpectrumPeak peak = m_drawer->HighestPeak();
    if (!(peak.level > map.GetFloor())) return;
    ShortText text;
    text.Add("Peak   ").Add(DescribeSpectrum(peak.frequency, peak.level, LevelScale::Decibels).View());
    DrawInfoBox(target, Shrunk(plot, gap, gap, gap, gap), {Right(plot), plot.y}, false, text.View());
}
