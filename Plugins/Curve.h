#pragma once

#include <string>
#include <vector>

#include "DSP/Effects/Framework/CorvoEffectBase.h"

namespace Corvo::Plugins {

// Between the position of a control, 0..1, and the number that it shows. Either a line, or points with lines
// between them. Both directions are limited to their range and neither allocates.
class Curve {
public:
    Curve() = default;
    Curve(double first, double last, double nudge) : m_first(first), m_last(last), m_nudge(nudge) {}
    // Ascending in both.
    struct Point {
        double position, number;
    };
    explicit Curve(std::vector<Point> points);

    float Number(float position) const;
    float Position(float number) const { return PositionOf(number, m_nudge); }
    // Without the nudge: the exact reverse of Number.
    float Place(float number) const { return PositionOf(number, 0.0); }
    float Least() const { return static_cast<float>(m_first); }
    float Most() const { return static_cast<float>(m_last); }

private:
    float PositionOf(float number, double nudge) const;

    double m_first = 0.0, m_last = 1.0;
    double m_nudge = 0.0;  // away from 0: the effect cuts what it stores
    std::vector<Point> m_points;
};

// The curve of a parameter that shows numbers, read from its texts; `effect` is for trying values.
struct ReadCurve {
    bool isNumber = false;  // else the texts hold none, or depend on other parameters
    Curve curve;
    int decimals = 0;
    bool keepsFractions = false;  // the effect stores more than it shows
    double Resolution() const;    // of the last decimal
    std::string endTexts[2];      // of an end that shows no number: "-Inf. dB", "Off"
};
ReadCurve CurveOf(DSP::CorvoEffectBase& effect, int parameter);

// What the control shows at a position, without blanks around it; the first one sets it.
std::string ShownAt(DSP::CorvoEffectBase& effect, int parameter, float position);
std::string Shown(DSP::CorvoEffectBase& effect, int parameter, float position);

// The position next to `position` that shows the text, or that one where there is none: readers and stored
// values may be a step apart.
float PositionThatShows(DSP::CorvoEffectBase& effect, int parameter, float position, const std::string& text);

// The number in such a text, at its start or after a bar; false where there is none.
bool ReadNumber(const std::string& text, float& number);

}  // namespace Corvo::Plugins
