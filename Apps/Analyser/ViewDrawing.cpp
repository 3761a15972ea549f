#include <algorithm>
#include <cmath>
#include <cstdio>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "Commands.h"
#include "Drawing/Views/Look.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "View.h"

// What stands in the window: the analyser's own picture, and over it what helps to use it.
namespace analyser {
namespace {

using Corvo::DrawTarget, Corvo::PointF, Corvo::RectF, Corvo::TextAlign;
using Plot = Corvo::AnalyserReading::Plot;
namespace Look = Corvo::Look;

constexpr float kBar = 24.0f;           // in 1/96 inch
constexpr std::size_t kMostBytes = 90;  // of a text: more could be cut off
constexpr const char* kEllipsis = "\u2026";

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

// The beginning of a text that fits, up to a blank if there is one; one character at least.
std::string_view FittingPiece(DrawTarget& target, std::string_view text, float size, float room) {
    std::size_t end = std::min(text.size(), kMostBytes + 1);
    const auto shorten = [&] {
        const auto blank = text.rfind(' ', end - 1);
        const bool found = blank != text.npos && blank > 0;
        end = found ? blank : end - 1;
        while (end > 0 && ContinuesCharacter(text, end)) --end;
    };
    while (end > 1 && (end > kMostBytes || target.MeasureText(text.substr(0, end), size).width > room))
        shorten();
    end = std::max<std::size_t>(end, 1);
    while (ContinuesCharacter(text, end)) ++end;
    return text.substr(0, end);
}

// The text, or its beginning with an ellipsis.
std::string Shortened(DrawTarget& target, std::string text, float size, float room) {
    const auto fits = [&](const std::string& s) {
        return s.size() <= kMostBytes && target.MeasureText(s, size).width <= room;
    };
    if (fits(text)) return text;
    while (!text.empty() && !fits(text + kEllipsis)) {
        while (text.size() > 1 && ContinuesCharacter(text, text.size() - 1)) text.pop_back();
        text.pop_back();
    }
    return text.empty() ? text : text + kEllipsis;
}

struct TextLine {
    std::string_view text;
    Corvo::ColourReference colour;
};

// In as many lines as it takes.
std::vector<TextLine> Wrapped(DrawTarget& target, const std::vector<TextLine>& texts, float size,
                              float room) {
    std::vector<TextLine> lines;
    for (auto [text, colour] : texts)
        while (!text.empty() && room > 0.0f) {
            std::string_view piece = FittingPiece(target, text, size, room);
            text.remove_prefix(piece.size());
            while (piece.ends_with(' ')) piece.remove_suffix(1);
            while (text.starts_with(' ')) text.remove_prefix(1);
            lines.push_back({piece, colour});
        }
    return lines;
}

enum class Place { Middle, Below };

// False, with nothing drawn, where there is no room for it.
bool DrawBox(DrawTarget& target, const RectF& bounds, Place place, const std::vector<TextLine>& texts,
             float size) {
    const float pad = size, room = bounds.width - 3.0f * pad;
    const auto lines = Wrapped(target, texts, size, room);
    float widest = 0.0f;
    for (const TextLine& line : lines) widest = std::max(widest, target.MeasureText(line.text, size).width);
    const float pitch = std::round((place == Place::Middle ? 1.8f : 1.5f) * size);
    const float height = pitch * static_cast<float>(lines.size()) + pad;
    if (lines.empty() || height > bounds.height) return false;
    const float below = std::min(20.0f * target.Scale(), bounds.height - height);
    const float top =
        place == Place::Middle ? (bounds.height - height) / 2.0f : bounds.height - height - below;
    const float middle = bounds.x + bounds.width / 2.0f;
    const RectF box{std::round(middle - widest / 2.0f - pad), std::round(bounds.y + top),
                    std::round(widest + 2.0f * pad), std::round(height)};
    target.FillRoundedRectangle(box, pad / 2.0f, {Look::kBox, 240});
    float baseline = box.y + pad / 2.0f + (pitch + Corvo::kCapHeight * size) / 2.0f;
    for (const TextLine& line : lines) {
        target.Text(line.text, {middle, baseline}, TextAlign::Centre, size, {line.colour});
        baseline += pitch;
    }
    return true;
}

// How a list of keys and what they do stands in the window. Lengths are shares of the text's size.
struct KeysLayout {
    static constexpr float kPitch = 1.6f, kGap = 1.2f, kPad = 1.0f;

