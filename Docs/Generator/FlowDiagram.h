#pragma once

#include <string>
#include <string_view>

namespace docs {

// Draws a signal flow from a few lines of text, as a figure for a page:
//   in -> tone filter -> boost -> shape -> out      the main way, from left to right
//   in -> level meter -> boost                      a way beside it, between two places of the main one
//   shape -> feedback -> boost                      the same, backwards
// "|" breaks a line within a box; `in` and `out` have none. Places on the main way have different names.
// Throws std::invalid_argument for a way that begins or ends elsewhere.
std::string DrawFlow(std::string_view text);

}  // namespace docs
