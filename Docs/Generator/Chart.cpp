#include "Chart.h"

#include <algorithm>
#include <cmath>
#include <stdexcept>

#include "Svg.h"

namespace docs {
namespace {

constexpr double kWidth = 640, kHeight = 320, kLeft = 58, kRight = 24, kTop = 34, kBottom = 46;
constexpr std::size_t kColours = 4;

double Across(const Axis& axis, double value) {
    return kLeft + axis.Place(value) * (kWidth - kLeft - kRight);
}
double Up(const Axis& axis, double value) {
    return kHeight - kBottom - axis.Place(value) * (kHeight - kTop - kBottom);
}

std::string TickText(double tick) {
    return std::abs(tick) < 1000 ? Number(tick, 3) : Number(tick / 1000, 3) + 'k';
}

}  // namespace

double Axis::Place(double value) const {
    if (logarithmic) return std::log(std::max(value, from / 2) / from) / std::log(to / from);
    return (value - from) / (to - from);
}

std::string DrawChart(const Axis& across, const Axis& up, const std::vector<Curve>& curves) {
    if (curves.size() > kColours) throw std::invalid_argument("more curves than colours");
    Svg svg;
    for (const double tick : across.ticks) {
        svg.Line(Across(across, tick), kTop, Across(across, tick), kHeight - kBottom, "grid");
        svg.Text(Across(across, tick), kHeight - kBottom + 17, TickText(tick), "middle", "tick");
    }
    for (const double tick : up.ticks) {
        svg.Line(kLeft, Up(up, tick), kWidth - kRight, Up(up, tick), "grid");
        svg.Text(kLeft - 6, Up(up, tick) + 4, TickText(tick), "end", "tick");
    }
    svg.Text((kLeft + kWidth - kRight) / 2, kHeight - 8, across.title, "middle", "tick");
    svg.Text(4, 13, up.title, "start", "tick");

    std::string legend;  // below the picture, where it wraps
    for (std::size_t i = curves.size(); i-- > 0;) {
        const auto& curve = curves[i];
        const std::string colour = "colour" + std::to_string(i);
        std::string points;
        bool inside = false;
        for (const auto& [x, y] : curve.points) {
            inside |= y >= up.from && y <= up.to;
            // What leaves the picture runs along its edge.
            points +=
                Number(Across(across, x), 2) + ',' + Number(Up(up, std::clamp(y, up.from, up.to)), 2) + ' ';
        }
        if (!inside) throw std::invalid_argument("the curve \"" + curve.label + "\" is not in the picture");
        svg.Path(points, "curve " + colour);
        if (!curve.label.empty())
            legend.insert(0, "<span class=\"" + colour + "\">" + Escaped(curve.label) + "</span>\n");
    }
    if (!legend.empty()) legend = "<p class=\"legend\">\n" + legend + "</p>\n";
    return svg.Figure(kWidth, kHeight, "chart", up.title + " over " + across.title) + legend;
}

}  // namespace docs
