#include <algorithm>
#include <cmath>
#include <cstdio>
#include <string>
#include <string_view>
#include <vector>

#include "Commands.h"
#include "Drawing/Views/Look.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "View.h"

// What stands in the window: the analyser's own picture, and over it what helps to use it.
namespace analyser {
namespace {

using Corvo::DrawTarget, Corvo::PointF, Corvo::RectF, Corvo::TextAlign;
namespace Look = Corvo::Look;

constexpr float kBar = 24.0f;  // in 1/96 inch

// As large as asked for, or as it fits.
float FittingSize(DrawTarget& target, std::string_view text, float wanted, float room) {
    const float width = target.MeasureText(text, wanted).width;
    return width > room ? wanted * room / width : wanted;
}

std::string Minutes(double seconds, int decimals) {
    const double unit = std::pow(10.0, decimals);
    const double shown = decimals > 0 ? std::round(seconds * unit) / unit : std::floor(seconds);
    const int minutes = static_cast<int>(shown / 60.0);
    char text[32];
    std::snprintf(text, sizeof text, "%d:%0*.*f", minutes, decimals > 0 ? 3 + decimals : 2, decimals,
                  shown - 60.0 * minutes);
    return text;
}

bool ContinuesCharacter(std::string_view text, std::size_t at) {
    return at < text.size() && (text[at] & 0xC0) == 0x80;
}

// The beginning of a text that fits, up to a blank if there is one; one character at least. Longer pieces
// would be cut off.
std::string_view FittingPiece(DrawTarget& target, std::string_view text, float size, float room) {
    constexpr std::size_t kMost = 80;
    std::size_t end = std::min(text.size(), kMost + 1);
    const auto shorten = [&] {
        const auto blank = text.rfind(' ', end - 1);
        const bool found = blank != text.npos && blank > 0;
        end = found ? blank : end - 1;
        while (end > 0 && ContinuesCharacter(text, end)) --end;
    };
    while (end > 1 && (end > kMost || target.MeasureText(text.substr(0, end), size).width > room)) shorten();
    end = std::max<std::size_t>(end, 1);
    while (ContinuesCharacter(text, end)) ++end;
    return text.substr(0, end);
}

// In as many lines as it takes, downwards from `edge` or upwards to it.
void DrawCentredBox(DrawTarget& target, const RectF& bounds, float edge, bool upwards, std::string_view text,
                    Corvo::ColourReference colour) {
    const float scale = target.Scale(), pad = 2.0f * Look::kGap * scale, room = bounds.width - 4.0f * pad;
    const float size = Look::kInfoSize * scale;
    std::vector<std::string_view> lines;
    float widest = 0.0f;
    while (!text.empty() && room > 0.0f) {
        lines.push_back(FittingPiece(target, text, size, room));
        widest = std::max(widest, target.MeasureText(lines.back(), size).width);
        text.remove_prefix(lines.back().size());
        if (text.starts_with(' ')) text.remove_prefix(1);
    }
    const auto metrics = target.MeasureText("Ag", size);
    const float pitch = std::round(1.2f * (metrics.ascent + metrics.descent));
    const float height = std::round(pitch * static_cast<float>(lines.size()) + pad);
    const RectF box{std::round(bounds.x + (bounds.width - widest) / 2.0f - pad),
                    std::round(upwards ? edge - height : edge), std::round(widest + 2.0f * pad), height};
    target.FillRoundedRectangle(box, pad / 2.0f, {Look::kBox, 240});
    float baseline = box.y + pad / 2.0f + (pitch + Corvo::kCapHeight * size) / 2.0f;
    for (const std::string_view line : lines) {
        target.Text(line, {bounds.x + bounds.width / 2.0f, baseline}, TextAlign::Centre, size, {colour});
        baseline += pitch;
    }
}

}  // namespace

void View::DrawAnalysers(Corvo::DrawingCairo::DrawTarget& target, const RectF& rectangle) {
    kivspectrum& first = GetAnalyser();
    if (!m_apart || first.GetDisplayMode() == kivspectrum::display_tuner)
        return first.DoDraw<Corvo::DrawingCairo>(target, rectangle);
    const float half = std::round(rectangle.height / 2.0f);
    first.DoDraw<Corvo::DrawingCairo>(target, {rectangle.x, rectangle.y, rectangle.width, half});
    m_analysers[1].DoDraw<Corvo::DrawingCairo>(
        target, {rectangle.x, rectangle.y + half, rectangle.width, rectangle.height - half});
}

// Whether anything is heard at all, and whether it is too much. Gives where the next thing may stand.
float View::DrawLevel(DrawTarget& target, const RectF& bar, float x) const {
    constexpr float kLowest = -60.0f;
    const float scale = target.Scale(), size = Look::kLabelSize * scale, thick = std::round(6.0f * scale);
    const bool loud = m_tooLoudFor > 0;
    const RectF whole{x, std::round(bar.y + (bar.height - thick) / 2.0f), std::round(72.0f * scale), thick};
    const float share = std::clamp(1.0f - m_level / kLowest, 0.0f, 1.0f);
    const auto colour = loud ? Look::kPeaks : Look::kInTune;
    target.FillRectangle(whole, {Look::kGrid});
    target.FillRectangle({whole.x, whole.y, std::round(whole.width * share), thick}, {colour});
    x += whole.width + 2.0f * Look::kGap * scale;
    if (!loud) return x;
    const std::string_view text = m_shell.GetPlayback() ? "Full scale" : "Too loud";
    target.Text(text, {x, bar.y + (bar.height + Corvo::kCapHeight * size) / 2.0f}, TextAlign::Left, size,
                {colour});
    return x + target.MeasureText(text, size).width + 2.0f * Look::kGap * scale;
}

void View::DrawBar(DrawTarget& target, const RectF& bar) {
    const float scale = target.Scale(), size = Look::kLabelSize * scale, pad = 2.0f * Look::kGap * scale;
    target.FillRectangle(bar, {Look::kBox});
    const float baseline = bar.y + (bar.height + Corvo::kCapHeight * size) / 2.0f;
    const std::string right = "M  menu     H  keys";
    const float rightWidth = target.MeasureText(right, size).width;
    const bool frozen = GetAnalyser().GetFrozen();
    const double back = SecondsBack();
    std::string source = m_shell.Source();
    if (back > 0.0) {
        char text[64];
        std::snprintf(text, sizeof text, "Sonogram %.1f s back (End: now)     ", back);
        source = text + source;
    }
    if (frozen) source = "Frozen (Space goes on)     " + source;
    const auto playback = m_shell.GetPlayback();
    const float room = playback ? bar.width * 0.35f : bar.width - rightWidth - 4.0f * pad;
    float x = bar.x + pad;
    if (bar.width > 480.0f * scale) x = DrawLevel(target, bar, x);
    target.PushClip({x, bar.y, std::max(room + pad - x, 1.0f), bar.height});
    target.Text(source, {x, baseline}, TextAlign::Left, size,
                {frozen || back > 0.0 ? Look::kPeaks : Look::kLabel});
    target.PopClip();
    x += std::min(target.MeasureText(source, size).width, room - x) + 2.0f * pad;
    const float end = bar.x + bar.width - pad;
    const bool keys = end - rightWidth > x + 60.0f * scale;
    if (keys) target.Text(right, {end, baseline}, TextAlign::Right, size, {Look::kLabel});
    m_bar.timeline = {};
    if (!playback) return;
    const char* const rests = playback->playing ? "" : playback->ended ? "Ended  " : "Paused  ";
    const int decimals = playback->length < 1.0 ? 2 : playback->length < 10.0 ? 1 : 0;
    const std::string time =
        rests + Minutes(playback->position, decimals) + " / " + Minutes(playback->length, decimals);
    const float timeWidth = target.MeasureText(time, size).width;
    const float timeEnd = keys ? end - rightWidth - 2.0f * pad : end;
    target.Text(time, {timeEnd, baseline}, TextAlign::Right, size, {Look::kText});
    const RectF line{x, bar.y, timeEnd - timeWidth - 2.0f * pad - x, bar.height};
    if (line.width < 40.0f * scale) return;
    m_bar.timeline = line;
    const float thick = std::max(std::round(4.0f * scale), 1.0f);
    const float y = std::round(bar.y + (bar.height - thick) / 2.0f);
    const double length = std::max(playback->length, 1e-9);
    const auto played = static_cast<float>(std::clamp(playback->position / length, 0.0, 1.0)) * line.width;
    target.FillRoundedRectangle({line.x, y, line.width, thick}, thick / 2.0f, {Look::kGrid});
    target.FillRoundedRectangle({line.x, y, std::max(played, 0.1f), thick}, thick / 2.0f, {Look::kCurve});
    const float knob = 5.0f * scale;
    target.FillRoundedRectangle({line.x + played - knob, y + thick / 2.0f - knob, 2.0f * knob, 2.0f * knob},
                                knob, {Look::kText});
}

void View::DrawHints(DrawTarget& target, const RectF& rectangle) const {
    constexpr std::string_view kLines[] = {
        "Make a sound: its spectrum, its course and its note appear here.",
        "1 spectrum   2 sonogram   3 both   4 tuner   T tuner above   Space freezes",
        "M or right button: menu   Wheel: zoom   Click: marker   H: all keys",
    };
    const float scale = target.Scale(), pad = 3.0f * Look::kGap * scale;
    float size = 15.0f * scale, widest = 0.0f;
    for (const std::string_view line : kLines)
        size = std::min(size, FittingSize(target, line, size, 0.86f * rectangle.width));
    for (const std::string_view line : kLines)
        widest = std::max(widest, target.MeasureText(line, size).width);
    if (size < 5.0f * scale) return;
    const float pitch = 1.8f * size, middle = rectangle.x + rectangle.width / 2.0f;
    const RectF box{std::round(middle - widest / 2.0f - pad),
                    std::round(rectangle.y + (rectangle.height - 3.0f * pitch) / 2.0f - pad),
                    std::round(widest + 2.0f * pad), std::round(3.0f * pitch + 2.0f * pad)};
    target.FillRoundedRectangle(box, pad, {Look::kBox, 225});
    for (int i = 0; i < 3; ++i)
        target.Text(kLines[i], {middle, box.y + pad + pitch * (static_cast<float>(i) + 0.7f)},
                    TextAlign::Centre, size, {i == 0 ? Look::kText : Look::kLabel});
}

// Two columns: keys and what they do.
void View::DrawKeys(DrawTarget& target, const RectF& rectangle) const {
    const auto commands = Commands();
    constexpr std::string_view kPointer[][2] = {{"Wheel", "Zoom around the pointer"},
                                                {"Ctrl+Wheel", "Zoom in time: sonogram's speed"},
                                                {"Shift+Wheel", "Sonogram back in time"},
                                                {"Click", "Marker; differences are from it"},
                                                {"Drag", "Move in frequency and time"},
                                                {"Double click", "All frequencies, now, no marker"},
                                                {"Right button", "Menu"}};
    const float count = static_cast<float>(commands.size() + std::size(kPointer));
    const float rows = std::ceil(count / 2.0f), scale = target.Scale();
    const float pitch = std::min(22.0f * scale, (rectangle.height - 40.0f * scale) / rows);
    const float size = std::min(0.6f * pitch, Look::kInfoSize * scale);
    if (size < 4.0f) return;
    const float column = std::min(27.5f * size, rectangle.width / 2.0f - size), pad = size;
    const RectF box{std::round(rectangle.x + rectangle.width / 2.0f - column - pad / 2.0f),
                    std::round(rectangle.y + (rectangle.height - rows * pitch) / 2.0f - pad),
                    std::round(2.0f * column + pad), std::round(rows * pitch + 2.0f * pad)};
    target.FillRoundedRectangle(box, pad, {Look::kBox, 245});
    int number = 0;
    const auto line = [&](std::string_view key, std::string_view text) {
        const float at = static_cast<float>(number % static_cast<int>(rows));
        const float x = box.x + pad + (number >= static_cast<int>(rows) ? column : 0.0f);
        const float y = box.y + pad + (at + 0.7f) * pitch;
        target.Text(key, {x, y}, TextAlign::Left, size, {Look::kCurve});
        target.Text(text, {x + 8.0f * size, y}, TextAlign::Left, size, {Look::kText});
        ++number;
    };
    for (const CommandRow& row : commands) line(row.shortcut, row.text);
    for (const auto& row : kPointer) line(row[0], row[1]);
}

void View::DrawSentences(DrawTarget& target, const RectF& rectangle) const {
    const float scale = target.Scale();
    if (!m_trouble.empty())
        DrawCentredBox(target, rectangle, rectangle.y + 12.0f * scale, false, m_trouble, Look::kPeaks);
    if (!m_said.empty())
        DrawCentredBox(target, rectangle, rectangle.y + rectangle.height - 20.0f * scale, true, m_said,
                       Look::kText);
}

void View::Draw(cairo_t* context, int width, int height, float dpi) {
    m_width = width;
    m_height = height;
    m_dpi = dpi;
    if (!m_drawing) m_drawing = std::make_unique<Corvo::DrawingCairo>();
    Corvo::DrawingCairo::DrawTarget target(*m_drawing, context, dpi);
    const RectF whole{0.0f, 0.0f, static_cast<float>(width), static_cast<float>(height)};
    RectF picture = whole;
    m_bar = {};
    const float bar = std::round(kBar * target.Scale());
    if (!m_shell.Source().empty() && whole.height > 5.0f * bar) {
        picture.height -= bar;
        m_bar.whole = {0.0f, picture.height, whole.width, bar};
    }
    // A sonogram hears from the beginning, whichever view is shown.
    for (kivspectrum& each : m_analysers)
        if (each.GetOn() && each.GetSonogram()->GetBitmap().IsEmpty())
            each.GetSonogram()->CheckPixelBufferSize({0.0f, 0.0f, picture.width, picture.height / 2.0f}, 0);
    DrawAnalysers(target, picture);
    if (m_bar.whole.height > 0.0f) DrawBar(target, m_bar.whole);
    if (!m_heard && !m_shell.GetPlayback() && !m_menu.IsOpen() && !m_keysShown) DrawHints(target, picture);
    DrawSentences(target, picture);
    if (m_keysShown) DrawKeys(target, picture);
    m_menu.Draw(target, whole);
}

}  // namespace analyser
