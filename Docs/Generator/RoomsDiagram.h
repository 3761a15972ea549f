#pragma once

#include <string>

namespace docs {

// Draws the rooms of the README's table and the arrows that it allows, as a figure for a page. Throws
// std::runtime_error where the README has no such table.
std::string DrawRooms(const std::string& readmePath);

}  // namespace docs
