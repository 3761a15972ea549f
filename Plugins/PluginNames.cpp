#include <algorithm>

#include "PluginTable.h"

namespace Corvo::Plugins {

const PluginRow* FindPluginRow(std::string_view id) {
    const auto found =
        std::ranges::find_if(PluginRows(), [id](const PluginRow& row) { return row.id == id; });
    return found == PluginRows().end() ? nullptr : &*found;
}

std::string PluginUri(const PluginRow& row, int channels) {
    return std::string("urn:dspdll:") + row.id + (channels == 1 ? "-mono" : "");
}

std::string PluginName(const PluginRow& row, int channels) {
    return std::string(row.name) + (channels == 1 ? " (mono)" : "");
}

std::string ShortNameOf(const std::string& name) {
    constexpr std::size_t kMost = 16;
    if (name.size() <= kMost) return name;
    const std::string side = name.ends_with(" L") || name.ends_with(" R") ? name.substr(name.size() - 2) : "";
    const auto end = name.rfind(' ', kMost - side.size());
    return end == name.npos ? name : name.substr(0, end) + side;
}

std::string SymbolOf(const std::string& name) {
    std::string symbol;
    for (const char c : name) {
        if (c == '#')
            symbol += "_sharp";
        else if (c >= 'A' && c <= 'Z')
            symbol += static_cast<char>(c - 'A' + 'a');
        else
            symbol += (c >= 'a' && c <= 'z') || (c >= '0' && c <= '9') ? c : '_';
    }
    return symbol;
}

}  // namespace Corvo::Plugins
