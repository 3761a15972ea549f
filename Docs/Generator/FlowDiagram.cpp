#include "FlowDiagram.h"

#include <algorithm>
#include <stdexcept>
#include <vector>

#include "PageText.h"
#include "Svg.h"

namespace docs {
namespace {

constexpr double kCharacter = 7.4, kPadding = 20, kGap = 34, kBoxHeight = 44, kRowHeight = 74, kMargin = 8;

struct Place {
    std::string text;
    double left = 0, width = 0;

    double Middle() const { return left + width / 2; }
    double Right() const { return left + width; }
};
using Way = std::vector<Place>;

bool HasBox(const Place& place) { return place.text != "in" && place.text != "out"; }

Way ReadWay(std::string_view line) {
    Way way;
    for (const auto& text : Split(line, "->")) {
        std::size_t longest = 0;
        for (const auto& part : Split(text, "|")) longest = std::max(longest, Characters(part));
        way.push_back({text, 0, static_cast<double>(longest) * kCharacter + kPadding});
    }
    if (way.size() < 2) throw std::invalid_argument("no arrow in \"" + std::string(line) + '"');
    return way;
}

double WidthInside(const Way& way) {
    double width = kGap;
    for (std::size_t i = 1; i + 1 < way.size(); ++i) width += way[i].width + kGap;
    return width;
}

std::size_t PlaceOf(const Way& main, const std::string& text) {
    const auto found = std::ranges::find(main, text, &Place::text);
    if (found == main.end()) throw std::invalid_argument("\"" + text + "\" is not on the main way");
    return static_cast<std::size_t>(found - main.begin());
}

// Sets the main way's places out so that every way beside it has room between its ends.
void SetOut(Way& main, const std::vector<Way>& beside) {
    double left = kMargin;
    for (std::size_t i = 0; i < main.size(); ++i) {
        for (const Way& way : beside) {
            const auto ends = std::minmax({PlaceOf(main, way.front().text), PlaceOf(main, way.back().text)});
            if (ends.second == i)
                left = std::max(left, main[ends.first].Middle() + WidthInside(way) - main[i].width / 2);
        }
        main[i].left = left;
        left = main[i].Right() + kGap;
    }
}

void DrawPlace(Svg& svg, const Place& place, double middle) {
    const auto parts = Split(place.text, "|");
    if (HasBox(place)) svg.Box(place.left, middle - kBoxHeight / 2, place.width, kBoxHeight);
    double y = middle + 5 - 8 * static_cast<double>(parts.size() - 1);
    for (const auto& part : parts) {
        svg.Text(place.Middle(), y, part);
        y += 16;
    }
}

// A way beside the main one, in row `row` below it.
void DrawBeside(Svg& svg, const Way& main, Way way, double middle, double row) {
    const Place& from = main[PlaceOf(main, way.front().text)];
    const Place& to = main[PlaceOf(main, way.back().text)];
    const bool forward = from.left < to.left;
    const double spare = (std::abs(to.Middle() - from.Middle()) - WidthInside(way)) / 2;
    double x = std::min(from.Middle(), to.Middle()) + spare + kGap;
    for (std::size_t i = 1; i + 1 < way.size(); ++i) {
        Place& place = way[forward ? i : way.size() - 1 - i];
        place.left = x;
        x += place.width + kGap;
        DrawPlace(svg, place, row);
    }
    const auto point = [](double px, double py) { return Number(px) + ',' + Number(py) + ' '; };
    // Ways that leave a place and ways that reach it stand apart.
    const auto edge = [&](const Place& place) { return middle + (HasBox(place) ? kBoxHeight / 2 : 12); };
    const double start = from.Middle() + 6, end = to.Middle() - 6;
    std::string points = point(start, edge(from)) + point(start, row);
    for (std::size_t i = 1; i + 1 < way.size(); ++i) {
        svg.Path(points + point(forward ? way[i].left : way[i].Right(), row), "arrow");
        points = point(forward ? way[i].Right() : way[i].left, row);
    }
    svg.Path(points + point(end, row) + point(end, edge(to)), "arrow");
}

}  // namespace

std::string DrawFlow(std::string_view text) {
    std::vector<Way> beside;
    const auto lines = Split(text, "\n");
    if (lines.empty()) throw std::invalid_argument("a flow without a line");
    for (const auto& line : lines) beside.push_back(ReadWay(line));
    Way main = beside.front();
    beside.erase(beside.begin());
    SetOut(main, beside);

    Svg svg;
    const double middle = kMargin + kBoxHeight / 2;
    for (std::size_t i = 0; i < main.size(); ++i) {
        DrawPlace(svg, main[i], middle);
        if (i > 0) svg.Line(main[i - 1].Right(), middle, main[i].left, middle, "arrow");
    }
    double row = middle;
    for (const Way& way : beside) DrawBeside(svg, main, way, middle, row += kRowHeight);
    return svg.Figure(main.back().Right() + kMargin, row + kBoxHeight / 2 + kMargin, "flow",
                      "Signal flow: " + lines[0]);
}

}  // namespace docs
