#pragma once

#include <charconv>
#include <string>
#include <string_view>

namespace docs {

// A number as SVG and a reader take it: with a point, and no more digits than it needs.
inline std::string Number(double value, int digits = 1) {
    char text[64];
    const auto end = std::to_chars(text, text + sizeof text, value, std::chars_format::fixed, digits).ptr;
    std::string number(text, end);
    if (number.find('.') == std::string::npos) return number;
    number.erase(number.find_last_not_of('0') + 1);
    if (number.back() == '.') number.pop_back();
    return number == "-0" ? "0" : number;
}

// Text between tags or in quotes.
inline std::string Escaped(std::string_view text) {
    std::string escaped;
    for (const char c : text) switch (c) {
            case '&':
                escaped += "&amp;";
                break;
            case '<':
                escaped += "&lt;";
                break;
            case '>':
                escaped += "&gt;";
                break;
            case '"':
                escaped += "&quot;";
                break;
            default:
                escaped += c;
        }
    return escaped;
}

inline std::size_t Characters(std::string_view utf8) {
    std::size_t count = 0;
    for (const char c : utf8) count += (static_cast<unsigned char>(c) & 0xC0) != 0x80;
    return count;
}

// Elements of a picture, which takes its colour from the page around it.
class Svg {
public:
    void Line(double x1, double y1, double x2, double y2, std::string_view look) {
        m_elements += "<line x1=\"" + Number(x1) + "\" y1=\"" + Number(y1) + "\" x2=\"" + Number(x2) +
                      "\" y2=\"" + Number(y2) + "\" class=\"" + std::string(look) + "\"/>\n";
    }
    void Box(double x, double y, double width, double height) {
        m_elements += "<rect x=\"" + Number(x) + "\" y=\"" + Number(y) + "\" width=\"" + Number(width) +
                      "\" height=\"" + Number(height) + "\" rx=\"4\" class=\"box\"/>\n";
    }
    // `points` is what the attribute takes: "x,y x,y".
    void Path(std::string_view points, std::string_view look) {
        m_elements +=
            "<polyline points=\"" + std::string(points) + "\" class=\"" + std::string(look) + "\"/>\n";
    }
    // `anchor` is start, middle or end.
    void Text(double x, double y, std::string_view text, std::string_view anchor = "middle",
              std::string_view look = "text") {
        m_elements += "<text x=\"" + Number(x) + "\" y=\"" + Number(y) + "\" text-anchor=\"" +
                      std::string(anchor) + "\" class=\"" + std::string(look) + "\">" + Escaped(text) +
                      "</text>\n";
    }
    // As a block of HTML that stands in Markdown: no line of it is empty. `kind` is its class.
    std::string Figure(double width, double height, std::string_view kind,
                       std::string_view description) const {
        return "<div class=\"" + std::string(kind) + "\"><svg viewBox=\"0 0 " + Number(width) + ' ' +
               Number(height) + "\" width=\"" + Number(width) + "\" height=\"" + Number(height) +
               "\" style=\"--width:" + Number(width) + "px" + "\" role=\"img\" aria-label=\"" +
               Escaped(description) +
               "\">\n<defs><marker id=\"head\" viewBox=\"0 0 8 8\" refX=\"7\" refY=\"4\" markerWidth=\"7\" "
               "markerHeight=\"7\" orient=\"auto\"><path d=\"M0,0 L8,4 L0,8 z\" "
               "class=\"head\"/></marker></defs>\n" +
               m_elements + "</svg></div>\n";
    }

private:
    std::string m_elements;
};

}  // namespace docs