    float key = 0.0f, text = 0.0f, size = 0.0f;
    int columns = 1, perColumn = 1;

    float Column() const { return key + text + 2.0f * kGap; }
};

// As large as it may be so that everything is seen at once, else in pages.
template <typename Rows>
KeysLayout LayOutKeys(DrawTarget& target, const RectF& rectangle, const Rows& rows) {
    constexpr float kMostColumns = 3.0f;
    const float scale = target.Scale(), least = Look::kSmallest * scale;
    const auto count = static_cast<int>(rows.size());
    KeysLayout l;
    l.size = Look::kInfoSize * scale;
    for (const auto& [key, text] : rows) {
        l.key = std::max(l.key, target.MeasureText(key, l.size).width / l.size);
        l.text = std::max(l.text, target.MeasureText(text, l.size).width / l.size);
    }
    const auto fits = [&] {
        const float most = (rectangle.width / l.size - KeysLayout::kPad) / l.Column();
        l.columns = static_cast<int>(std::clamp(most, 1.0f, kMostColumns));
        l.perColumn =
            static_cast<int>((rectangle.height / l.size - 2.0f * KeysLayout::kPad) / KeysLayout::kPitch);
        return most >= 1.0f && l.columns * l.perColumn >= count;
    };
    while (!fits() && l.size > least) l.size = std::max(l.size - scale, least);
    if (l.columns * l.perColumn < count) {
        l.perColumn = std::max(l.perColumn - 1, 1);  // and a line that leads on
    } else {
        l.columns = std::min(l.columns, std::max((count + l.perColumn - 1) / l.perColumn, 2));
        l.perColumn = (count + l.columns - 1) / l.columns;
    }
    return l;
}

float BaselineIn(const RectF& bar, float size) {
    return bar.y + (bar.height + Corvo::kCapHeight * size) / 2.0f;
}

}  // namespace

void View::DrawAnalysers(Corvo::DrawingCairo::DrawTarget& target, const RectF& rectangle) {
    kivspectrum& first = GetAnalyser();
    const bool tuner = first.GetDisplayMode() == kivspectrum::display_tuner;
    const float half = m_apart && !tuner ? std::round(rectangle.height / 2.0f) : rectangle.height;
    first.DoDraw<Corvo::DrawingCairo>(target, {rectangle.x, rectangle.y, rectangle.width, half});
    // Without a height where it is not seen, so that no reading comes from there.
    m_analysers[1].DoDraw<Corvo::DrawingCairo>(
        target, {rectangle.x, rectangle.y + half, rectangle.width, rectangle.height - half});
    if (m_apart) DrawChannelNames(target, rectangle, half);
}

// In the upper left corner of what each channel has; the tuner hears the left one.
void View::DrawChannelNames(DrawTarget& target, const RectF& rectangle, float half) const {
    const float scale = target.Scale(), size = Look::kInfoSize * scale, pad = Look::kGap * scale;
    for (const bool right : {false, true}) {
        const float top = rectangle.y + (right ? half : 0.0f), end = right ? rectangle.height : half;
        const kivspectrum& analyser = m_analysers[right ? 1 : 0];
        if (end - top < 3.0f * size) continue;
        PointF place{rectangle.x + rectangle.width / 2.0f, top};
        const auto isPlot = [&] { return analyser.GetReading(place.x, place.y).plot != Plot::None; };
        while (place.y < end && !isPlot()) ++place.y;
        if (place.y >= end) place = {rectangle.x, top};  // the tuner alone
        while (place.x > rectangle.x && isPlot()) --place.x;
        const std::string_view name = right ? "Right" : "Left";
        const RectF box{place.x + pad, place.y + pad, target.MeasureText(name, size).width + 2.0f * pad,
                        1.5f * size};
        target.FillRoundedRectangle(box, pad, {Look::kBox, 225});
        target.Text(name, {box.x + pad, BaselineIn(box, size)}, TextAlign::Left, size, {Look::kText});
    }
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
    target.Text(text, {x, BaselineIn(bar, size)}, TextAlign::Left, size, {colour});
    return x + target.MeasureText(text, size).width + 2.0f * Look::kGap * scale;
}

// Why nothing is heard; empty when there is no reason.
std::string View::Trouble() const {
    return GetAnalyser().GetOn() ? m_trouble : "The analyser is switched off (menu: Analyser, On).";
}

// What is heard, or why it does not move. Gives where the next thing may stand.
float View::DrawStatus(DrawTarget& target, const RectF& bar, float x, float room) {
    const float size = Look::kLabelSize * target.Scale();
    const double back = SecondsBack();
    std::string text = m_shell.Source();
    bool special = back > 0.0;
    if (back > 0.0) {
        char moment[64];
        std::snprintf(moment, sizeof moment, "Sonogram %.1f s back (End: now)     ", back);
        text = moment + text;
    }
    if (GetAnalyser().GetFrozen()) {
        text = "Frozen (Space goes on)     " + text;
        special = true;
    }
    if (const std::string trouble = Trouble(); !trouble.empty() && !m_troubleSaid) {
        m_troubleSaid = Shortened(target, trouble, size, room) == trouble;
        if (m_troubleSaid) text = trouble;
        special = special || m_troubleSaid;
    }
    text = Shortened(target, text, size, room);
    target.Text(text, {x, BaselineIn(bar, size)}, TextAlign::Left, size,
                {special ? Look::kPeaks : Look::kLabel});
    return x + target.MeasureText(text, size).width;
}

void View::DrawBar(DrawTarget& target, const RectF& bar, For what) {
    const float scale = target.Scale(), size = Look::kLabelSize * scale, pad = 2.0f * Look::kGap * scale;
    target.FillRectangle(bar, {Look::kBox});
    const bool opened = m_menu.IsOpen() || m_keysShown;
    const std::string_view right = what == For::File ? "" : opened ? "Esc  close" : "M  menu     H  keys";
    const float rightWidth = target.MeasureText(right, size).width;
    const auto playback = m_shell.GetPlayback();
    float x = bar.x + pad, end = bar.x + bar.width - pad;
    const float statusEnd = playback ? bar.width * 0.35f + pad : end - rightWidth - 2.0f * pad;
    if (bar.width > 480.0f * scale) x = DrawLevel(target, bar, x);
    x = DrawStatus(target, bar, x, statusEnd - x) + 2.0f * pad;
    if (end - rightWidth > x + (playback ? 60.0f * scale : 0.0f)) {
        target.Text(right, {end, BaselineIn(bar, size)}, TextAlign::Right, size, {Look::kLabel});
        end -= rightWidth + (right.empty() ? 0.0f : 2.0f * pad);
    }
    m_bar.timeline = {};
    if (playback) DrawTimeline(target, bar, x, end, *playback);
}

// The time up to `end`, and the line as far as there is room for it.
void View::DrawTimeline(DrawTarget& target, const RectF& bar, float x, float end, const Playback& playback) {
    const float scale = target.Scale(), size = Look::kLabelSize * scale, pad = 2.0f * Look::kGap * scale;
    const char* const rests = playback.playing ? "" : playback.ended ? "Ended  " : "Paused  ";
    const int decimals = playback.length < 1.0 ? 2 : playback.length < 10.0 ? 1 : 0;
    const std::string time =
        rests + Minutes(playback.position, decimals) + " / " + Minutes(playback.length, decimals);
    target.Text(time, {end, BaselineIn(bar, size)}, TextAlign::Right, size, {Look::kText});
    const RectF line{x, bar.y, end - target.MeasureText(time, size).width - 2.0f * pad - x, bar.height};
    if (line.width < 40.0f * scale) return;
    m_bar.timeline = line;
    const float thick = std::max(std::round(4.0f * scale), 1.0f);
    const float y = std::round(bar.y + (bar.height - thick) / 2.0f);
    const double length = std::max(playback.length, 1e-9);
    const auto played = static_cast<float>(std::clamp(playback.position / length, 0.0, 1.0)) * line.width;
    target.FillRoundedRectangle({line.x, y, line.width, thick}, thick / 2.0f, {Look::kGrid});
    target.FillRoundedRectangle({line.x, y, std::max(played, 0.1f), thick}, thick / 2.0f, {Look::kCurve});
    const float knob = 5.0f * scale;
    target.FillRoundedRectangle({line.x + played - knob, y + thick / 2.0f - knob, 2.0f * knob, 2.0f * knob},
                                knob, {Look::kText});
}

// What to press, while nothing has been heard yet, and why nothing is.
void View::DrawHints(DrawTarget& target, const RectF& rectangle) {
    const bool empty = !m_heard && !m_shell.GetPlayback();
    if ((!empty && GetAnalyser().GetOn()) || m_menu.IsOpen() || m_keysShown) return;
    constexpr std::string_view kFirst = "Make a sound: its spectrum, its course and its note appear here.";
    constexpr std::string_view kRest[] = {
        "1\u00a0spectrum   2\u00a0sonogram   3\u00a0both   4\u00a0tuner   T\u00a0tuner\u00a0above   "
        "Space\u00a0freezes",
        "M or right button:\u00a0menu   Wheel:\u00a0zoom   Click:\u00a0marker   H:\u00a0all\u00a0keys",
    };
    const std::string trouble = Trouble();
    std::vector<TextLine> lines;
    if (!trouble.empty())
        lines.push_back({trouble, Look::kPeaks});
    else
        lines.push_back({kFirst, Look::kText});
    if (empty)
        for (const std::string_view line : kRest) lines.push_back({line, Look::kLabel});
    const float scale = target.Scale(), largest = 15.0f * scale;
    const float fitting = largest * 0.86f * rectangle.width / target.MeasureText(kRest[0], largest).width;
    const float size = std::clamp(fitting, Look::kSmallest * scale, largest);
    m_troubleSaid = DrawBox(target, rectangle, Place::Middle, lines, size) ||
                    DrawBox(target, rectangle, Place::Middle, {lines[0]}, size);
}

// What there is to press here.
std::vector<View::KeyRow> View::KeyRows() const {
    std::vector<KeyRow> rows;
    for (const CommandRow& row : Commands())
        if (IsOffered(row.command)) rows.push_back({row.shortcut, row.text});
    rows.insert(rows.end(), {{"Wheel", "Zoom around the pointer"},
                             {"Ctrl+Wheel", "Zoom in time: sonogram's speed"},
                             {"Shift+Wheel", "Sonogram back in time"},
                             {"Click", "Marker; differences are from it"},
                             {"Drag", "Move in frequency and time"},
                             {"Double click", "All frequencies, now, no marker"},
                             {"Right button", "Menu"},
                             {"Esc", "Close menu or list; no marker"}});
    if (m_shell.CanFillScreen()) rows.push_back({"Ctrl+Q", "End, as does Ctrl+W"});
    return rows;
}

void View::DrawKeys(DrawTarget& target, const RectF& rectangle) {
    const auto rows = KeyRows();
    const KeysLayout layout = LayOutKeys(target, rectangle, rows);
    const int count = static_cast<int>(rows.size()), perPage = layout.columns * layout.perColumn;
    m_keyPages = (count + perPage - 1) / perPage;
    m_keysPage = std::min(m_keysPage, m_keyPages - 1);
    const float size = layout.size, pad = KeysLayout::kPad * size, pitch = KeysLayout::kPitch * size;
    const float width =
        std::min(static_cast<float>(layout.columns) * layout.Column() * size + pad, rectangle.width);
    const float height = static_cast<float>(layout.perColumn + (m_keyPages > 1 ? 1 : 0)) * pitch + 2.0f * pad;
    const RectF box{std::round(rectangle.x + (rectangle.width - width) / 2.0f),
                    std::round(rectangle.y + std::max((rectangle.height - height) / 2.0f, 0.0f)),
                    std::round(width), std::round(height)};
    target.FillRoundedRectangle(box, pad, {Look::kBox, 245});
    const auto write = [&](std::string_view text, float x, int row, Corvo::ColourReference colour) {
        const float y = box.y + pad + (static_cast<float>(row) + 0.7f) * pitch;
        const std::string shown = Shortened(target, std::string(text), size, box.x + box.width - x);
        target.Text(shown, {x, y}, TextAlign::Left, size, {colour});
    };
    const int first = m_keysPage * perPage, end = std::min(first + perPage, count);
    for (int i = first; i < end; ++i) {
        const int column = (i - first) / layout.perColumn, row = (i - first) % layout.perColumn;
        const float x = box.x + pad + static_cast<float>(column) * layout.Column() * size;
        write(rows[static_cast<std::size_t>(i)].key, x, row, Look::kCurve);
        write(rows[static_cast<std::size_t>(i)].text, x + (layout.key + KeysLayout::kGap) * size, row,
              Look::kText);
    }
    if (m_keyPages == 1) return;
    const std::string more =
        "H: page " + std::to_string(m_keysPage + 1) + " of " + std::to_string(m_keyPages);
    write(more, box.x + pad, layout.perColumn, Look::kLabel);
}

// What happened a moment ago, and what is wrong where that is not said elsewhere.
void View::DrawSentences(DrawTarget& target, const RectF& rectangle) const {
    const std::string trouble = m_troubleSaid ? "" : Trouble();
    DrawBox(target, rectangle, Place::Below, {{trouble, Look::kPeaks}, {m_said, Look::kText}},
            Look::kInfoSize * target.Scale());
}

void View::Draw(cairo_t* context, int width, int height, float dpi) {
    DrawFor(For::Window, context, width, height, dpi);
}

void View::DrawFor(For what, cairo_t* context, int width, int height, float dpi) {
    if (std::exchange(m_width, width) == 0) FollowFirst();
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
    SizeSonograms(picture);
    DrawAnalysers(target, picture);
    m_troubleSaid = what == For::File;
    if (what == For::Window) DrawHints(target, picture);
    if (m_bar.whole.height > 0.0f) DrawBar(target, m_bar.whole, what);
    if (what == For::File) return;
    DrawSentences(target, picture);
    if (m_keysShown) DrawKeys(target, picture);
    m_menu.Draw(target, whole);
}

// A sonogram hears from the beginning, whichever view is shown; one that is not drawn is as narrow as can be.
void View::SizeSonograms(const RectF& picture) {
    Corvo::Sonogram &first = *GetAnalyser().GetSonogram(), &second = *m_analysers[1].GetSonogram();
    if (!GetAnalyser().GetOn()) return;
    if (first.GetBitmap().IsEmpty())
        first.CheckPixelBufferSize({0.0f, 0.0f, picture.width, picture.height / 2.0f}, 0);
    if (!m_apart || second.GetBitmap().IsEmpty())
        second.CheckPixelBufferSize({0.0f, 0.0f, 1.0f, 1.0f}, first.GetBitmap().height);
}

}  // namespace analyser
