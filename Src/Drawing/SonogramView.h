#pragma once

#include <algorithm>
#include <cmath>
#include <mutex>

#include "Drawing/AxisDrawing.h"
#include "Drawing/ShortText.h"
#include "Drawing/SpectrumView.h"
#include "Spectrum/Sonogram.h"
#include "Spectrum/kivspectrum.h"

// The sonogram with its scales.
namespace Corvo {

// Where the parts of a sonogram stand; strips of no width where they are not wanted or leave no room.
struct SonogramLayout {
    RectF plot, frequencies, timeline, intensity;
};

template <typename Target>
SonogramLayout LayOutSonogram(Target& target, const RectF& rectangle, bool labels, bool notes) {
    const float scale = target.Scale(), size = Look::kLabelSize * scale, gap = Look::kGap * scale;
    const TextMetrics line = target.MeasureText("0", size);
    const float left = LabelWidth(target, notes) + 2.0f * gap, below = line.ascent + line.descent + gap;
    const float right = Look::kIntensity * scale + LabelWidth(target, false) + 3.0f * gap;
    const RectF plot = Snapped(Shrunk(rectangle, left, gap, right, below));
    const float least = Look::kLeastPlot * scale;
    if (!labels || plot.width < least || plot.height < least) return {Snapped(rectangle), {}, {}, {}};
    return {plot,
            {rectangle.x, plot.y, plot.x - rectangle.x, plot.height},
            {plot.x, Bottom(plot), plot.width, Bottom(rectangle) - Bottom(plot)},
            {Right(plot) + gap, plot.y, Right(rectangle) - Right(plot) - gap, plot.height}};
}

template <class Drawing>
void Sonogram::Draw(typename Drawing::DrawTarget& target, const RectF& rectangle) {
    if (IsDrawable(rectangle)) target.Bitmap(m_bitmap, Snapped(rectangle), 255);
}

template <class Drawing>
void Sonogram::DrawFrequencyScale(typename Drawing::DrawTarget& target, const RectF& rectangle,
                                  bool noteNames) {
    if (!IsDrawable(rectangle) || m_bitmap.height < 1) return;
    const float scale = target.Scale(), gap = Look::kGap * scale;
    const AxisTicks ticks = FrequencyTicks(m_map, rectangle.height, 6.0f * scale, noteNames);
    const float perRow = rectangle.height / static_cast<float>(m_bitmap.height);
    const auto yOf = [&](double hz) { return Bottom(rectangle) - m_map.FrequencyToX(hz) * perRow; };
    const float width = std::max(std::round(scale), 1.0f);
    for (const AxisTick& tick : ticks.All()) {
        const float y = std::clamp(std::floor(yOf(tick.value)), rectangle.y, Bottom(rectangle) - width);
        const float length = tick.rank < AxisTick::kUnlabelled ? 0.75f * gap : 0.4f * gap;
        target.FillRectangle({Right(rectangle) - length, y, length, width}, {Look::kLabel});
    }
    DrawLabelColumn(target, ticks, rectangle.y, Bottom(rectangle), Right(rectangle) - 1.5f * gap,
                    TextAlign::Right, yOf);
}

template <class Drawing>
void Sonogram::DrawIntensityScale(typename Drawing::DrawTarget& target, const RectF& rectangle) {
    if (!IsDrawable(rectangle)) return;
    const float scale = target.Scale(), gap = Look::kGap * scale;
    const TextMetrics line = target.MeasureText("0", Look::kLabelSize * scale);
    const RectF bar = Snapped({rectangle.x, rectangle.y, Look::kIntensity * scale, rectangle.height});
    if (!IsDrawable(bar)) return;
    target.Bitmap(PrepareIntensityScale(static_cast<int>(bar.width), static_cast<int>(bar.height)), bar, 255);
    target.OutlineRectangle(bar, {{Look::kGrid}, std::max(std::round(scale), 1.0f)});
    const CoordinatesAndFrequencies levels(rectangle, 0.0, 1.0, FrequencyScale::Linear, LevelScale::Decibels,
                                           GetRange());
    DrawLabelColumn(target,
                    LevelTicks(levels, rectangle.height, Look::kLevelPitch * (line.ascent + line.descent)),
                    rectangle.y, Bottom(rectangle), Right(bar) + gap, TextAlign::Left,
                    [&](double level) { return levels.LevelToY(level); });
}

template <class Drawing>
void Sonogram::DrawTimeline(typename Drawing::DrawTarget& target, const RectF& rectangle) {
    if (!IsDrawable(rectangle)) return;
    const float scale = target.Scale(), size = Look::kLabelSize * scale;
    const TextMetrics line = target.MeasureText("\u2212000.0", size);
    const double seconds = rectangle.width / static_cast<double>(GetColumnsPerSecond());
    const AxisTicks ticks = TimeTicks(seconds, rectangle.width, line.width + Look::kLabelGap * scale);
    const auto xOf = [&](double time) {
        return static_cast<float>(Right(rectangle) + time * GetColumnsPerSecond());
    };
    const float width = std::max(std::round(scale), 1.0f);
    for (const AxisTick& tick : ticks.All()) {
        const float x = std::clamp(std::floor(xOf(tick.value)), rectangle.x, Right(rectangle) - width);
        target.FillRectangle({x, rectangle.y, width, 0.75f * Look::kGap * scale}, {Look::kLabel});
    }
    DrawLabelRow(target, ticks, rectangle.x, Right(rectangle), Bottom(rectangle) - line.descent, xOf);
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
        target.Polyline(m_trace.data(), count, {{Look::kGround, 200}, 2.0f * width});
        target.Polyline(m_trace.data(), count, {{Look::kTrace}, width});
        if (count == 0) ++column;
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
    using namespace Corvo;
    if (!IsDrawable(rectangle)) return;
    const spectrum_settings view = GetSettings();
    const std::lock_guard lock(m_instanceLock);
    const SonogramLayout layout = LayOutSonogram(target, rectangle, view.view_flag_b != 0, ShowsNotes(view));
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
    const double time = (pointer.x - Right(plot)) / static_cast<double>(Sonogram::GetColumnsPerSecond());
    const ShortText text =
        DescribeSpectrum(hz, level, LevelScale::Decibels).Add("   ").AddNumber(time, 2).Add(" s");
    const float gap = Look::kGap * target.Scale();
    const bool rightwards = pointer.x < Centre(plot).x;
    DrawInfoBox(target, Shrunk(plot, gap, gap, gap, gap),
                {pointer.x + (rightwards ? 2.0f : -2.0f) * gap, pointer.y + 2.0f * gap}, rightwards,
                text.View());
}

template <class Drawing>
void kivspectrum::DoDrawSonogramAndSpectrum(typename Drawing::DrawTarget& target,
                                            const Corvo::RectF& rectangle) {
    using namespace Corvo;
    if (!IsDrawable(rectangle)) return;
    constexpr float kSpectrum = 0.4f;
    const float upper = std::round(kSpectrum * rectangle.height);
    DoDrawSpectrum<Drawing>(target, {rectangle.x, rectangle.y, rectangle.width, upper});
    DrawSonogramComponents<Drawing>(
        target, {rectangle.x, rectangle.y + upper, rectangle.width, rectangle.height - upper});
}
