#include "Core.h"

#include <algorithm>
#include <charconv>
#include <cmath>

namespace Corvo::Plugins {

Port OutputPort(const ResultPort& result) {
    Port port;
    port.name = result.name;
    port.symbol = SymbolOf(port.name);
    port.unit = result.unit;
    port.comment = result.comment;
    port.least = result.least;
    port.most = result.most;
    port.start = result.silent;
    port.whole = result.whole;
    port.isNumber = port.isOutput = true;
    port.curve = Curve(static_cast<double>(port.least), static_cast<double>(port.most), 0.0);
    if (!result.texts.empty()) port.type = EffectParameterType::List;
    for (const char* const text : result.texts)
        port.points.push_back({text, port.least + static_cast<float>(port.points.size())});
    return port;
}

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
