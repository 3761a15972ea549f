#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <complex>
#include <numbers>
#include <string>

#include <nlohmann/json.hpp>

#include "Arguments.h"
#include "EqualiserElement.h"
#include "Errors.h"
#include "Text.h"

namespace dsphost {
namespace {

constexpr int kPoints = 512;
constexpr double kLowestHz = 10.0;
constexpr double kSilence = 1e-15;  // -300 dB stands for everything below, so that every row is a number
constexpr int kLowestRate = 100, kHighestRate = 10'000'000;

struct Point {
    double hz, decibels, degrees;
};

std::array<Point, kPoints> Curve(const EqCurveArguments& arguments) {
    const std::string_view text = arguments.effect;
    const auto colon = std::min(text.find(':'), text.size());
    if (!SameNoCase(Trimmed(text.substr(0, colon)), EqualiserElement::kName))
        throw UserError("--fx cannot be \"" + arguments.effect + "\"; accepted: \"EQ: band; band; ...\"");
    auto data = ParseBands(text.substr(std::min(colon + 1, text.size())));
    Corvo::DSP::ParEQ eq;
    eq.Cook(false, false, &data, arguments.rate, 1);
    std::array<Point, kPoints> curve;
    for (int i = 0; i < kPoints; ++i) {
        // Both ends exactly; in between rounding does no harm.
        const double share = static_cast<double>(i) / (kPoints - 1), highest = arguments.rate / 2.0;
        const double hz = i == kPoints - 1 ? highest : kLowestHz * std::pow(highest / kLowestHz, share);
        const auto response = eq.GetResponse(0, hz, arguments.rate, &data);
        curve[static_cast<std::size_t>(i)] = {hz, 20.0 * std::log10(std::max(std::abs(response), kSilence)),
                                              std::arg(response) * 180.0 / std::numbers::pi};
    }
    return curve;
}

// With a point in every locale, and as many digits as bring the number back.
std::string Number(double value) {
    std::array<char, 32> digits;
    return {digits.data(), std::to_chars(digits.data(), digits.data() + digits.size(), value).ptr};
}

std::string Csv(const std::array<Point, kPoints>& curve) {
    std::string text = "frequency_hz,gain_db,phase_deg\n";
    for (const auto& p : curve)
        text += Number(p.hz) + "," + Number(p.decibels) + "," + Number(p.degrees) + "\n";
    return text;
}

std::string Json(const std::array<Point, kPoints>& curve, int rate) {
    auto points = nlohmann::ordered_json::array();
    for (const auto& p : curve)
        points.push_back({{"frequency_hz", p.hz}, {"gain_db", p.decibels}, {"phase_deg", p.degrees}});
    return nlohmann::ordered_json{{"rate", rate}, {"points", points}}.dump(2) + "\n";
}

}  // namespace

void RunEqCurve(EqCurveArguments arguments) {
    if (arguments.rate < kLowestRate || arguments.rate > kHighestRate)
        throw UserError("--rate cannot be " + std::to_string(arguments.rate) + "; accepted: " +
                        std::to_string(kLowestRate) + " to " + std::to_string(kHighestRate) + " Hz");
    const auto curve = Curve(arguments);
    const std::string text = arguments.json ? Json(curve, arguments.rate) : Csv(curve);
    OutputFile output(arguments.output, arguments.writing.rules);
    output.Bytes().Write(text.data(), text.size());
    output.Commit();
}

}  // namespace dsphost
