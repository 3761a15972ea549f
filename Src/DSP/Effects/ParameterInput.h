#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "DSP/Effects/Framework/CorvoEffectBase.h"
#include "Platform/Export.h"

// What a person reads and writes about parameters: their names, and values as text. User-interface thread;
// texts are UTF-8, and letters may be of either case. Values are tried on a copy of the effect, which takes
// up to a few milliseconds.
namespace Corvo::DSP {

// The external parameters that `name` means: the one with that label, else all with that name, which are both
// sides of a pair. Empty when there is none.
DSP_API std::vector<int> FindParameters(CorvoEffectBase& effect, std::string_view name);

// What a text means.
struct ParameterInput {
    float normalised;  // 0..1
    bool limited;      // the number was beyond the range
};

// The value that `text` means for an external parameter that the effect has: a choice of a list or switch, or
// a number as the effect's own parser takes it, with or without its unit; beyond the range it is limited.
// Throws std::invalid_argument, with a sentence that says what would be accepted, for anything else.
DSP_API ParameterInput ReadParameter(CorvoEffectBase& effect, int index, std::string_view text);
// The text that an effect of this library shows when the parameter has a value, whatever it has now. Asks
// another instance with the same settings: not for drawing.
DSP_API std::string TextAt(CorvoEffectBase& effect, int index, float normalised);
// What would be accepted: "On, Off" or "-60.0 dB to 12.0 dB".
DSP_API std::string AcceptedTexts(CorvoEffectBase& effect, int index);

}  // namespace Corvo::DSP
