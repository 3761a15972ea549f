#pragma once

#include <filesystem>
#include <optional>
#include <string>

namespace analyser {

// Where this user's programs keep what is chosen, and where pictures are kept; the current folder where there
// is no such place.
std::filesystem::path SettingsFolder();
std::filesystem::path PictureFolder();

// "analyser-20260131-235959", with a number behind it where a file of that name and one of the endings is
// there.
std::string FreshName(const std::filesystem::path& folder);

// Writes the file whole or not at all: beside its place first. False when that failed.
bool WriteWhole(const std::filesystem::path& path, const std::string& bytes);
// Nothing when it cannot be read.
std::optional<std::string> ReadWhole(const std::filesystem::path& path);

}  // namespace analyser
