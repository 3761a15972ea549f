#pragma once

#include <string>

#include "EffectTable.h"

namespace dsphost {

// In the words of the pitch correction's parameters.
struct Scale {
    std::string root = "C", mode = "Chromatic";
};

// "A minor", "Am", "Bb dorian", "A" (major), "chromatic" or nothing, which is that; `effect` is the pitch
// correction. Throws UserError that says what is accepted.
Scale ParseScale(std::string_view text, Effect& effect);

}  // namespace dsphost
