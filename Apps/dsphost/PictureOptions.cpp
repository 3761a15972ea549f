#include "PictureOptions.h"

#include <algorithm>
#include <array>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string_view>

#include "Drawing/DrawingFont.h"
#include "Errors.h"
#include "OutputFile.h"
#include "Spectrum/kivspectrum.h"
#include "Text.h"

namespace dsphost {
namespace {

constexpr int kLargestSide = 16384;
constexpr int kUsualWidth = 1280, kUsualHeight = 720;
constexpr float kLowestDpi = 24.0f, kHighestDpi = 960.0f;

// clang-format off
struct ViewOption { const char* name; int command; };
constexpr ViewOption kView[] = {
    {"line",           1307}, {"filled",     1308}, {"bars",  1309},
    {"auto",           1284}, {"linear",     1285}, {"log",   1286}, {"octaves", 1287},
    {"third-octaves",  1288}, {"mel",        1289}, {"notes", 1290},
    {"decibels",       1291}, {"power",      1292}, {"amplitude", 1293},
    {"60dB",           1250}, {"90dB",       1251}, {"120dB", 1252}, {"144dB",   1253},
    {"no-grid",        1254}, {"no-labels",  1306}, {"no-info", 1312}, {"no-peaks", 1300},
    {"note-names",     1316}, {"sharps",     1335}, {"flats", 1336}, {"solfege", 1337},
};
// clang-format on

// By the first bytes of the file.
bool IsTypeface(const std::string& path) {
    std::array<char, 4> tag{};
    std::ifstream(PathOf(path), std::ios::binary).read(tag.data(), tag.size());
    const std::string_view found(tag.data(), tag.size());
    using namespace std::string_view_literals;
    return found == "\0\1\0\0"sv || found == "OTTO"sv || found == "true"sv || found == "ttcf"sv;
}

// "1280x720".
std::pair<int, int> Sides(const std::string& text) {
    const auto cross = std::min(text.find_first_of("xX"), text.size());
    const auto width = ToNumber(text.substr(0, cross));
    const auto height = ToNumber(cross < text.size() ? text.substr(cross + 1) : "");
    const auto fits = [](std::optional<double> side) {
        return side && *side >= 1.0 && *side <= kLargestSide && *side == static_cast<int>(*side);
    };
    if (!fits(width) || !fits(height))
        throw UserError("--size cannot be \"" + text + "\"; accepted: WIDTHxHEIGHT, each 1 to " +
                        std::to_string(kLargestSide) + " pixels");
    return {static_cast<int>(*width), static_cast<int>(*height)};
}

}  // namespace

std::vector<std::string> ViewNames() {
    std::vector<std::string> names;
    for (const ViewOption& option : kView) names.push_back(option.name);
    return names;
}

std::unique_ptr<Picture> PictureOptions::Make(int narrower) const {
    const auto [width, height] = size.empty() ? std::pair{kUsualWidth - narrower, kUsualHeight} : Sides(size);
    if (!(dpi >= kLowestDpi && dpi <= kHighestDpi))
        throw UserError("--dpi cannot be " + ToText(dpi) + "; accepted: 24 to 960");
    std::error_code error;
    if (!font.empty() && !std::filesystem::is_regular_file(PathOf(font), error))
        throw UserError("--font: there is no file \"" + font + "\"");
    if (!font.empty() && !IsTypeface(font))
        throw UserError("--font: \"" + font + "\" is not a TrueType or OpenType font");
    Corvo::DrawingFont::SetFile(font);
    return std::make_unique<Picture>(width, height, dpi);
}

void PictureOptions::ApplyTo(kivspectrum& analyser) const {
    const auto names = ViewNames();
    std::vector<std::size_t> chosen;
    for (const std::string& name : view) {
        const std::size_t index = FindName(name, names, "view");
        // Some commands are switches: twice would be never.
        if (std::ranges::find(chosen, index) == chosen.end()) chosen.push_back(index);
    }
    for (const std::size_t index : chosen) analyser.popupmenu_process(kView[index].command);
    if (scale.empty()) return;
    const std::vector<std::string> scales{"log", "linear"};
    analyser.popupmenu_process(FindName(scale, scales, "scale") == 0 ? 1286 : 1285);
}

std::unique_ptr<OutputFile> OpenPicture(const std::string& path, const OutputRules& rules) {
    auto output = std::make_unique<OutputFile>(path, rules);
    constexpr std::string_view kEnding = ".png";
    const auto ending = path.size() > kEnding.size() ? path.substr(path.size() - kEnding.size()) : "";
    if (!output->IsStream() && !SameNoCase(ending, kEnding))
        throw UserError(path + ": the ending must be .png, the kind of picture that is written");
    return output;
}

void Write(Picture& picture, OutputFile& output) {
    const auto png = picture.Png();
    output.Bytes().Write(png.data(), png.size());
}

void Save(Picture& picture, OutputFile& output) {
    Write(picture, output);
    output.Commit();
}

}  // namespace dsphost
