#include "Drawing/Views/SonogramView.h"

#include <algorithm>
#include <cmath>
#include <mutex>
#include <vector>

#include "Drawing/Views/AxisDrawing.h"
#include "Drawing/Views/Look.h"
#include "Drawing/Views/ShortText.h"
#include "Drawing/Views/SpectrumView.h"
#include "Drawing/Views/ViewAccess.h"
#include "Drawing/Views/Views.h"
#include "Spectrum/Sonogram/Sonogram.h"

namespace Corvo {
namespace {

// A mark on whole pixels, at `at` or as near as it stays within first..last.
float MarkAt(float at, float first, float last) { return std::max(std::min(std::floor(at), last), first); }

void DrawSonogramInfo(kivspectrum& analyser, DrawTarget& target, const RectF& plot) {
    const PointF pointer = ViewAccess::Pointer(analyser);
    if (!Contains(plot, pointer)) return;
    const Sonogram& sonogram = *analyser.GetSonogram();
    const double rows = sonogram.GetBitmap().height;
    const double hz =
        sonogram.GetFrequencyMap().XToFrequency((Bottom(plot) - pointer.y) * rows / plot.height);
    const float level = sonogram.GetPointAmplitude(pointer.x, pointer.y, plot);
    const double ago = (Right(plot) - pointer.x) / static_cast<double>(Sonogram::GetColumnsPerSecond());
    const ShortText text = DescribeSpectrum(hz, level, LevelScale::Decibels)
                               .Add("   ")
                               .AddNumber(sonogram.GetTimeAtRightEdge() - ago, 2)
                               .Add(" s");
    DrawPointerBox(target, plot, pointer, text.View());
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
    target.Bitmap(bitmap, plot, 255);
    // What was never heard is no silence.
    const float perColumn = plot.width / static_cast<float>(std::max(bitmap.width, 1));
    const float empty = perColumn * static_cast<float>(bitmap.width - sonogram.GetHeardColumns());
    target.FillRectangle({plot.x, plot.y, std::round(empty), plot.height}, {Look::kPlot});
}

// Labels and marks stand beside the rectangle's right edge; half of the outermost may stand beyond its ends.
void DrawFrequencyScale(const Sonogram& sonogram, DrawTarget& target, const RectF& rectangle, bool notes) {
    const int rows = sonogram.GetBitmap().height;
    if (!IsDrawable(rectangle) || rows < 1) return;
    const CoordinatesAndFrequencies& map = sonogram.GetFrequencyMap();
    const float scale = target.Scale(), gap = Look::kGap * scale;
    const float perRow = rectangle.height / static_cast<float>(rows);
    AxisRoom room = RoomBeside(target, rectangle.height);
    room = {static_cast<float>(rows), room.line / perRow, room.label / perRow};  // in the map's rows
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
    constexpr float kLargestStep = 1.09f;  // one and a half semitones from column to column is another note
    constexpr float kLongestGap = 0.1f;    // seconds that a note may go unheard without a gap in its line
    const float perRow = rectangle.height / static_cast<float>(bitmap.height);
    const float perColumn = rectangle.width / static_cast<float>(bitmap.width);
    const float width = Look::kTraceWidth * target.Scale();
    trace.reserve(static_cast<std::size_t>(bitmap.width));
    target.PushClip(rectangle);
    const int longestGap =
        static_cast<int>(kLongestGap * static_cast<float>(Sonogram::GetColumnsPerSecond()));
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
    sonogram.CheckPixelBufferSize(layout.plot, 0);
    target.PushClip(rectangle);
    target.FillRectangle(rectangle, {Look::kGround});
    DrawPicture(sonogram, target, layout.plot);
    if (analyser.GetTunerOn()) DrawPitchTrace(sonogram, target, layout.plot);
    DrawFrequencyScale(sonogram, target, layout.frequencies, view.view_flag_d);
    DrawTimeline(sonogram, target, layout.timeline);
    DrawIntensityScale(sonogram, target, layout.intensity);
    if (analyser.IsShowInfoBox() && view.view_flag_c != 0) DrawSonogramInfo(analyser, target, layout.plot);
    target.PopClip();
}

void DrawSonogram(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle) {
    DrawSonogramAs(analyser, target, rectangle, kivspectrum::GetSettings());
}

void DrawIntensityScale(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle) {
    const std::lock_guard lock(ViewAccess::Lock(analyser));
    DrawIntensityScale(*analyser.GetSonogram(), target, rectangle);
}

}  // namespace Corvo
