#include <charconv>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "Commands.h"
#include "Spectrum/AnalyserMenu.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/Tuner/Tuner.h"
#include "View.h"

// What is chosen, as lines "name = value": a line for each entry of the analyser's menu that has a tick, and
// one for everything else.
namespace analyser {
namespace {

constexpr std::string_view kTitle = "analyser settings 1";
constexpr const char *kView = "View", *kStrip = "Tuner above", *kSpeed = "Sonogram speed",
                     *kScheme = "Sonogram colours", *kReference = "Tuner reference";
constexpr int kModes = kivspectrum::display_tuner + 1;

using Lines = std::vector<std::pair<std::string, std::string>>;

bool ReadLines(std::string_view text, Lines& lines) {
    bool first = true;
    while (!text.empty()) {
        const std::string_view line = text.substr(0, text.find('\n'));
        text.remove_prefix(std::min(line.size() + 1, text.size()));
        if (std::exchange(first, false)) {
            if (line != kTitle) return false;
            continue;
        }
        if (line.empty()) continue;
        const auto equals = line.find(" = ");
        if (equals == std::string_view::npos) return false;
        lines.emplace_back(line.substr(0, equals), line.substr(equals + 3));
    }
    return !first;
}

bool Has(const Lines& lines, std::string_view name, std::string_view value) {
    for (const auto& [key, chosen] : lines)
        if (key == name && chosen == value) return true;
    return false;
}

// False for a number outside; nothing is done where there is no such line.
template <typename Number, typename Use>
bool WithNumber(const Lines& lines, std::string_view name, Number lowest, Number highest, Use use) {
    for (const auto& [key, value] : lines) {
        if (key != name) continue;
        Number number{};
        const auto result = std::from_chars(value.data(), value.data() + value.size(), number);
        if (result.ec != std::errc() || result.ptr != value.data() + value.size()) return false;
        if (!(number >= lowest && number <= highest)) return false;
        use(number);
    }
    return true;
}

// An analyser that was left off would start as an empty window.
bool IsKept(int command) { return command != kAnalyserOn; }

std::string Number(double value) {
    char text[32];
    const auto result = std::to_chars(text, text + sizeof text, value);
    return {text, result.ptr};
}

}  // namespace

std::string View::GetSettings() const {
    std::string text(kTitle);
    const auto line = [&](std::string_view name, std::string_view value) {
        text.append("\n").append(name).append(" = ").append(value);
    };
    const kivspectrum& first = GetAnalyser();
    line(kView, std::to_string(static_cast<int>(first.GetDisplayMode())));
    line(kStrip, std::to_string(first.IsShowTuner() ? 1 : 0));
    line(kSpeed, std::to_string(Corvo::Sonogram::GetSpeedIndex()));
    line(kScheme, std::to_string(Corvo::Sonogram::GetColourScheme()));
    line(kReference, Number(4.0 * Tuner::GetCalibrationBase()));
    for (const Corvo::AnalyserMenuEntry& entry : Corvo::AnalyserMenu())
        if (IsKept(entry.command) && IsChosen(entry.command)) line(entry.group, entry.text);
    return text.append("\n");
}

bool View::SetSettings(const std::string& text) {
    Lines lines;
    int mode = -1, strip = -1, speed = -1, colours = -1;
    double reference = 0.0;
    if (!ReadLines(text, lines) || !WithNumber(lines, kView, 0, kModes - 1, [&](int i) { mode = i; }) ||
        !WithNumber(lines, kStrip, 0, 1, [&](int i) { strip = i; }) ||
        !WithNumber(lines, kSpeed, 0, kSpeeds - 1, [&](int i) { speed = i; }) ||
        !WithNumber(lines, kScheme, 0, kColours - 1, [&](int i) { colours = i; }) ||
        !WithNumber(lines, kReference, kLowestReference, kHighestReference,
                    [&](double hz) { reference = hz; }))
        return false;
    // What is wanted first: then what has a tick without being wanted is a switch that is to be off.
    const auto menu = Corvo::AnalyserMenu();
    const auto wanted = [&](const Corvo::AnalyserMenuEntry& entry) {
        return Has(lines, entry.group, entry.text);
    };
    // Twice: a tuner that is to be off holds the window's length until it is.
    for (int pass = 0; pass < 2; ++pass) {
        for (const auto& entry : menu)
            if (wanted(entry) && !IsChosen(entry.command)) Act(entry.command);
        for (const auto& entry : menu)
            if (!wanted(entry) && IsKept(entry.command) && !IsSensitivity(entry.command) &&
                IsChosen(entry.command))
                Act(entry.command);
    }
    if (mode >= 0) ShowMode(static_cast<kivspectrum::_display_mode>(mode));
    if (strip >= 0) GetAnalyser().ShowTuner(strip != 0);
    if (speed >= 0) Corvo::Sonogram::SetSpeedIndex(speed);
    if (colours >= 0) Corvo::Sonogram::SetColourScheme(colours);
    if (reference > 0.0) TunerCalibrateTo(reference);
    FollowFirst();
    m_dirty = true;
    return true;
}

}  // namespace analyser
