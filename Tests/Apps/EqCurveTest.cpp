#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <numbers>
#include <sstream>
#include <string>
#include <vector>

#include <nlohmann/json.hpp>

#include "Apps/Program.h"

namespace AppTest {
namespace {

constexpr int kRate = 48000;

struct Row {
    double hz, decibels, degrees;
};

std::vector<Row> ParseCurve(const std::string& csv) {
    std::istringstream lines(csv);
    std::string line;
    std::getline(lines, line);
    EXPECT_EQ(line, "frequency_hz,gain_db,phase_deg");
    std::vector<Row> rows;
    for (Row row; std::getline(lines, line); rows.push_back(row))
        EXPECT_EQ(std::sscanf(line.c_str(), "%lf,%lf,%lf", &row.hz, &row.decibels, &row.degrees), 3) << line;
    return rows;
}

std::complex<double> SpectrumAt(double hz, const std::vector<double>& samples) {
    const auto turn = std::polar(1.0, -2.0 * std::numbers::pi * hz / kRate);
    std::complex<double> sum = 0.0;
    for (auto sample = samples.rbegin(); sample != samples.rend(); ++sample) sum = sum * turn + *sample;
    return sum;
}

// A sine sweeping from 5 Hz to half the rate, in a second.
Sound Sweep() {
    Sound sweep{1, kRate, SF_FORMAT_WAV | SF_FORMAT_DOUBLE, {}};
    const double octaves = std::log2(kRate / 2.0 / 5.0), rise = octaves * std::numbers::ln2;
    for (int i = 0; i < kRate; ++i)
        sweep.samples.push_back(
            0.1 * std::sin(2.0 * std::numbers::pi * 5.0 / rise * (std::exp(rise * i / kRate) - 1.0)));
    return sweep;
}

class EqCurve : public Program {};

TEST_F(EqCurve, AgreesWithASineSweptThroughRender) {
    const Sound sweep = Sweep();
    Save("sweep.wav", sweep);
    for (const std::string bands :
         {"80 highpass q=50", "3000 lowpass -2.5 q=90", "2500 peak -3 q=200", "150 lowshelf 7.5",
          "6000 highshelf -9 q=120", "200 lowshelf-butterworth 12", "5000 highshelf-butterworth 4",
          "40000 peak 6; 30000 highshelf 6", "80 highpass q=50; 2500 peak -3 q=200; 9000 lowpass"}) {
        SCOPED_TRACE(bands);
        auto result = Run({"eq-curve", "--fx", "EQ: " + bands, "--rate", "48000", "curve.csv", "-y"});
        ASSERT_EQ(result.status, 0) << result.err;
        result = Run({"render", "sweep.wav", "out.wav", "--fx", "EQ: " + bands, "--precision", "64", "--tail",
                      "1", "-y"});
        ASSERT_EQ(result.status, 0) << result.err;
        const auto curve = ParseCurve(Bytes("curve.csv"));
        ASSERT_EQ(curve.size(), 512u);
        EXPECT_EQ(curve.front().hz, 10.0);
        EXPECT_EQ(curve.back().hz, 24000.0);
        EXPECT_NEAR(curve[256].hz, 10.0 * std::pow(2400.0, 256.0 / 511.0), 1e-6);
        const Sound out = Load("out.wav");
        for (std::size_t i = 0; i < curve.size(); i += 17) {
            const auto measured =
                SpectrumAt(curve[i].hz, out.samples) / SpectrumAt(curve[i].hz, sweep.samples);
            if (curve[i].decibels < -120.0) continue;
            EXPECT_NEAR(20.0 * std::log10(std::abs(measured)), curve[i].decibels, 0.01) << curve[i].hz;
            const double apart = std::arg(measured) * 180.0 / std::numbers::pi - curve[i].degrees;
            EXPECT_NEAR(std::remainder(apart, 360.0), 0.0, 0.1) << curve[i].hz;
        }
    }
}

TEST_F(EqCurve, WritesTheSameAsJson) {
    const std::string fx = "eq: 12000 LOWPASS";
    const auto curve = ParseCurve(Run({"eq-curve", "--fx", fx, "-"}).out);
    const auto json = nlohmann::json::parse(Run({"eq-curve", "--fx", fx, "--json", "-"}).out);
    EXPECT_EQ(json["rate"], kRate);
    ASSERT_EQ(json["points"].size(), curve.size());
    EXPECT_EQ(json["points"][100]["gain_db"], curve[100].decibels);
    EXPECT_EQ(json["points"][511]["gain_db"], -300.0) << "a number even where nothing is left";
}

TEST_F(EqCurve, RefusesWhatItCannotDo) {
    struct Case {
        std::vector<std::string> arguments;
        std::vector<std::string> words;
    };
    std::string crowd;
    for (int i = 0; i < 21; ++i) crowd += "100 peak 1;";
    for (const Case& c : {Case{{"--fx", "Gain"}, {"Gain", "EQ:"}},
                          {{"--fx", "EQ"}, {"no bands", "2500 peak"}},
                          {{"--fx", "EQ: ; ;"}, {"no bands"}},
                          {{"--fx", "EQ: 100"}, {"\"100\"", "FREQ TYPE"}},
                          {{"--fx", "EQ: 0 peak"}, {"\"0\"", "1000000"}},
                          {{"--fx", "EQ: 99.5 peak"}, {"\"99.5\"", "whole Hz"}},
                          {{"--fx", "EQ: loud peak"}, {"loud"}},
                          {{"--fx", "EQ: 100 bell"}, {"bell", "peak"}},
                          {{"--fx", "EQ: 100 low"}, {"low", "lowshelf"}},
                          {{"--fx", "EQ: 100 peak 3.05"}, {"3.05", "steps of 0.1"}},
                          {{"--fx", "EQ: 100 peak 101"}, {"101", "100 dB"}},
                          {{"--fx", "EQ: 100 peak 3 4"}, {"\"4\"", "one gain"}},
                          {{"--fx", "EQ: 100 peak q=1 q=2"}, {"q=2", "one gain"}},
                          {{"--fx", "EQ: 100 peak q=0"}, {"\"0\"", "q=1"}},
                          {{"--fx", "EQ: " + crowd}, {"more than 20"}},
                          {{"--fx", "EQ: 100 peak 1", "--rate", "7"}, {"7", "100"}}}) {
        auto arguments = c.arguments;
        arguments.insert(arguments.begin(), {"eq-curve", "out.csv"});
        ExpectRefused(Run(arguments), 2, c.words);
    }
}

}  // namespace
}  // namespace AppTest
