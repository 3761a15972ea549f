#include "PageText.h"

#include <fstream>
#include <sstream>
#include <stdexcept>

namespace docs {

std::vector<std::string> Split(std::string_view text, std::string_view separator) {
    std::vector<std::string> parts;
    for (bool more = true; more;) {
        const auto end = text.find(separator);
        more = end != std::string_view::npos;
        std::string_view part = text.substr(0, end);
        if (more) text.remove_prefix(end + separator.size());
        const auto first = part.find_first_not_of(" \t\n");
        if (first == std::string_view::npos) continue;
        part = part.substr(first, part.find_last_not_of(" \t\n") + 1 - first);
        parts.emplace_back(part);
    }
    return parts;
}

std::pair<std::string, std::string> NameAndRest(std::string_view line) {
    const auto colon = line.find(':');
    if (colon == std::string_view::npos) return {std::string(line), ""};
    return {std::string(line.substr(0, colon)), std::string(line.substr(colon + 1))};
}

std::vector<std::string> ReadSections(const std::string& path, const std::vector<std::string>& headings) {
    std::ifstream file(path);
    if (!file) throw std::runtime_error(path + " cannot be read");
    std::vector<std::string> sections;
    for (std::string line; std::getline(file, line);) {
        if (line.starts_with("## ")) {
            if (sections.size() == headings.size() || line.substr(3) != headings[sections.size()])
                throw std::runtime_error(path + ": \"" + line + "\" is not the section that comes here");
            sections.emplace_back();
        } else if (!sections.empty()) {
            sections.back() += line + '\n';
        } else if (!line.empty()) {
            throw std::runtime_error(path + ": text in front of the first section");
        }
    }
    if (sections.size() < headings.size())
        throw std::runtime_error(path + ": the section \"" + headings[sections.size()] + "\" is missing");
    return sections;
}

std::string ReplaceFences(std::string_view markdown, std::string_view kind,
                          const std::function<std::string(std::string_view)>& draw) {
    const std::string begin = "```" + std::string(kind) + '\n', end = "```\n";
    std::string replaced;
    for (;;) {
        const auto from = markdown.find(begin);
        replaced += markdown.substr(0, from);
        if (from == std::string_view::npos) return replaced;
        markdown.remove_prefix(from + begin.size());
        const auto to = markdown.find(end);
        if (to == std::string_view::npos)
            throw std::runtime_error("a block \"" + std::string(kind) + "\" without an end");
        replaced += draw(markdown.substr(0, to));
        markdown.remove_prefix(to + end.size());
    }
}

std::string Cells(std::initializer_list<std::string> cells) {
    std::string row = "|";
    for (std::string cell : cells) {
        for (std::size_t at = 0; (at = cell.find('|', at)) != std::string::npos; at += 2)
            cell.insert(at, "\\");
        row.append(" ").append(cell).append(" |");
    }
    return row + '\n';
}

std::string Headings(std::initializer_list<std::string> cells) {
    std::string line = "|";
    for (std::size_t i = 0; i < cells.size(); ++i) line += " --- |";
    return Cells(cells) + line + '\n';
}

std::string FactsTable(const Facts& facts) {
    return Headings({"", ""}) + Cells({"Latency", facts.latency}) + Cells({"Automation", facts.automation}) +
           Cells({"Side-chain", facts.sidechain}) +
           Cells({"Cost", facts.cost + ", on the machine that made this page"});
}

std::string TryIt(const std::string& written) {
    return "\n## Try it\n\nThe recordings are those of Debian's `sonic-pi-samples`.\n" + written;
}

}  // namespace docs
