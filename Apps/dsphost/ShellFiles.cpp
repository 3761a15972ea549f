#include "ShellFiles.h"

#include <span>

#include "EffectTable.h"
#include "Errors.h"
#include "Text.h"

namespace dsphost {
namespace {

using Commands = std::vector<ShellCommand>;

// `text` with `before` in front of each of `marked`.
std::string Marked(std::string_view text, std::string_view marked, std::string_view before) {
    std::string result;
    for (const char c : text) {
        if (marked.find(c) != marked.npos) result += before;
        result += c;
    }
    return result;
}

std::string Replaced(std::string text, std::string_view what, std::string_view by) {
    for (std::size_t at = 0; (at = text.find(what, at)) != text.npos; at += by.size())
        text.replace(at, what.size(), by);
    return text;
}

// Within single quotes, for a shell.
std::string Quoted(std::string_view text) { return "'" + Replaced(std::string(text), "'", "'\\''") + "'"; }

// What --fx may begin with: names, and names with a preset.
std::vector<std::string> EffectStarts() {
    std::vector<std::string> starts;
    for (const auto& kind : ElementKinds()) starts.push_back(kind.name);
    for (const auto& kind : EffectKinds()) {
        const auto effect = kind.make();
        for (int i = 0; i < effect->NumPresets(); ++i)
            starts.push_back(std::string(kind.name) + ": preset=" + effect->GetPresetName(i));
    }
    return starts;
}

std::vector<std::string> Values(const ShellOption& option) {
    if (option.type == "EFFECT")
        return option.isPlace ? std::vector(EffectNames().begin(), EffectNames().end()) : EffectStarts();
    if (option.type.find('|') == option.type.npos) return {};
    std::vector<std::string> values{""};
    for (const char c : option.type)
        if (c == '|')
            values.emplace_back();
        else
            values.back() += c;
    return values;
}

std::string QuotedAll(std::span<const std::string> words) {
    std::string all;
    for (const auto& word : words) all.append(all.empty() ? "" : " ").append(Quoted(word));
    return all;
}

// ---- The manual

std::string Roff(std::string_view text) {
    std::string roff = Replaced(Marked(text, "\\", "\\"), "-", "\\-");
    if (roff.starts_with('.') || roff.starts_with('\'')) roff.insert(0, "\\&");
    return roff;
}

std::string Manual(const Commands& commands) {
    std::string page = ".TH DSPHOST 1 \"\" \"dsphost " DSPHOST_VERSION
                       "\" \"User Commands\"\n"
                       ".SH NAME\ndsphost \\- renders and examines audio files\n.SH SYNOPSIS\n";
    for (const auto& command : commands) {
        page += ".B dsphost " + Roff(command.name) + "\n[\\fIOPTION\\fR]...";
        for (const auto& option : command.options)
            if (option.isPlace)
                page += (option.isRequired ? " \\fI" : " [\\fI") + Roff(option.name) +
                        (option.isRequired ? "\\fR" : "\\fR]");
        page += "\n.br\n";
    }
    page +=
        ".SH DESCRIPTION\nHosts the effects, the equaliser, the converter and the analyser of DSPDll. "
        "Outputs "
        "appear whole or not at all, and replace an existing file only with\n.BR \\-y .\n.SH COMMANDS\n";
    for (const auto& command : commands) {
        page += ".SS " + Roff(command.name) + "\n" + Roff(command.help) + ".\n";
        for (const auto& option : command.options) {
            page += ".TP\n\\fB" + Roff(option.isPlace ? option.name : Joined(option.names, ", ")) + "\\fR";
            if (!option.type.empty() && !option.isPlace)
                page += " \\fI" + Roff(Replaced(option.type, "|", " | ")) + "\\fR";
            page += "\n" + Roff(option.help) + ".\n";
        }
    }
    page += ".SH EFFECTS\n";
    for (const auto& kind : ElementKinds()) page += ".B " + Roff(kind.name) + "\n.br\n";
    return page +
           ".PP\n.B dsphost effects\n.I NAME\ntells the parameters, their ranges and the presets of one.\n"
           ".SH EXIT STATUS\n.TP\n0\nSuccess.\n.TP\n1\nThe system failed: a full disk, a closed pipe.\n"
           ".TP\n2\nSomething was asked for that cannot be done.\n.TP\n130\nInterrupted.\n"
           ".SH EXAMPLES\n.nf\n"
           "dsphost render in.flac out.wav \\-\\-fx \"Echo: preset=Long Echo\" \\-\\-tail auto\n"
           "dsphost convert in.wav out.wav \\-\\-rate 96000 \\-\\-exact \\-\\-format s24\n.fi\n"
           ".SH SEE ALSO\n.BR sox (1),\n.BR parallel (1)\n";
}

// ---- bash

std::string Bash(const Commands& commands) {
    std::vector<std::string> names{"--help", "--version"};
    std::string options, values;
    for (const auto& command : commands) {
        names.push_back(command.name);
        std::vector<std::string> own;
        for (const auto& option : command.options) {
            own.insert(own.end(), option.names.begin(), option.names.end());
            const auto accepted = Values(option);
            if (accepted.empty()) continue;
            values += "        " +
                      (option.isPlace ? Quoted(command.name + " " + command.name)
                                      : Quoted(command.name + " " + option.names.front())) +
                      ") candidates=(" + QuotedAll(accepted) + ") ;;\n";
        }
        options += "            " + command.name + ") candidates=(" + QuotedAll(own) + ") ;;\n";
    }
    return "# Completion of dsphost in bash, made from its tables of options.\n"
           "_dsphost() {\n"
           "    local word=${COMP_WORDS[COMP_CWORD]} candidates=() candidate\n"
           "    COMPREPLY=()\n"
           "    word=${word#[\\\"\\']}\n"
           "    if ((COMP_CWORD == 1)); then\n"
           "        candidates=(" +
           QuotedAll(names) +
           ")\n"
           "    elif [[ $word == -* ]]; then\n"
           "        case ${COMP_WORDS[1]} in\n" +
           options +
           "        esac\n"
           "    else\n"
           "        case \"${COMP_WORDS[1]} ${COMP_WORDS[COMP_CWORD - 1]}\" in\n" +
           values +
           "        esac\n"
           "        # Puts names with blanks in quotes.\n"
           "        compopt -o filenames 2>/dev/null || true\n"
           "    fi\n"
           "    for candidate in \"${candidates[@]}\"; do\n"
           "        if [[ $candidate == \"$word\"* ]]; then COMPREPLY+=(\"$candidate\"); fi\n"
           "    done\n"
           "}\n"
           "complete -o default -F _dsphost dsphost\n";
}

// ---- zsh

std::string ZshValue(const ShellOption& option) {
    if (option.type == "FILE") return "_files";
    if (option.type == "EFFECT") return option.isPlace ? "_dsphost_effects" : "_dsphost_chain";
    const auto accepted = Values(option);
    return accepted.empty() ? " " : "(" + Joined(accepted, " ") + ")";
}

// A function that offers words, whatever they hold.
std::string ZshOffer(const std::string& name, std::span<const std::string> words) {
    return name + "() {\n    local -a words_offered=(" + QuotedAll(words) +
           ")\n    compadd -a words_offered\n}\n";
}

std::string Zsh(const Commands& commands) {
    std::string names, cases;
    for (const auto& command : commands) {
        names += "        " + Quoted(command.name + ":" + command.help) + "\n";
        cases += "        " + command.name + ")\n            _arguments -S";
        int place = 0;
        for (const auto& option : command.options) {
            const std::string help = Marked(option.help, "[]:\\", "\\");
            if (option.isPlace) {
                cases += " \\\n                " +
                         Quoted(std::to_string(++place) + ":" + help + ":" + ZshValue(option));
                continue;
            }
            for (const auto& name : option.names)
                cases += " \\\n                " +
                         Quoted((option.isRepeated ? "*" : "") + name + "[" + help + "]" +
                                (option.type.empty() ? "" : ":value:" + ZshValue(option)));
        }
        cases += "\n            ;;\n";
    }
    return "#compdef dsphost\n"
           "# Completion of dsphost in zsh, made from its tables of options.\n" +
           ZshOffer("_dsphost_effects", EffectNames()) + ZshOffer("_dsphost_chain", EffectStarts()) +
           "_dsphost() {\n"
           "    local -a commands=(\n" +
           names +
           "    )\n"
           "    if ((CURRENT == 2)); then\n"
           "        _describe command commands\n"
           "        return\n"
           "    fi\n"
           "    shift words\n"
           "    ((CURRENT--))\n"
           "    case $words[1] in\n" +
           cases +
           "    esac\n"
           "}\n"
           "_dsphost \"$@\"\n";
}

}  // namespace

std::string WriteFor(std::string_view reader, const Commands& commands) {
    if (reader == "man") return Manual(commands);
    if (reader == "bash") return Bash(commands);
    if (reader == "zsh") return Zsh(commands);
    throw UserError("--write-for cannot be \"" + std::string(reader) + "\"; accepted: man, bash, zsh");
}

}  // namespace dsphost
