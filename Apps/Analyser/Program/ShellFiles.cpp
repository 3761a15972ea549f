#include "ShellFiles.h"

#include "Commands.h"

namespace analyser {
namespace {

std::string Roff(std::string_view text) {
    std::string roff = text.starts_with('.') || text.starts_with('\'') ? "\\&" : "";
    for (const char c : text) {
        if (c == '\\' || c == '-') roff += '\\';
        roff += c;
    }
    return roff;
}

std::string Item(std::string_view name, std::string_view type, std::string_view text) {
    const std::string value = type.empty() ? "" : " \\fI" + Roff(type) + "\\fR";
    return ".TP\n\\fB" + Roff(name) + "\\fR" + value + "\n" + Roff(text) + ".\n";
}

std::string Manual(const std::vector<ShellOption>& options) {
    std::string page = ".TH DSPDLL\\-ANALYSER 1 \"\" \"dspdll\\-analyser " DSPANALYSER_VERSION
                       "\" \"User Commands\"\n"
                       ".SH NAME\ndspdll\\-analyser \\- shows spectrum, sonogram and note of what is heard\n"
                       ".SH SYNOPSIS\n.B dspdll\\-analyser\n[\\fIOPTION\\fR]... [\\fIFILE\\fR]\n"
                       ".SH DESCRIPTION\nListens to a sound input, or plays an audio file, and shows its "
                       "spectrum, its course as a sonogram, and the note that sounds. A file can also be "
                       "dropped on the window.\n.SH OPTIONS\n";
    for (const auto& option : options) page += Item(option.name, option.type, option.help);
    page += ".SH KEYS\nEvery entry of the menu is two keys away, which it shows.\n";
    for (const CommandRow& row : Commands()) page += Item(row.shortcut, "", row.text);
    return page +
           ".SH FILES\n.TP\n.I ~/.config/dspdll/analyser.conf\nWhat was chosen, or below "
           "\\fB$XDG_CONFIG_HOME\\fR.\n"
           ".SH EXAMPLES\n.nf\ndspdll\\-analyser \\-\\-input \"Monitor of Built\\-in Audio\"\n"
           "dspdll\\-analyser \\-\\-no\\-audio song.flac\n.fi\n";
}

std::string Bash(const std::vector<ShellOption>& options) {
    std::string names;
    for (const auto& option : options)
        if (option.name.starts_with('-')) names += (names.empty() ? "" : " ") + option.name;
    return "# Completion of dspdll-analyser in bash, made from its table of options.\n"
           "_dspdll_analyser() {\n"
           "    local word=${COMP_WORDS[COMP_CWORD]}\n"
           "    COMPREPLY=()\n"
           "    if [[ $word == -* ]]; then mapfile -t COMPREPLY < <(compgen -W \"" +
           names +
           "\" -- \"$word\"); fi\n"
           "}\n"
           "complete -o default -F _dspdll_analyser dspdll-analyser\n";
}

}  // namespace

std::string WriteFor(std::string_view reader, const std::vector<ShellOption>& options) {
    return reader == "man" ? Manual(options) : reader == "bash" ? Bash(options) : "";
}

}  // namespace analyser
