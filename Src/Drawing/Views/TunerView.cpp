#include <algorithm>
#include <array>
#include <cmath>
#include <numbers>
#include <string>
#include <string_view>

#include "Drawing/Views/Look.h"
#include "Drawing/Views/Rectangles.h"
#include "Drawing/Views/ShortText.h"
#include "Drawing/Views/Views.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Spectrum/Tuner/TunerPanelBitmaps.h"

// The tuner's panel.
namespace Corvo {
namespace {

constexpr float kDialCents = 50.0f;
constexpr float kDialHalfAngle = std::numbers::pi_v<float> * 50.0f / 180.0f;
constexpr float kLeastInfoLine = 15.0f;  // in 1/96 inch; its text is 0.62 of that
constexpr const char* kNoNote = "\u2013";

// On the circle around `centre`, `angle` to the right of upright.
PointF OnCircle(PointF centre, float radius, float angle) {
    return {centre.x + radius * std::sin(angle), centre.y - radius * std::cos(angle)};
}

// A band of the dial between two angles.
void FillArc(DrawTarget& target, PointF centre, float inner, float outer, float from, float to, Ink ink) {
    constexpr int kSteps = 48;
    std::array<PointF, 2 * (kSteps + 1)> outline;
    for (int i = 0; i <= kSteps; ++i) {
        const float angle = from + (to - from) * static_cast<float>(i) / kSteps;
        outline[static_cast<std::size_t>(i)] = OnCircle(centre, outer, angle);
        outline[outline.size() - 1 - static_cast<std::size_t>(i)] = OnCircle(centre, inner, angle);
    }
    target.FillPolygon(outline.data(), static_cast<int>(outline.size()), ink);
}

// Below full size when the text would be wider than the room for it.
float FittingSize(DrawTarget& target, std::string_view text, float size, float width) {
    const float wide = target.MeasureText(text, size).width;
    return wide > width && wide > 0.0f ? size * width / wide : size;
}

// How many of the four ripples an error lights.
int LitBars(float cents) {
    constexpr float kFrom[] = {0.0f, 8.0f, 18.0f, 32.0f};
    int lit = 0;
    for (const float from : kFrom) lit += std::abs(cents) >= from ? 1 : 0;
    return lit;
}

// Where the dial stands within a rectangle, its labels outside of the arc included.
struct DialLayout {
    PointF pivot;
    float radius, labelSize;
};

constexpr float kHub = 0.05f;       // of the radius
constexpr float kLabelRoom = 2.4f;  // around the arc, of the labels' size

DialLayout LayOutDial(const RectF& r, float scale) {
    const float size = std::clamp(r.height * 0.08f, Look::kSmallest * scale, 15.0f * scale);
    const float room = kLabelRoom * size;
    const float byWidth = (r.width / 2.0f - room) / std::sin(kDialHalfAngle);
    const float byHeight = (r.height - room) / (1.0f + kHub);
    const float radius = std::max(std::min(byWidth, byHeight), 0.0f);
    return {{Centre(r).x, Bottom(r) - kHub * radius}, radius, size};
}

float DialAngle(float cents) {
    return std::clamp(cents, -kDialCents, kDialCents) / kDialCents * kDialHalfAngle;
}

void DrawDialScale(DrawTarget& target, const DialLayout& dial) {
    const float scale = target.Scale(), size = dial.labelSize;
    const float inner = dial.radius * 0.90f;
    FillArc(target, dial.pivot, dial.radius - 1.5f * scale, dial.radius, -kDialHalfAngle, kDialHalfAngle,
            {Look::kGrid});
    const float tuned = std::clamp(DialAngle(Tuner::GetTunedQuantum()), 0.012f, kDialHalfAngle);
    FillArc(target, dial.pivot, inner, dial.radius, -tuned, tuned, {Look::kInTune, 90});
    const float room = dial.radius * kDialHalfAngle / 5.0f;  // along the arc, per ten cents
    const bool everyTen = room > 1.6f * target.MeasureText("\u221250", size).width;
    for (int cents = -50; cents <= 50; cents += 5) {
        const bool major = cents % 10 == 0;
        if (!major && room < 12.0f * scale) continue;
        const float angle = DialAngle(static_cast<float>(cents));
        const PointF from = OnCircle(dial.pivot, major ? inner : dial.radius * 0.95f, angle);
        target.Line(from, OnCircle(dial.pivot, dial.radius, angle),
                    {{major ? Look::kLabel : Look::kGrid}, (major ? 1.5f : 1.0f) * scale});
        if (!major || !(everyTen || cents % 50 == 0)) continue;
        const ShortText text = ShortText().AddNumber(cents, 0);
        // As far out as the digits' extent in that direction asks for; a sign does not count.
        const float half = target.MeasureText(cents == 0 ? "0" : "50", size).width / 2.0f;
        const float reach = half * std::abs(std::sin(angle)) + kCapHeight * size / 2.0f * std::cos(angle);
        const PointF at = OnCircle(dial.pivot, dial.radius + 0.45f * size + reach, angle);
        target.Text(text.View(), {at.x, at.y + kCapHeight * size / 2.0f}, TextAlign::Centre, size,
                    {Look::kLabel});
    }
}

// A small panel: bars, the note, bars.
void DrawTunerLine(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle) {
    const Tuner& tuner = *analyser.GetTuner();
    const bool tuned = tuner.IsTuned(), centred = tuned && tuner.IsTunedCentered();
    const ShortText name = tuned ? ShortText().Add(tuner.GetTunedNoteName()).AddNumber(tuner.GetOctave(), 0)
                                 : ShortText().Add(kNoNote);
    const float height = std::floor(std::min(rectangle.height * 0.6f, rectangle.width / 8.0f));
    if (height < 4.0f) return;
    kivspectrum::SetupMinimizedTunerBitmaps(static_cast<int>(height));
    const PointF centre = Centre(rectangle);
    const float letter = FittingSize(target, name.View(), height * 1.1f, 2.4f * height);
    target.Text(name.View(), {centre.x, centre.y + kCapHeight * letter / 2.0f}, TextAlign::Centre, letter,
                {centred ? Look::kInTune
                 : tuned ? Look::kText
                         : Look::kLabel});
    // Whole pixels, as the images are.
    const float pitch = std::round(height * 0.55f), width = std::floor(height / 4.0f);
    const float first = std::round(1.5f * height), middle = std::round(centre.x);
    const float cents = tuner.GetErrorCents();
    for (int bar = 0; bar < kTunerBars; ++bar)
        for (const bool left : {true, false}) {
            const bool lit = tuned && !centred && (cents < 0.0f) == left && bar < LitBars(cents);
            const kivspectrum::BarItems& items =
                lit    ? left ? kivspectrum::leftItemsMinimized : kivspectrum::rightItemsMinimized
                : left ? kivspectrum::baseItemsMinimized_L
                       : kivspectrum::baseItemsMinimized_R;
            const float away = first + pitch * static_cast<float>(bar);
            target.Bitmap(
                *items[static_cast<std::size_t>(bar)],
                {middle + (left ? -away - width : away), std::round(centre.y - height / 2.0f), width, height},
                255);
        }
}

}  // namespace

void DrawNote(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle) {
    if (!IsDrawable(rectangle)) return;
    const Tuner& tuner = *analyser.GetTuner();
    const float radius = std::min(rectangle.width, rectangle.height) / 2.0f;
    const PointF centre = Centre(rectangle);
    const bool tuned = tuner.IsTuned(), centred = tuned && tuner.IsTunedCentered();
    kivspectrum::SetupTunerBitmaps(static_cast<int>(std::ceil(radius)));
    const RectF circle = Snapped({centre.x - radius, centre.y - radius, 2.0f * radius, 2.0f * radius});
    target.Bitmap(centred ? kivspectrum::mainWitheCirleBitmap : kivspectrum::mainWitheCirleBitmapBase, circle,
                  255);

    const Ink ink{centred ? Look::kGround : tuned ? Look::kText : Look::kLabel};
    const std::string_view name = tuned ? tuner.GetTunedNoteName() : kNoNote;
    const ShortText octave = tuned ? ShortText().AddNumber(tuner.GetOctave(), 0) : ShortText();
    constexpr float kOctave = 0.36f;  // of the letter's size
    const auto width = [&](float size) {
        return target.MeasureText(name, size).width + target.MeasureText(octave.View(), kOctave * size).width;
    };
    const float full = 1.05f * radius;
    const float size = full * std::min(1.0f, 1.55f * radius / std::max(width(full), 1.0f));
    const PointF start{centre.x - width(size) / 2.0f, centre.y + kCapHeight * size / 2.0f};
    target.Text(name, start, TextAlign::Left, size, ink);
    const float octaveX = start.x + target.MeasureText(name, size).width;
    target.Text(octave.View(), {octaveX, start.y + 0.08f * size}, TextAlign::Left, kOctave * size, ink);
}

void DrawNoteAndRipples(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle) {
    if (!IsDrawable(rectangle)) return;
    const Tuner& tuner = *analyser.GetTuner();
    const TunerBarShape outermost = TunerBarOf(kTunerBars - 1, false);
    const float halfWidth = outermost.left + outermost.width, halfHeight = -outermost.top;
    const float radius = std::floor(
        0.94f * std::min(rectangle.width / (2.0f * halfWidth), rectangle.height / (2.0f * halfHeight)));
    if (radius < 1.0f) return;
    // Between pixels, so that images made for this radius are copied as they are.
    const PointF centre{std::round(Centre(rectangle).x), std::round(Centre(rectangle).y)};
    DrawNote(analyser, target, {centre.x - radius, centre.y - radius, 2.0f * radius, 2.0f * radius});
    const bool tuned = tuner.IsTuned() && !tuner.IsTunedCentered();
    const float cents = tuner.GetErrorCents();
    for (int bar = 0; bar < kTunerBars; ++bar)
        for (const bool left : {true, false}) {
            const bool lit = tuned && (cents < 0.0f) == left && bar < LitBars(cents);
            const kivspectrum::BarItems& items = lit ? left ? kivspectrum::leftItems : kivspectrum::rightItems
                                                 : left ? kivspectrum::baseItems_L
                                                        : kivspectrum::baseItems_R;
            const TunerBarPixels pixels = TunerBarPixelsOf(bar, left, static_cast<int>(radius));
            target.Bitmap(
                *items[static_cast<std::size_t>(bar)],
                {centre.x + static_cast<float>(pixels.left), centre.y + static_cast<float>(pixels.top),
                 static_cast<float>(pixels.width), static_cast<float>(pixels.height)},
                255);
        }
}

void DrawNeedle(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle) {
    if (!IsDrawable(rectangle)) return;
    const Tuner& tuner = *analyser.GetTuner();
    const DialLayout dial = LayOutDial(rectangle, target.Scale());
    if (dial.radius < 8.0f) return;
    DrawDialScale(target, dial);
    const bool tuned = tuner.IsTuned();
    const float angle = DialAngle(tuned ? tuner.GetErrorCents() : -kDialCents);
    const ColourReference colour = !tuned                    ? Look::kGrid
                                   : tuner.IsTunedCentered() ? Look::kInTune
                                                             : Look::kNeedle;
    const float half = std::max(dial.radius * 0.018f, 1.0f);
    const PointF needle[] = {OnCircle(dial.pivot, dial.radius * 0.97f, angle),
                             OnCircle(dial.pivot, half, angle + std::numbers::pi_v<float> / 2.0f),
                             OnCircle(dial.pivot, half, angle - std::numbers::pi_v<float> / 2.0f)};
    target.FillPolygon(needle, 3, {colour});
    const float hub = dial.radius * kHub;
    target.FillRoundedRectangle({dial.pivot.x - hub, dial.pivot.y - hub, 2.0f * hub, 2.0f * hub}, hub,
                                {colour});
}

void DrawNeedleInfo(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle) {
    if (!IsDrawable(rectangle)) return;
    const Tuner& tuner = *analyser.GetTuner();
    // The error comes first; the other lines only where they stay large enough to read.
    const float most = rectangle.height / (kLeastInfoLine * target.Scale());
    const int lines = static_cast<int>(std::clamp(most, 1.0f, static_cast<float>(TunerGetNumLines())));
    const float middle = Centre(rectangle).x;
    const float pitch = rectangle.height / (static_cast<float>(lines) + 0.4f);
    const auto baseline = [&](int line) { return rectangle.y + pitch * (static_cast<float>(line) + 0.85f); };
    const bool tuned = tuner.IsTuned();
    const float room = 0.94f * rectangle.width;

    const std::string error = tuned ? tuner.GetTuningErrorStr() : kNoNote;
    const float arrow = 0.5f * pitch;
    const float size = FittingSize(target, error, 0.82f * pitch, std::max(room - 4.0f * arrow, 0.4f * room));
    const bool centred = tuned && tuner.IsTunedCentered();
    target.Text(error, {middle, baseline(0)}, TextAlign::Centre, size,
                {!tuned    ? Look::kLabel
                 : centred ? Look::kInTune
                           : Look::kText});
    const float away = target.MeasureText(error, size).width / 2.0f + arrow;
    if (tuned && !centred && away + arrow / 2.0f <= rectangle.width / 2.0f) {
        kivspectrum::SetupErrorBitmaps(static_cast<int>(std::ceil(arrow)));
        const bool flat = tuner.GetErrorCents() < 0.0f;
        target.Bitmap(flat ? kivspectrum::tunerErrorFlatBitmap : kivspectrum::tunerErrorSharpBitmap,
                      {middle + (flat ? -away : away) - arrow / 2.0f,
                       baseline(0) - kCapHeight * size / 2.0f - arrow / 2.0f, arrow, arrow},
                      255);
    }
    const auto line = [&](int index, const ShortText& text) {
        if (index < lines)
            target.Text(text.View(), {middle, baseline(index)}, TextAlign::Centre,
                        FittingSize(target, text.View(), 0.62f * pitch, room), {Look::kLabel});
    };
    if (tuned) line(1, ShortText().AddFrequency(tuner.GetFrequency()));
    if (TunerCalibrationNotStandardOrNotUseEqualTemperament())
        line(2, ShortText()
                    .Add(Tuner::GetCurrentTemperamentName())
                    .Add("   A = ")
                    .AddNumber(4.0 * Tuner::GetCalibrationBase(), 1)
                    .Add(" Hz"));
}

void DrawNeedleAndInfo(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle) {
    if (!IsDrawable(rectangle)) return;
    const float scale = target.Scale(), lines = static_cast<float>(TunerGetNumLines()) + 0.4f;
    const float pitch = std::clamp(rectangle.height * 0.11f, (kLeastInfoLine + 0.5f) * scale, 40.0f * scale);
    const float info = std::min(pitch * lines, 0.45f * rectangle.height);
    const RectF above = Shrunk(rectangle, 0.0f, 0.0f, 0.0f, info);
    const DialLayout dial = LayOutDial(above, scale);
    const float needed = (1.0f + kHub) * dial.radius + kLabelRoom * dial.labelSize;
    const float height = std::min(needed, above.height);
    const float top = rectangle.y + (above.height - height) / 2.0f;
    DrawNeedle(analyser, target, {rectangle.x, top, rectangle.width, height});
    DrawNeedleInfo(analyser, target, {rectangle.x, top + height, rectangle.width, info});
}

void DrawTuner(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle) {
    if (!IsDrawable(rectangle)) return;
    const float scale = target.Scale();
    constexpr float kSmallWidth = 180.0f, kSmallHeight = 110.0f, kSideBySide = 1.7f, kWidestHalf = 2.0f;
    target.PushClip(rectangle);
    target.FillRectangle(rectangle, {Look::kGround});
    const float gap = 2.0f * Look::kGap * scale;
    const RectF inner = Shrunk(rectangle, gap, gap, gap, gap);
    if (rectangle.width < kSmallWidth * scale || rectangle.height < kSmallHeight * scale) {
        DrawTunerLine(analyser, target, rectangle);
    } else if (rectangle.width > kSideBySide * rectangle.height) {
        // In a long strip they stay together in the middle.
        const float half = std::min((inner.width - gap) / 2.0f, kWidestHalf * inner.height);
        const float middle = Centre(inner).x;
        DrawNoteAndRipples(analyser, target, {middle - gap / 2.0f - half, inner.y, half, inner.height});
        DrawNeedleAndInfo(analyser, target, {middle + gap / 2.0f, inner.y, half, inner.height});
    } else {
        const float upper = 0.5f * inner.height;
        DrawNoteAndRipples(analyser, target, {inner.x, inner.y, inner.width, upper});
        DrawNeedleAndInfo(analyser, target, {inner.x, inner.y + upper, inner.width, inner.height - upper});
    }
    target.PopClip();
}

}  // namespace Corvo
