// Holds the recordings of two builds against each other, effect by effect, by the rule in the table of
// effects; prints the table and fails on a miss.

#include <cstdio>
#include <iostream>

#include "OtherBuild/Comparison.h"
#include "OtherBuild/Subjects.h"

namespace {

using namespace OtherBuild;

struct Verdict {
    double worst[2] = {0.0, 0.0};  // float, double; for Character: level in dB, pitch as a ratio
    std::size_t samples = 0;
    std::vector<std::string> misses;
};

void CompareBits(const Take& reference, const Take& other, const std::string& what, Verdict& verdict) {
    if (reference.bytes == other.bytes) return;
    const auto differ = std::ranges::mismatch(reference.bytes, other.bytes).in1 - reference.bytes.begin();
    verdict.misses.push_back(what + " differs from byte " + std::to_string(differ));
}

// A text that is one unit of its last place off counts as a miss: both builds show the same project.
void CompareTexts(const Take& reference, const Take& other, Verdict& verdict) {
    const auto a = Values<char32_t>(reference), b = Values<char32_t>(other);
    if (a == b) return;
    const auto place = std::ranges::mismatch(a, b).in1 - a.begin();
    const auto line = [&](const std::vector<char32_t>& letters) {
        std::string text;
        const auto begin = std::find(letters.rend() - std::min<std::ptrdiff_t>(place, std::ssize(letters)),
                                     letters.rend(), U'\n')
                               .base();
        for (auto letter = begin; letter != letters.end() && *letter != U'\n'; ++letter)
            text += *letter < 128 ? static_cast<char>(*letter) : '?';
        return text;
    };
    verdict.misses.push_back("texts: \"" + line(a) + "\" here, \"" + line(b) + "\" there");
}

template <typename Sample>
void CompareSamples(const Take& reference, const Take& other, const Subject& which, Verdict& verdict) {
    const auto a = Values<Sample>(reference), b = Values<Sample>(other);
    const std::string what = reference.scene + (sizeof(Sample) == 4 ? " in float" : " in double");
    if (a.size() != b.size() || a.empty()) {
        verdict.misses.push_back(what + ": " + std::to_string(a.size()) + " samples here, " +
                                 std::to_string(b.size()) + " there");
        return;
    }
    verdict.samples += a.size();
    if (which.rule == Rule::Character) {
        const auto here = SettledTone(a), there = SettledTone(b);
        const double level = std::abs(LevelDb(here) - LevelDb(there));
        const double pitch = Pitch(here) > 0.0 ? std::abs(Pitch(there) / Pitch(here) - 1.0) : Pitch(there);
        verdict.worst[0] = std::max(verdict.worst[0], level);
        verdict.worst[1] = std::max(verdict.worst[1], pitch);
        if (!(level <= kLevelLimitDb)) verdict.misses.push_back(what + ": level");
        if (!(pitch <= kPitchLimit)) verdict.misses.push_back(what + ": pitch");
        return;
    }
    const double deviation = Deviation(a, b);
    double& worst = verdict.worst[sizeof(Sample) == 8];
    worst = std::max(worst, deviation);
    if (which.rule == Rule::SameBits) CompareBits(reference, other, what, verdict);
    if (which.rule == Rule::Relative &&
        !(deviation <= (sizeof(Sample) == 8 ? which.doubleLimit : kFloatLimit))) {
        char text[32];
        std::snprintf(text, sizeof text, ": off by %.1e", deviation);
        verdict.misses.push_back(what + text);
    }
}

Verdict Compare(const Subject& which, const std::vector<Take>& here, const std::vector<Take>& there) {
    Verdict verdict;
    const auto ofEffect = [&](const Take& take) { return take.effect == which.name; };
    if (std::ranges::count_if(here, ofEffect) != std::ranges::count_if(there, ofEffect))
        verdict.misses.push_back("the builds recorded different scenes");
    for (const Take& take : here) {
        if (!ofEffect(take)) continue;
        const auto other = std::ranges::find_if(there, [&](const Take& t) {
            return ofEffect(t) && t.scene == take.scene && t.kind == take.kind;
        });
        if (other == there.end()) {
            verdict.misses.push_back(take.scene + " is missing there");
            continue;
        }
        switch (take.kind) {
            case Kind::Float:
                CompareSamples<float>(take, *other, which, verdict);
                break;
            case Kind::Double:
                CompareSamples<double>(take, *other, which, verdict);
                break;
            case Kind::Chunk:
                CompareBits(take, *other, "settings chunk, " + take.scene, verdict);
                break;
            case Kind::Texts:
                CompareTexts(take, *other, verdict);
                break;
        }
    }
    if (verdict.samples == 0) verdict.misses.push_back("nothing to compare");
    return verdict;
}

std::string Worst(Rule rule, const Verdict& verdict) {
    char text[64];
    std::snprintf(text, sizeof text,
                  rule == Rule::Character ? "%.2f dB, pitch %.1e" : "%.1e float, %.1e double",
                  verdict.worst[0], verdict.worst[1]);
    return text;
}

}  // namespace

int main(int count, char** arguments) try {
    if (count != 3) throw std::runtime_error("usage: compare_builds HERE THERE");
    const auto here = Load(arguments[1]), there = Load(arguments[2]);
    const char* const rules[] = {"same bits", "relative", "character"};
    std::printf(
        "relative: %.0e of the largest sample in double (%s: %.0e), %.1e in float; character: %.1f dB, pitch "
        "%.1f %%\n\n",
        kDoubleLimit, kEqualizer.name, kEqualizer.doubleLimit, kFloatLimit, kLevelLimitDb,
        100.0 * kPitchLimit);
    std::printf("%-18s %-10s %-30s %-8s %s\n", "effect", "rule", "worst deviation", "verdict",
                "reason for the rule");
    bool missed = false;
    for (const auto& which : AllSubjects()) {
        const Verdict verdict = Compare(which, here, there);
        std::printf("%-18s %-10s %-30s %-8s %s\n", which.name, rules[static_cast<int>(which.rule)],
                    Worst(which.rule, verdict).c_str(), verdict.misses.empty() ? "ok" : "MISS", which.reason);
        for (const auto& miss : verdict.misses) std::printf("    %s\n", miss.c_str());
        missed = missed || !verdict.misses.empty();
    }
    return missed ? 1 : 0;
} catch (const std::exception& exception) {
    std::cerr << "compare_builds: " << exception.what() << "\n";
    return 1;
}
