#pragma once

#include <algorithm>
#include <cmath>
#include <mutex>

#include "Drawing/Views/AxisDrawing.h"
#include "Drawing/Views/ShortText.h"
#include "Drawing/Views/SpectrumView.h"
#include "Platform/CriticalSection.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/kivspectrum.h"

// The sonogram with its scales.
namespace Corvo {

// Where the parts of a sonogram stand; strips of no width where they are not wanted or leave no room.
struct SonogramLayout {
    RectF plot, frequencies, timeline, intensity;
};

template <typename Target>
SonogramLayout LayOutSonogram(Target& target, const RectF& rectangle, const SpectrumSettings& settings) {
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

template <class Drawing>
void Sonogram::Draw(typename Drawing::DrawTarget& target, const RectF& rectangle) {
    if (!IsDrawable(rectangle)) return;
    const RectF plot = Snapped(rectangle);
    target.Bitmap(m_bitmap, plot, 255);
    // What was never heard is no silence.
    const float perColumn = plot.width / static_cast<float>(std::max(m_bitmap.width, 1));
    const float empty = perColumn * static_cast<float>(m_bitmap.width - m_heardColumns);
    target.FillRectangle({plot.x, plot.y, std::round(empty), plot.height}, {Look::kPlot});
}

// A mark on whole pixels, at `at` or as near as it stays within first..last.
inline float MarkAt(float at, float first, float last) {
    return std::max(std::min(std::floor(at), last), first);
}

// Labels and marks stand beside the rectangle's right edge; half of the outermost may stand beyond its ends.
template <class Drawing>
void Sonogram::DrawFrequencyScale(typename Drawing::DrawTarget& target, const RectF& rectangle,
                                  bool noteNames) {
    if (!IsDrawable(rectangle) || m_bitmap.height < 1) return;
    const float scale = target.Scale(), gap = Look::kGap * scale;
    const float perRow = rectangle.height / static_cast<float>(m_bitmap.height);
    AxisRoom room = RoomBeside(target, rectangle.height);
    room = {static_cast<float>(m_bitmap.height), room.line / perRow,
            room.label / perRow};  // in the map's rows
    const AxisTicks ticks = FrequencyTicks(m_map, room, noteNames);
    const auto yOf = [&](double hz) { return Bottom(rectangle) - m_map.FrequencyToX(hz) * perRow; };
    const float width = std::max(std::round(scale), 1.0f);
    for (const AxisTick& tick : ticks.All()) {
        const float length = tick.rank < AxisTick::kUnlabelled ? 0.75f * gap : 0.4f * gap;
        target.FillRectangle({Right(rectangle) - length,
                              MarkAt(yOf(tick.value), rectangle.y, Bottom(rectangle) - width), length, width},
                             {Look::kLabel});
    }
    const float beyond = kCapHeight * Look::kLabelSize * scale / 2.0f + 1.0f;
    DrawLabelColumn(target, ticks, rectangle.y - beyond, Bottom(rectangle) + beyond,
                    Right(rectangle) - 1.5f * gap, TextAlign::Right, yOf);
}

template <class Drawing>
void Sonogram::DrawIntensityScale(typename Drawing::DrawTarget& target, const RectF& rectangle) {
    if (!IsDrawable(rectangle)) return;
    const float scale = target.Scale(), gap = Look::kGap * scale;
    const RectF bar = Snapped({rectangle.x, rectangle.y, Look::kIntensity * scale, rectangle.height});
    if (!IsDrawable(bar)) return;
    target.Bitmap(PrepareIntensityScale(static_cast<int>(bar.width), static_cast<int>(bar.height)), bar, 255);
    target.OutlineRectangle(bar, {{Look::kGrid}, std::max(std::round(scale), 1.0f)});
    const CoordinatesAndFrequencies levels(rectangle, 0.0, 1.0, FrequencyScale::Linear, LevelScale::Decibels,
                                           GetRange());
    const float beyond = kCapHeight * Look::kLabelSize * scale / 2.0f + 1.0f;
    DrawLabelColumn(target, LevelTicks(levels, RoomForLevels(target, rectangle.height)), rectangle.y - beyond,
                    Bottom(rectangle) + beyond, Right(bar) + gap, TextAlign::Left,
                    [&](double level) { return levels.LevelToY(level); });
}

template <class Drawing>
void Sonogram::DrawTimeline(typename Drawing::DrawTarget& target, const RectF& rectangle) {
    if (!IsDrawable(rectangle)) return;
    const float scale = target.Scale();
    const double perSecond = GetColumnsPerSecond(), last = m_timeAtRightEdge;
    AxisRoom room = RoomAlong(target, rectangle.width);
    room.label += target.MeasureText("\u221200.0", Look::kLabelSize * scale).width;
    const AxisTicks ticks = TimeTicks(last, rectangle.width / perSecond, room);
    const auto xOf = [&](double time) {
        return static_cast<float>(Right(rectangle) + (time - last) * perSecond);
    };
    const float width = std::max(std::round(scale), 1.0f);
    for (const AxisTick& tick : ticks.All())
        target.FillRectangle({MarkAt(xOf(tick.value), rectangle.x, Right(rectangle) - width), rectangle.y,
                              width, 0.75f * Look::kGap * scale},
                             {Look::kLabel});
    const float beyond = target.MeasureText("0.0 s", Look::kLabelSize * scale).width / 2.0f;
    DrawLabelRow(target, ticks, rectangle.x - beyond, Right(rectangle) + beyond,
                 RowBaseline(target, rectangle.y), xOf);
}

// One line for every stretch of one note or of a glide, on a dark one that keeps it apart from bright
// colours.
template <class Drawing>
void Sonogram::DrawPitchTrace(typename Drawing::DrawTarget& target, const RectF& rectangle) {
    if (!IsDrawable(rectangle) || m_bitmap.IsEmpty()) return;
    constexpr float kLargestStep = 1.09f;  // one and a half semitones from column to column is another note
    const float perRow = rectangle.height / static_cast<float>(m_bitmap.height);
    const float perColumn = rectangle.width / static_cast<float>(m_bitmap.width);
    const float width = Look::kTraceWidth * target.Scale();
    m_trace.reserve(static_cast<std::size_t>(m_bitmap.width));
    target.PushClip(rectangle);
    for (int column = 0; column < m_bitmap.width;) {
        m_trace.clear();
        float before = GetPitch(column);
        for (; column < m_bitmap.width; ++column) {
            const float pitch = GetPitch(column);
            if (!(pitch > 0.0f) || pitch > before * kLargestStep || before > pitch * kLargestStep) break;
            m_trace.push_back({rectangle.x + (static_cast<float>(column) + 0.5f) * perColumn,
                               Bottom(rectangle) - m_map.FrequencyToX(pitch) * perRow});
            before = pitch;
        }
        const auto count = static_cast<int>(m_trace.size());
        if (count == 0) {
            ++column;
            continue;
        }
        target.Polyline(m_trace.data(), count, {{Look::kGround, 200}, 2.0f * width});
        target.Polyline(m_trace.data(), count, {{Look::kTrace}, width});
    }
    target.PopClip();
}

}  // namespace Corvo

template <class Drawing>
void kivspectrum::DrawSonogramIntensityScale(typename Drawing::DrawTarget& target,
                                             const Corvo::RectF& rectangle) {
    const std::lock_guard lock(m_instanceLock);
    m_sonogram->DrawIntensityScale<Drawing>(target, rectangle);
}

template <class Drawing>
void kivspectrum::DrawSonogramComponents(typename Drawing::DrawTarget& target,
                                         const Corvo::RectF& rectangle) {
    DrawSonogramAs<Drawing>(target, rectangle, GetSettings());
}

template <class Drawing>
void kivspectrum::DrawSonogramAs(typename Drawing::DrawTarget& target, const Corvo::RectF& rectangle,
                                 const spectrum_settings& view) {
    using namespace Corvo;
    if (!IsDrawable(rectangle)) return;
    const std::lock_guard lock(m_instanceLock);
    const SonogramLayout layout = LayOutSonogram(target, rectangle, view);
    m_sonogram->CheckPixelBufferSize(layout.plot, 0);
    target.PushClip(rectangle);
    target.FillRectangle(rectangle, {Look::kGround});
    m_sonogram->Draw<Drawing>(target, layout.plot);
    if (m_tunerOn) m_sonogram->DrawPitchTrace<Drawing>(target, layout.plot);
    m_sonogram->DrawFrequencyScale<Drawing>(target, layout.frequencies, view.view_flag_d);
    m_sonogram->DrawTimeline<Drawing>(target, layout.timeline);
    m_sonogram->DrawIntensityScale<Drawing>(target, layout.intensity);
    if (m_showInfoBox && view.view_flag_c != 0) DrawSonogramInfo<Drawing>(target, layout.plot);
    target.PopClip();
}

template <class Drawing>
void kivspectrum::DrawSonogramInfo(typename Drawing::DrawTarget& target, const Corvo::RectF& plot) {
    using namespace Corvo;
    const PointF pointer{m_pointerX, m_pointerY};
    if (!Contains(plot, pointer)) return;
    const auto& map = m_sonogram->GetFrequencyMap();
    const double rows = m_sonogram->GetBitmap().height;
    const double hz = map.XToFrequency((Bottom(plot) - pointer.y) * rows / plot.height);
    const float level = m_sonogram->GetPointAmplitude(pointer.x, pointer.y, plot);
    const double ago = (Right(plot) - pointer.x) / static_cast<double>(Sonogram::GetColumnsPerSecond());
    const ShortText text = DescribeSpectrum(hz, level, LevelScale::Decibels)
                               .Add("   ")
                               .AddNumber(m_sonogram->GetTimeAtRightEdge() - ago, 2)
                               .Add(" s");
    DrawPointerBox(target, plot, pointer, text.View());
}

template <class Drawing>
void kivspectrum::DoDrawSonogramAndSpectrum(typename Drawing::DrawTarget& target,
                                            const Corvo::RectF& rectangle) {
    using namespace Corvo;
    if (!IsDrawable(rectangle)) return;
    constexpr float kSpectrum = 0.4f;
    const float height = std::round(kSpectrum * rectangle.height);
    const RectF upper{rectangle.x, rectangle.y, rectangle.width, height};
    const RectF lower = Shrunk(rectangle, 0.0f, height, 0.0f, 0.0f);
    spectrum_settings view = GetSettings();
    // Labels on both or on neither, so that the plots stand flush.
    if (!LayOutSpectrum(target, upper, view).labels ||
        !IsDrawable(LayOutSonogram(target, lower, view).timeline))
        view.view_flag_b = 0;
    DrawSpectrumAs<Drawing>(target, upper, view);
    DrawSonogramAs<Drawing>(target, lower, view);
}
