#include "EqualiserPage.h"

#include <array>
#include <cmath>
#include <sstream>
#include <stdexcept>

#include "Chart.h"
#include "DSP/Equalizer/ParEQ.h"
#include "FlowDiagram.h"
#include "Measurements.h"
#include "PageText.h"
#include "Svg.h"

namespace docs {
namespace {

using namespace Corvo::DSP;

constexpr int kRate = 48000;

struct Type {
    const char* name;  // as dsphost takes it
    EQFilterType type;
    const char *does, *q;
};
constexpr std::array kTypes{
    Type{"highpass", EQ_HIGHPASS, "takes away what is below", "resonance: 50 is the flattest"},
    Type{"lowpass", EQ_LOWPASS, "takes away what is above", "resonance: 50 is the flattest"},
    Type{"peak", EQ_PEAK, "raises or lowers what is around", "width: 133 is an octave"},
    Type{"lowshelf", EQ_LOWSHELF, "raises or lowers all below",
         "slope: 50 is the steepest without a bump, 150 the limit"},
    Type{"highshelf", EQ_HIGHSHELF, "raises or lowers all above",
         "slope: 50 is the steepest without a bump, 150 the limit"},
    Type{"lowshelf-butterworth", EQ_LOWSHELF_BUTTERWORTH, "the same, of one slope", "none"},
    Type{"highshelf-butterworth", EQ_HIGHSHELF_BUTTERWORTH, "the same, of one slope", "none"},
};

// "FREQ TYPE [GAIN] [q=Q]", as dsphost takes it.
builtin_effects_data ReadBand(const std::string& text) {
    builtin_effects_data data;
    data.SetNumBands(1);
    std::istringstream words(text);
    int frequency = 0;
    std::string word;
    words >> frequency >> word;
    bool known = false;
    for (const auto& type : kTypes)
        if (word == type.name) data.SetEqType(0, type.type), known = true;
    if (!known || frequency < 1) throw std::invalid_argument("no band: " + text);
    data.SetEqFreq(0, frequency);
    data.SetDefaultQ(0);
    while (words >> word)
        if (word.starts_with("q="))
            data.SetEqQ(0, std::stoi(word.substr(2)));
        else
            data.SetEqBoost(0, static_cast<int>(std::lround(10 * std::stod(word))));
    return data;
}

// A curve for each line, "label: band".
std::string DrawCurves(std::string_view text) {
    std::vector<Curve> curves;
    for (const auto& line : Split(text, "\n")) {
        const auto [label, band] = NameAndRest(line);
        builtin_effects_data data = ReadBand(band);
        ParEQ equaliser;
        equaliser.Cook(false, false, &data, kRate, 1);
        curves.push_back({label, {}});
        for (double hz = 20; hz <= 20000; hz *= 1.015)
            curves.back().points.emplace_back(
                hz, 20 * std::log10(std::abs(equaliser.GetResponse(0, hz, kRate, &data)) + 1e-9));
    }
    return DrawChart(
        {"frequency, Hz", 20, 20000, {20, 50, 100, 200, 500, 1000, 2000, 5000, 10000, 20000}, true},
        {"gain, dB", -18, 18, {-18, -12, -6, 0, 6, 12, 18}}, curves);
}

std::string TypeTable() {
    std::string table = Headings({"Type", "What it does", "Q", "Default Q"});
    for (const auto& type : kTypes) {
        builtin_effects_data data;
        data.SetEqType(0, type.type);
        data.SetDefaultQ(0);
        table +=
            Cells({std::string("`") + type.name + "`", type.does, type.q, std::to_string(data.GetEqQ(0))});
    }
    return table;
}

// Of so many peaks, none of them flat or on the move.
std::string Cost(int bands) {
    builtin_effects_data data;
    data.SetNumBands(bands);
    for (int i = 0; i < bands; ++i) data.SetEqData(i, {EQ_PEAK, 100 << i, 60, 200});
    ParEQ equaliser;
    equaliser.Cook(false, false, &data, kRate, 2);
    std::array records{data, data};
    return Number(NanosecondsPerFrame(
        [&](float* samples, int frames) { equaliser.Process(samples, frames, 2, false, records.data()); }));
}

}  // namespace

std::string EqualiserPage(const std::string& textPath) {
    auto sections = ReadSections(
        textPath, {"Good for", "Signal flow", "What it does to sound", "Formulae", "Latency", "Try it"});
    sections[1] = ReplaceFences(sections[1], "flow", DrawFlow);
    sections[2] = ReplaceFences(sections[2], "curves", DrawCurves);
    const auto facts = FactsTable(
        {"none", "no: bands are edited, and glide to where they go", "no",
         Cost(3) + " ns per stereo frame with 3 bands, " + Cost(8) + " with 8, while none of them glides"});
    return "# EQ\n" + sections[0] + '\n' + facts + "\n## Signal flow\n" + sections[1] +
           "\n## What it does to sound\n" + sections[2] + "\n## Bands\n\nUp to " +
           std::to_string(builtin_effects_data::kMaxBands) +
           ", each with a type, a frequency in whole Hz below half the sampling rate, a gain in steps of 0.1 "
           "dB and a Q. `dsphost` takes them as `FREQ TYPE [GAIN] [q=Q]`, with semicolons between: gains "
           "from "
           "-100 to 100 dB, Q from 1 to 100000. What a Q means depends on the type; a peak with a Q of many "
           "thousands, which is wider than all that can be heard, makes no stable filter and is left out. A "
           "high- or low-pass gives its gain to all that it lets through.\n\n" +
           TypeTable() + "\n## Presets\n\nNone: it starts flat.\n\n## Formulae\n" + sections[3] +
           "\n## Latency\n" + sections[4] + TryIt(sections[5]);
}

}  // namespace docs
