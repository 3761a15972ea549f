#pragma once

#include <string>
#include <string_view>

#include "Chain.h"

namespace dsphost {

// Puts the lanes of a JSON file, or of its text, onto the chain:
//
//   [{"effect": "Tremolo", "parameter": "Depth", "points": [[0.0, 0.2], [1.5, 0.9]]}, ...]
//
// A point is a time in seconds and a normalised value, as a pair or as {"time": 0.0, "value": 0.2}; from that
// time on the parameter has that value, and before the first point it has the first point's. "effect" may be
// left out in a chain of one; where an effect stands in the chain more than once, its place (from 1) says
// which. A label without its side moves both sides. Throws UserError naming the file and the lane.
void LoadAutomation(const std::string& path, int rate, Chain& chain);
void ReadAutomation(std::string_view text, const std::string& name, int rate, Chain& chain);

}  // namespace dsphost
