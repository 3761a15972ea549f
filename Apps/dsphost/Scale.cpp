#include "Scale.h"

#include <algorithm>
#include <array>
#include <utility>
#include <vector>

#include "Errors.h"
#include "Text.h"

namespace dsphost {
namespace {

std::vector<std::string> ChoicesOf(Effect& effect, int parameter) {
    std::vector<std::string> names;
    for (const auto& choice : effect.Describe(parameter).choices) names.push_back(choice.text);
    return names;
}

}  // namespace

Scale ParseScale(std::string_view given, Effect& effect) {
    static constexpr std::array<std::pair<const char*, const char*>, 5> kFlats{
        {{"Db", "C#"}, {"Eb", "D#"}, {"Gb", "F#"}, {"Ab", "G#"}, {"Bb", "A#"}}};
    const auto roots = ChoicesOf(effect, 0), modes = ChoicesOf(effect, 1);
    const std::string text(Trimmed(given));
    Scale scale;
    if (text.empty() || SameNoCase(text, scale.mode)) return scale;
    const auto blank = std::min(text.find(' '), text.size());
    scale.root = text.substr(0, blank);
    scale.mode = Trimmed(text.substr(blank));
    if (scale.mode.empty()) {
        const bool minor = scale.root.size() > 1 && scale.root.back() == 'm';
        if (minor) scale.root.pop_back();
        scale.mode = minor ? "minor" : "major";
    }
    for (const auto& [flat, sharp] : kFlats)
        if (SameNoCase(scale.root, flat)) scale.root = sharp;
    const auto same = [&](const std::string& root) { return SameNoCase(root, scale.root); };
    if (std::ranges::none_of(roots, same))
        throw UserError(
            "--scale cannot be \"" + Shortened(text, kLongestQuote) +
            "\"; accepted: a root and a mode, such as \"A minor\", or short, \"Am\" or \"A\"; modes: " +
            Joined(modes, ", "));
    if (SameNoCase(scale.mode, "minor")) scale.mode = "Natural minor";
    scale.mode = modes[FindName(scale.mode, modes, "scale mode")];
    return scale;
}

}  // namespace dsphost
