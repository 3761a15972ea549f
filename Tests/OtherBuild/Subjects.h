#pragma once

#include <vector>

#include "OtherBuild/Recording.h"
#include "Support/EffectCases.h"

namespace OtherBuild {

using Rule = TestSupport::OtherBuild;

// 4500 roundings of a double: what sines, powers and logarithms that differ in their last bit grow into on
// the way through an effect.
constexpr double kDoubleLimit = 1e-12;

// What is recorded and compared, and how far the builds may be apart.
struct Subject {
    const char* name;
    Rule rule;
    const char* reason;
    double doubleLimit = kDoubleLimit;
};

// A band's gain far below the rate is what is left of coefficients near 1 and 2 when they cancel: at
// kLowestHz a last bit counts (rate / (2 pi Hz))^2 = 23000 times, 2.6e-12.
constexpr int kLowestHz = 50;
constexpr Subject kEqualizer{"Equalizer", Rule::Relative, "tangents and powers, the bands' cancellation",
                             1e-11};

// Every effect, and the parametric equaliser, which is none.
inline std::vector<Subject> AllSubjects() {
    std::vector<Subject> subjects;
    for (const auto& which : TestSupport::AllEffects())
        subjects.push_back({which.name, which.otherBuild, which.otherBuildReason});
    subjects.push_back(kEqualizer);
    return subjects;
}

void RecordEqualizer(std::vector<Take>& takes);

}  // namespace OtherBuild
