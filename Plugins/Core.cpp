#include "Core.h"

#include <algorithm>
#include <charconv>
#include <cmath>

namespace Corvo::Plugins {

std::string Core::Text(int index, float value) {
    const Port& port = Ports()[static_cast<std::size_t>(index)];
    value = std::clamp(value, port.least, port.most);
    const auto known =
        std::ranges::find(port.points, port.whole ? std::round(value) : value, &Port::Point::value);
    if (known != port.points.end()) return known->text;
    char text[32];
    const auto end =
        std::to_chars(text, text + sizeof text, value, std::chars_format::fixed, port.whole ? 0 : 1).ptr;
    return std::string(text, end) + (port.unit.empty() ? "" : " ") + port.unit;
}

bool Core::FromText(int index, const std::string& text, float& value) {
    const Port& port = Ports()[static_cast<std::size_t>(index)];
    const auto known = std::ranges::find(port.points, text, &Port::Point::text);
    if (known != port.points.end()) {
        value = known->value;
        return true;
    }
    float number = 0.0f;
    if (!ReadNumber(text, number)) return false;
    value = std::clamp(number, port.least, port.most);
    return true;
}

}  // namespace Corvo::Plugins
