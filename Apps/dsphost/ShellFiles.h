#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace dsphost {

// The command line as its manual and the shells' completion need it.
struct ShellOption {
    std::string name;  // of a place
    std::string help;
    std::string type;                // empty: takes no value; "FILE", "EFFECT", "a|b|c" or anything else
    std::vector<std::string> names;  // with their dashes
    bool isPlace;                    // an argument without a dash
    bool isRequired, isRepeated;
};
struct ShellCommand {
    std::string name, help;
    std::vector<ShellOption> options;
};

// The manual page ("man") or the completion for "bash" or "zsh". Throws UserError for anything else.
std::string WriteFor(std::string_view reader, const std::vector<ShellCommand>& commands);

}  // namespace dsphost
