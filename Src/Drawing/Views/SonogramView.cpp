#include "Drawing/Views/SonogramView.h"

#include <algorithm>
#include <cmath>
#include <mutex>
#include <vector>

#include "Drawing/Views/AxisDrawing.h"
#include "Drawing/Views/Look.h"
#include "Drawing/Views/Rectangles.h"
#include "Drawing/Views/ShortText.h"
#include "Drawing/Views/SpectrumView.h"
#include "Drawing/Views/ViewAccess.h"
#include "Drawing/Views/Views.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Sonogram/PitchTrace.h"
#include "Spectrum/Sonogram/Sonogram.h"

namespace Corvo {
namespace {

// A mark on whole pixels, at `at` or as near as it stays within first..last.
float MarkAt(float at, float first, float last) { return std::max(std::min(std::floor(at), last), first); }

void DrawSonogramInfo(kivspectrum& analyser, DrawTarget& target, const RectF& plot) {
    const AnalyserReading pointed = ViewAccess::PointedAt(analyser);
    if (pointed.plot != AnalyserReading::Plot::Sonogram) return;
    const ShortText text = DescribeSpectrum(pointed.frequency, pointed.level, LevelScale::Decibels)
                               .Add("   ")
                               .AddNumber(pointed.seconds, 2)
                               .Add(" s");
    const ShortText difference =
        DescribeDifference(ViewAccess::Marker(analyser), pointed, LevelScale::Decibels);
    DrawPointerBox(target, plot, ViewAccess::Pointer(analyser), text.View(), difference.View());
}

void DrawSonogramMarker(kivspectrum& analyser, DrawTarget& target, const RectF& plot, float y) {
    const AnalyserReading& marker = ViewAccess::Marker(analyser);
    if (marker.plot == AnalyserReading::Plot::None) return;
    const double ago = ViewAccess::SonogramSeconds(analyser) - marker.since;
    const bool here = marker.plot == AnalyserReading::Plot::Sonogram;
    const double x = here ? Right(plot) - ago * Sonogram::GetColumnsPerSecond() : plot.x - 1.0;
    DrawMarker(target, plot, {static_cast<float>(std::max(x, plot.x - 1.0)), y}, false);
}

// At the edge that is not now.
void DrawPastEdge(DrawTarget& target, const RectF& plot) {
    const float width = std::max(std::round(2.0f * target.Scale()), 1.0f);
    target.FillRectangle({Right(plot) - width, plot.y, width, plot.height}, {Look::kPeaks});
}

// The map of what is shown of the frequency axis, upright: x counts pixels from the lower edge.
CoordinatesAndFrequencies UprightMap(float height, const SpectrumSettings& settings, int samplingRate,
                                     const FrequencySpan& span) {
    const RectF upright{0.0f, 0.0f, height, 1.0f};
    const CoordinatesAndFrequencies map = ShownMap(upright, settings, samplingRate, span);
    const FrequencyScale scale = map.GetFrequencyScale();
    const bool bands = scale == FrequencyScale::Octaves || scale == FrequencyScale::ThirdOctaves;
    return {upright,
            map.GetLowest(),
            map.GetHighest(),
            bands ? FrequencyScale::Logarithmic : scale,
            LevelScale::Decibels,
            1.0f};
}

// Where the whole axis would stand so that `shown` fills the plot.
RectF WholeAxis(const RectF& plot, const CoordinatesAndFrequencies& shown,
                const CoordinatesAndFrequencies& whole) {
    const double lowest = whole.FrequencyToX(shown.GetLowest());
    const double part = (whole.FrequencyToX(shown.GetHighest()) - lowest) / static_cast<double>(plot.height);
    constexpr double kMostTimes = 16.0;
    if (!(part > 0.0 && part < 0.9999)) return plot;
    const double times = std::min(1.0 / part, kMostTimes);
    const auto height = static_cast<float>(std::min(std::round(times * plot.height), 32000.0));
    const auto below = static_cast<float>(std::round(lowest * static_cast<double>(height / plot.height)));
    return {plot.x, Bottom(plot) + below - height, plot.width, height};
}

// As many rows as the axis has pixels, while the picture stays small enough to be moved 30 times a second.
int RowsOf(const RectF& axis) {
    constexpr float kMostPixels = 4.0e6f;
    return static_cast<int>(std::min(axis.height, kMostPixels / std::max(axis.width, 1.0f)));
}

void DrawFrequencies(DrawTarget& target, const RectF& rectangle, const CoordinatesAndFrequencies& map,
                     float perRow, bool notes) {
    const float scale = target.Scale(), gap = Look::kGap * scale;
    AxisRoom room = RoomBeside(target, rectangle.height);
    // In the map's rows.
    room = {rectangle.height / perRow, room.line / perRow, room.label / perRow};
    AxisTicks ticks = FrequencyTicks(map, room, notes);
    ticks.Place([&](double hz) { return Bottom(rectangle) - map.FrequencyToX(hz) * perRow; });
    const float width = std::max(std::round(scale), 1.0f);
    for (const AxisTick& tick : ticks.All()) {
        const float length = tick.rank < AxisTick::kUnlabelled ? 0.75f * gap : 0.4f * gap;
        target.FillRectangle({Right(rectangle) - length,
                              MarkAt(tick.at, rectangle.y, Bottom(rectangle) - width), length, width},
                             {Look::kLabel});
    }
    const float beyond = kCapHeight * Look::kLabelSize * scale / 2.0f + 1.0f;
    DrawLabelColumn(target, ticks, rectangle.y - beyond, Bottom(rectangle) + beyond,
                    Right(rectangle) - 1.5f * gap, TextAlign::Right);
}

}  // namespace

SonogramLayout LayOutSonogram(DrawTarget& target, const RectF& rectangle, const SpectrumSettings& settings) {
    const LabelMargins margins = MarginsFor(target, ShowsNotes(settings));
    const float gap = Look::kGap * target.Scale();
    const float right = Look::kIntensity * target.Scale() + MarginsFor(target, false).left + gap;
    const RectF plot = Snapped(Shrunk(rectangle, margins.left, margins.top, right, margins.bottom));
    if (settings.view_flag_b == 0 || !IsLargeEnough(plot, target.Scale()))
        return {Snapped(rectangle), {}, {}, {}};
    return {plot,
            {rectangle.x, plot.y, plot.x - rectangle.x, plot.height},
            {plot.x, Bottom(plot), plot.width, Bottom(rectangle) - Bottom(plot)},
            {Right(plot) + gap, plot.y, Right(rectangle) - Right(plot) - gap, plot.height}};
}

void DrawPicture(const Sonogram& sonogram, DrawTarget& target, const RectF& rectangle) {
    if (!IsDrawable(rectangle)) return;
    const RectF plot = Snapped(rectangle);
    const DrawingBitmap& bitmap = sonogram.GetBitmap();
    // What was never heard is no silence.
    const float perColumn = plot.width / static_cast<float>(std::max(bitmap.width, 1));
    const float unheard = static_cast<float>(bitmap.width - sonogram.GetHeardColumns());
    const float empty = std::round(perColumn * unheard);
    const float under = std::max(empty - 1.0f, 0.0f);  // no seam
    target.PushClip(Shrunk(plot, under, 0.0f, 0.0f, 0.0f));
    target.Bitmap(bitmap, plot, 255);
    target.PopClip();
    target.FillRectangle({plot.x, plot.y, empty, plot.height}, {Look::kPlot});
}

// Labels and marks stand beside the rectangle's right edge; half of the outermost may stand beyond its ends.
void DrawFrequencyScale(const Sonogram& sonogram, DrawTarget& target, const RectF& rectangle, bool notes) {
    const int rows = sonogram.GetBitmap().height;
    if (!IsDrawable(rectangle) || rows < 1) return;
    DrawFrequencies(target, rectangle, sonogram.GetFrequencyMap(),
                    rectangle.height / static_cast<float>(rows), notes);
}

void DrawIntensityScale(Sonogram& sonogram, DrawTarget& target, const RectF& rectangle) {
    if (!IsDrawable(rectangle)) return;
    const float scale = target.Scale(), gap = Look::kGap * scale;
    const RectF bar = Snapped({rectangle.x, rectangle.y, Look::kIntensity * scale, rectangle.height});
    if (!IsDrawable(bar)) return;
    target.Bitmap(sonogram.PrepareIntensityScale(static_cast<int>(bar.width), static_cast<int>(bar.height)),
                  bar, 255);
    target.OutlineRectangle(bar, {{Look::kGrid}, std::max(std::round(scale), 1.0f)});
    const CoordinatesAndFrequencies levels(rectangle, 0.0, 1.0, FrequencyScale::Linear, LevelScale::Decibels,
                                           sonogram.GetRange());
    const float beyond = kCapHeight * Look::kLabelSize * scale / 2.0f + 1.0f;
    AxisTicks ticks = LevelTicks(levels, RoomForLevels(target, rectangle.height));
    ticks.Place([&](double level) { return levels.LevelToY(level); });
    DrawLabelColumn(target, ticks, rectangle.y - beyond, Bottom(rectangle) + beyond, Right(bar) + gap,
                    TextAlign::Left);
}

void DrawTimeline(const Sonogram& sonogram, DrawTarget& target, const RectF& rectangle) {
    if (!IsDrawable(rectangle)) return;
    const float scale = target.Scale();
    const double perSecond = Sonogram::GetColumnsPerSecond(), last = sonogram.GetTimeAtRightEdge();
    AxisRoom room = RoomAlong(target, rectangle.width);
    room.label += target.MeasureText("\u221200.0", Look::kLabelSize * scale).width;
    AxisTicks ticks = TimeTicks(last, rectangle.width / perSecond, room);
    ticks.Place(
        [&](double time) { return static_cast<float>(Right(rectangle) + (time - last) * perSecond); });
    const float width = std::max(std::round(scale), 1.0f);
    for (const AxisTick& tick : ticks.All())
        target.FillRectangle({MarkAt(tick.at, rectangle.x, Right(rectangle) - width), rectangle.y, width,
                              0.75f * Look::kGap * scale},
                             {Look::kLabel});
    const float beyond = target.MeasureText("0.0 s", Look::kLabelSize * scale).width / 2.0f;
    DrawLabelRow(target, ticks, rectangle.x - beyond, Right(rectangle) + beyond,
                 RowBaseline(target, rectangle.y));
}

// One line for every stretch of one note or of a glide, on a dark one that keeps it apart from bright
// colours.
void DrawPitchTrace(Sonogram& sonogram, DrawTarget& target, const RectF& rectangle) {
    const DrawingBitmap& bitmap = sonogram.GetBitmap();
    if (!IsDrawable(rectangle) || bitmap.IsEmpty()) return;
    const CoordinatesAndFrequencies& map = sonogram.GetFrequencyMap();
    std::vector<PointF>& trace = ViewAccess::Trace(sonogram);
    constexpr float kLargestStep = PitchTrace::kLargestStep;
    const float perRow = rectangle.height / static_cast<float>(bitmap.height);
    const float perColumn = rectangle.width / static_cast<float>(bitmap.width);
    const float width = Look::kTraceWidth * target.Scale();
    trace.reserve(static_cast<std::size_t>(bitmap.width));
    target.PushClip(rectangle);
    const int longestGap =
        PitchTrace::kLongestGap * Sonogram::GetColumnsPerSecond() / PitchTrace::kRefreshesPerSecond;
    for (int column = 0; column < bitmap.width;) {
        trace.clear();
        float before = 0.0f;
        for (int last = column; column < bitmap.width && column <= last + 1 + longestGap; ++column) {
            const float pitch = sonogram.GetPitch(column);
            if (!(pitch > 0.0f)) continue;
            if (before > 0.0f && (pitch > before * kLargestStep || before > pitch * kLargestStep)) break;
            trace.push_back({rectangle.x + (static_cast<float>(column) + 0.5f) * perColumn,
                             Bottom(rectangle) - map.FrequencyToX(pitch) * perRow});
            before = pitch;
            last = column;
        }
        const auto count = static_cast<int>(trace.size());
        if (count == 0) continue;
        target.Polyline(trace.data(), count, {{Look::kGround, 200}, 2.0f * width});
        target.Polyline(trace.data(), count, {{Look::kTrace}, width});
    }
    target.PopClip();
}

void DrawSonogramAs(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle,
                    const SpectrumSettings& view) {
    if (!IsDrawable(rectangle)) return;
    const std::lock_guard lock(ViewAccess::Lock(analyser));
    Sonogram& sonogram = *analyser.GetSonogram();
    const SonogramLayout layout = LayOutSonogram(target, rectangle, view);
    const int prepared = analyser.GetSpectrumDrawer()->GetSamplingFrequency();
    const int rate = prepared > 0 ? prepared : ViewAccess::SamplingRate(analyser);
    const CoordinatesAndFrequencies shown =
        UprightMap(layout.plot.height, view, rate, ViewAccess::Span(analyser));
    const RectF axis = WholeAxis(layout.plot, shown, UprightMap(layout.plot.height, view, rate, {}));
    ViewAccess::Shown(analyser).sonogram = layout.plot;
    ViewAccess::Shown(analyser).sonogramAxis = axis;
    sonogram.CheckPixelBufferSize(layout.plot, RowsOf(axis));
    target.PushClip(rectangle);
    DrawGround(target, rectangle, layout.plot);
    target.PushClip(layout.plot);
    DrawPicture(sonogram, target, axis);
    if (analyser.GetTunerOn()) DrawPitchTrace(sonogram, target, axis);
    if (sonogram.GetSecondsBack() > 0.0) DrawPastEdge(target, layout.plot);
    target.PopClip();
    DrawSonogramMarker(analyser, target, layout.plot,
                       Bottom(layout.plot) - shown.FrequencyToX(ViewAccess::Marker(analyser).frequency));
    if (IsDrawable(layout.frequencies))
        DrawFrequencies(target, layout.frequencies, shown, 1.0f, view.view_flag_d);
    DrawTimeline(sonogram, target, layout.timeline);
    DrawIntensityScale(sonogram, target, layout.intensity);
    if (analyser.IsShowInfoBox() && view.view_flag_c != 0) DrawSonogramInfo(analyser, target, layout.plot);
    target.PopClip();
}

void DrawSonogram(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle) {
    ViewAccess::ForgetPlots(analyser);
    DrawSonogramAs(analyser, target, rectangle, kivspectrum::GetSettings());
}

void DrawIntensityScale(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle) {
    const std::lock_guard lock(ViewAccess::Lock(analyser));
    DrawIntensityScale(*analyser.GetSonogram(), target, rectangle);
}

}  // namespace Corvo
