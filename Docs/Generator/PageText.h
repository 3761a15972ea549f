#pragma once

#include <functional>
#include <initializer_list>
#include <string>
#include <string_view>
#include <vector>

namespace docs {

// The parts of a text, without the blanks around them; parts with nothing else are left out.
std::vector<std::string> Split(std::string_view text, std::string_view separator);
// "name: rest" as both; without a colon all is name.
std::pair<std::string, std::string> NameAndRest(std::string_view line);

// What a person wrote about an effect: Markdown whose sections ("## Heading") stand in a fixed order.
// Throws std::runtime_error, naming the file, when it cannot be read or a section is missing or unknown.
std::vector<std::string> ReadSections(const std::string& path, const std::vector<std::string>& headings);

// Replaces each block in a fence of the given kind ("```kind") by what `draw` makes of its lines.
std::string ReplaceFences(std::string_view markdown, std::string_view kind,
                          const std::function<std::string(std::string_view)>& draw);

// A row of a table.
std::string Cells(std::initializer_list<std::string> cells);
// The row of a table's headings, and the line below it.
std::string Headings(std::initializer_list<std::string> cells);

// What a reader asks first.
struct Facts {
    std::string latency, automation, sidechain, cost;
};
std::string FactsTable(const Facts& facts);
// The last section of a page, of what a person wrote for it.
std::string TryIt(const std::string& written);

}  // namespace docs
