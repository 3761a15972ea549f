#include "RoomsDiagram.h"

#include <algorithm>
#include <fstream>
#include <stdexcept>
#include <vector>

#include "PageText.h"
#include "Svg.h"

namespace docs {
namespace {

struct Room {
    std::string name;
    std::vector<std::string> uses;  // as the table says
    std::string headers;            // instead, for what stands outside of the library
};

// What stands in backquotes.
std::vector<std::string> Names(const std::string& cell) {
    std::vector<std::string> names;
    for (std::size_t at = cell.find('`'); at != std::string::npos; at = cell.find('`', at)) {
        const auto end = cell.find('`', at + 1);
        names.push_back(cell.substr(at + 1, end - at - 1));
        at = end + 1;
    }
    return names;
}

std::string WithoutSource(const std::string& name) {
    return name.starts_with("Src/") ? name.substr(4) : name;
}

std::vector<Room> ReadRooms(const std::string& path) {
    std::ifstream readme(path);
    std::vector<Room> rooms;
    bool inTable = false;
    for (std::string line; std::getline(readme, line);) {
        if (line.starts_with("| Room |")) inTable = true;
        if (!line.starts_with("|")) inTable = false;
        const auto cells = Split(line, "|");
        if (!inTable || cells.size() != 3 || Names(cells[0]).empty()) continue;
        const bool isOutside = cells[2].starts_with("public headers");
        rooms.push_back({WithoutSource(Names(cells[0])[0]), Names(cells[2]), isOutside ? cells[2] : ""});
    }
    if (rooms.empty()) throw std::runtime_error(path + " has no table of rooms");
    return rooms;
}

}  // namespace

// A row for each room; a column for each that is used. A dot stands where a row's room may include a
// column's.
std::string DrawRooms(const std::string& readmePath) {
    constexpr double kRow = 24, kColumn = 24, kLeft = 190, kTop = 8;
    const auto rooms = ReadRooms(readmePath);
    const auto row = [](std::size_t i) { return kTop + kRow * (static_cast<double>(i) + 0.5); };
    const auto column = [](std::size_t i) { return kLeft + kColumn * (static_cast<double>(i) + 0.5); };
    const double right = column(rooms.size());
    Svg svg;
    for (std::size_t i = 0; i < rooms.size(); ++i) {
        svg.Text(kLeft - 8, row(i) + 4, rooms[i].name, "end", "tick");
        if (!rooms[i].headers.empty()) {
            svg.Text(column(0), row(i) + 4, rooms[i].headers, "start", "tick");
            continue;
        }
        svg.Text(column(i), row(i) + 5, "■");
        if (i > 0) svg.Line(column(0), row(i), column(i) - 6, row(i), "grid");
        for (const auto& use : rooms[i].uses) {
            const auto used = std::ranges::find(rooms, use, &Room::name);
            if (used == rooms.end()) throw std::runtime_error("the table has no room " + use);
            const auto j = static_cast<std::size_t>(used - rooms.begin());
            svg.Line(column(j), row(i), column(j), row(j) + 8, "arrow");
            svg.Text(column(j), row(i) + 4, "●");
        }
    }
    return svg.Figure(right, row(rooms.size()), "rooms",
                      "Rooms and what each may include, as in the table of the README");
}

}  // namespace docs
