#pragma once

#include <string>

namespace docs {

// The equaliser's page in Markdown: what a person wrote about it in `textPath`, its types, and curves that it
// makes. Throws for a text that does not fit.
std::string EqualiserPage(const std::string& textPath);

}  // namespace docs
