#include "Curve.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <exception>
#include <optional>
#include <string_view>

namespace Corvo::Plugins {
namespace {

using DSP::CorvoEffectBase;

constexpr int kSamples = 256;  // positions at which texts are read
constexpr int kTablePoints = 1024;

struct ShownNumber {
    double value;
    int decimals;
};

// The number at the start of a text, or after the bar of "Tiny | 50".
std::optional<ShownNumber> NumberIn(std::string_view text) {
    if (const auto bar = text.find("| "); bar != text.npos) text.remove_prefix(bar + 2);
    double value;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    if (error != std::errc{} || !std::isfinite(value)) return {};
    const std::string_view digits(text.data(), static_cast<std::size_t>(end - text.data()));
    const auto point = digits.find('.');
    // "100." is a word that ends in a point.
    return ShownNumber{value, point == digits.npos ? 0 : static_cast<int>(digits.size() - point) - 1};
}

// Whether a list of the effect changes what the parameter shows: then it has no unit of its own.
bool DependsOnLists(CorvoEffectBase& effect, int parameter) {
    const std::string before = ShownAt(effect, parameter, 0.75f);
    for (int other = 0; other < effect.GetParamCount(); ++other) {
        const auto description = effect.Describe(other);
        if (description.type != EffectParameterType::List || other == parameter) continue;
        const float kept = effect.GetParam(other);
        bool differs = false;
        for (const auto& choice : description.choices) {
            effect.SetParam(other, choice.normalised, false);
            differs = differs || ShownAt(effect, parameter, 0.75f) != before;
        }
        effect.SetParam(other, kept, false);
        if (differs) return true;
    }
    return false;
}

bool KeepsFractions(CorvoEffectBase& effect, int parameter) {
    constexpr float kOdd = 0.3712349f;
    effect.SetParam(parameter, kOdd, false);
    return std::abs(effect.GetParam(parameter) - kOdd) < 1e-6f;
}

// The first of the positions around one, nearest first, of which something is true; else that one.
template <typename IsTrue>
float Nearby(float position, IsTrue isTrue) {
    constexpr float kStride = 5e-5f;
    for (int i = 0; i < 40; ++i)
        for (const float other :
             {position + static_cast<float>(i) * kStride, position - static_cast<float>(i) * kStride})
            if (other >= 0.0f && other <= 1.0f && isTrue(other)) return other;
    return position;
}

std::optional<Curve::Point> PointAt(CorvoEffectBase& effect, int parameter, double number) {
    try {
        const float position = effect.GetParamValueNormalizedFromText(parameter, std::to_string(number));
        // Some readers go beyond the end by a rounding.
        if (!(position >= 0.0f && position <= 1.01f)) return {};
        const float shows = Nearby(std::min(position, 1.0f), [&](float other) {
            const auto shown = NumberIn(ShownAt(effect, parameter, other));
            return shown && std::abs(shown->value - number) < 1e-6;
        });
        return Curve::Point{static_cast<double>(shows), number};
    } catch (const std::exception&) {
        return {};
    }
}

// Points at the numbers that the effect's own reader turns into positions: evenly by number, and by position.
std::vector<Curve::Point> PointsOf(CorvoEffectBase& effect, int parameter, double least, double most,
                                   double resolution) {
    const double steps = std::round((most - least) / resolution);
    const double stride = resolution * std::max(1.0, std::ceil(steps / kTablePoints));
    std::vector<double> numbers;
    for (double number = least; number <= most + 0.5 * resolution; number += stride)
        numbers.push_back(std::round(number / resolution) * resolution);
    for (int i = 0; i <= kTablePoints; ++i)
        if (const auto shown = NumberIn(ShownAt(effect, parameter, static_cast<float>(i) / kTablePoints)))
            numbers.push_back(shown->value);
    std::ranges::sort(numbers);
    std::vector<Curve::Point> points;
    for (const double number : numbers)
        if (const auto point = PointAt(effect, parameter, number))
            if (points.empty() || (point->position > points.back().position &&
                                   point->number > points.back().number + 0.5 * resolution))
                points.push_back(*point);
    return points;
}

}  // namespace

Curve::Curve(std::vector<Point> points)
    : m_first(points.front().number), m_last(points.back().number), m_points(std::move(points)) {}

float Curve::Number(float position) const {
    const auto at = static_cast<double>(std::clamp(position, 0.0f, 1.0f));
    if (m_points.empty()) return static_cast<float>(m_first + at * (m_last - m_first));
    const auto above = std::ranges::lower_bound(m_points, at, {}, &Point::position);
    if (above == m_points.begin()) return Least();
    if (above == m_points.end()) return Most();
    const auto& [p0, n0] = above[-1];
    return static_cast<float>(n0 + (at - p0) / (above->position - p0) * (above->number - n0));
}

float Curve::PositionOf(float number, double nudge) const {
    if (number <= Least()) return m_points.empty() ? 0.0f : static_cast<float>(m_points.front().position);
    if (number >= Most()) return m_points.empty() ? 1.0f : static_cast<float>(m_points.back().position);
    const auto wanted = static_cast<double>(number);
    if (m_points.empty())
        return static_cast<float>((wanted + std::copysign(wanted == 0.0 ? 0.0 : nudge, wanted) - m_first) /
                                  (m_last - m_first));
    const auto above = std::ranges::lower_bound(m_points, wanted, {}, &Point::number);
    // Where a number is known its position is exact: it may be the edge of what shows it.
    if (static_cast<float>(above->number) == number) return static_cast<float>(above->position);
    const auto& [p0, n0] = above[-1];
    if (static_cast<float>(n0) == number) return static_cast<float>(p0);
    return static_cast<float>(p0 + (wanted - n0) / (above->number - n0) * (above->position - p0));
}

double ReadCurve::Resolution() const { return std::pow(10.0, -decimals); }

std::string ShownAt(CorvoEffectBase& effect, int parameter, float position) {
    // Some texts show what is stored, whatever they are asked for.
    effect.SetParam(parameter, position, false);
    return Shown(effect, parameter, position);
}

std::string Shown(CorvoEffectBase& effect, int parameter, float position) {
    const auto wide = effect.GetParameterFormattedText(parameter, static_cast<double>(position));
    std::string text;
    for (const wchar_t c : wide) text += static_cast<char>(c);
    const auto first = text.find_first_not_of(' ');
    return first == text.npos ? "" : text.substr(first, text.find_last_not_of(' ') - first + 1);
}

// The lowest number, or the highest, that is shown between a position with one and the end without.
double LastNumber(CorvoEffectBase& effect, int parameter, float with, float without) {
    for (int i = 0; i < 24; ++i) {
        const float middle = 0.5f * (with + without);
        (NumberIn(ShownAt(effect, parameter, middle)) ? with : without) = middle;
    }
    return NumberIn(ShownAt(effect, parameter, with))->value;
}

float PositionThatShows(CorvoEffectBase& effect, int parameter, float position, const std::string& text) {
    return Nearby(position, [&](float place) { return ShownAt(effect, parameter, place) == text; });
}

bool ReadNumber(const std::string& text, float& number) {
    const auto found = NumberIn(text);
    if (found) number = static_cast<float>(found->value);
    return found.has_value();
}

ReadCurve CurveOf(CorvoEffectBase& effect, int parameter) {
    ReadCurve read;
    if (DependsOnLists(effect, parameter)) return read;
    std::vector<std::optional<ShownNumber>> shown;
    for (int i = 0; i <= kSamples; ++i)
        shown.push_back(NumberIn(ShownAt(effect, parameter, static_cast<float>(i) / kSamples)));
    const auto has = [](const auto& number) { return number.has_value(); };
    const auto begin = std::ranges::find_if(shown, has);
    const auto end = std::find_if(shown.rbegin(), shown.rend(), has).base();
    if (end - begin < kSamples / 2 || !std::all_of(begin, end, has)) return read;
    const auto lowest = static_cast<int>(begin - shown.begin()),
               highest = static_cast<int>(end - shown.begin()) - 1;
    const bool hasFirst = lowest == 0, hasLast = highest == kSamples;
    read.isNumber = true;
    read.decimals = shown[kSamples / 2]->decimals;
    const double resolution = read.Resolution();
    if (!hasFirst) read.endTexts[0] = ShownAt(effect, parameter, 0.0f);
    if (!hasLast) read.endTexts[1] = ShownAt(effect, parameter, 1.0f);
    read.keepsFractions = KeepsFractions(effect, parameter);

    // A line? From the ends that show numbers, else from the middle and the other end.
    const double middle = shown[kSamples / 2]->value;
    const double last = hasLast ? shown.back()->value : 2.0 * middle - begin->value().value;
    const double first = hasFirst ? shown.front()->value : 2.0 * middle - last;
    bool line = lowest <= 1 && highest >= kSamples - 1;
    for (int i = lowest; i <= highest; ++i)
        line = line && std::abs(first + (last - first) * i / kSamples - shown[i]->value) < 1.01 * resolution;
    if (line) {
        read.curve = Curve(first, last, read.keepsFractions ? 0.0 : 0.02 * resolution);
        return read;
    }
    // An end without a number stands one step beyond the others.
    const auto at = [](int sample) { return static_cast<float>(sample) / kSamples; };
    const double least = hasFirst ? first : LastNumber(effect, parameter, at(lowest), 0.0f);
    const double most = hasLast ? last : LastNumber(effect, parameter, at(highest), 1.0f);
    auto points = PointsOf(effect, parameter, least, most, resolution);
    if (points.size() < 2) return {};
    if (hasFirst)
        points.front().position = 0.0;
    else if (points.front().position > 0.0)
        points.insert(points.begin(), {0.0, points.front().number - resolution});
    if (hasLast)
        points.back().position = 1.0;
    else if (points.back().position < 1.0)
        points.push_back({1.0, points.back().number + resolution});
    read.curve = Curve(std::move(points));
    return read;
}

}  // namespace Corvo::Plugins
