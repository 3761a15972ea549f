#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "EffectTable.h"

namespace dsphost {

// One parameter as a person names it.
struct EffectParameter : Corvo::DSP::ParameterDescription {
    int index = 0;  // external: what SetParam takes
};

// A new instance in the state it should start from: its default preset where it has presets.
std::unique_ptr<Effect> MakeEffect(EffectFactory factory);
// A second instance in the same state, to try things on.
std::unique_ptr<Effect> CopyEffect(EffectFactory factory, Effect& effect);
// Sets the state that a chunk holds; messages call it `name`. Throws UserError, with the effect as it was or
// not, when these are not the bytes of such a state or hold values that no parameter can have.
void UseChunk(EffectFactory factory, Effect& effect, const std::vector<std::uint8_t>& chunk,
              const std::string& name);
std::vector<EffectParameter> DescribeParameters(EffectFactory factory);

// The text that `effect` shows once the parameter is set to the normalised value; it stays set.
std::string TextAt(Effect& effect, const EffectParameter& parameter, float normalised);
// The text of the value that it has now.
std::string CurrentText(Effect& effect, const EffectParameter& parameter);

// The parameters that a label names: both sides when it names none, all that bear it when several do.
// Throws UserError with the nearest labels.
std::vector<const EffectParameter*> FindParameters(const std::vector<EffectParameter>& all,
                                                   std::string_view label, const std::string& effectName);

// The normalised value that `text` stands for, in the state that `effect` is in: "n:0.37", a choice of a
// list or switch, or what the effect's own parser understands. Throws UserError that says what would be
// accepted. Numbers beyond the range are limited by the effect; `warning` then says so.
float ParseValue(EffectFactory factory, Effect& effect, const EffectParameter& parameter,
                 std::string_view text, std::string& warning);

}  // namespace dsphost
