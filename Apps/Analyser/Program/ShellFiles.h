#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace analyser {

// The command line as its manual and the shell's completion need it.
struct ShellOption {
    std::string name;  // with its dashes; of a file's place without
    std::string type;  // empty: takes no value
    std::string help;
};

// The manual page ("man") or the completion for "bash"; empty for anything else.
std::string WriteFor(std::string_view reader, const std::vector<ShellOption>& options);

}  // namespace analyser
