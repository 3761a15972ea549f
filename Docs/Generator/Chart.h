#pragma once

#include <string>
#include <utility>
#include <vector>

namespace docs {

struct Axis {
    std::string title;
    double from, to;
    std::vector<double> ticks;
    bool logarithmic = false;

    // 0..1 within the axis; beyond it, beyond.
    double Place(double value) const;
};

struct Curve {
    std::string label;
    std::vector<std::pair<double, double>> points;
};

// Curves over two axes, as a figure for a page. At most as many curves as there are colours (4); throws
// std::invalid_argument beyond, and for a curve without a point inside the axes.
std::string DrawChart(const Axis& across, const Axis& up, const std::vector<Curve>& curves);

}  // namespace docs
