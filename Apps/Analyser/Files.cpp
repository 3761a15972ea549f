#include "Files.h"

#include <cstdlib>
#include <ctime>
#include <fstream>
#include <system_error>

namespace analyser {
namespace {

namespace fs = std::filesystem;

fs::path FromEnvironment(const char* name) {
    const char* const value = std::getenv(name);
    return value ? fs::path(value) : fs::path();
}

}  // namespace

fs::path SettingsFolder() {
    fs::path base = FromEnvironment("XDG_CONFIG_HOME");
    if (base.empty() && !FromEnvironment("HOME").empty()) base = FromEnvironment("HOME") / ".config";
    return base / "dspdll";
}

fs::path PictureFolder() {
    const fs::path home = FromEnvironment("HOME");
    std::error_code none;
    if (fs::is_directory(home / "Pictures", none)) return home / "Pictures";
    return home.empty() ? fs::path(".") : home;
}

std::string FreshName(const fs::path& folder) {
    const std::time_t now = std::time(nullptr);
    char stamp[64];
    std::strftime(stamp, sizeof stamp, "analyser-%Y%m%d-%H%M%S", std::localtime(&now));
    std::error_code none;
    const auto taken = [&](const std::string& name) {
        for (const char* ending : {".png", ".svg", ".pdf", ".csv"})
            if (fs::exists(folder / (name + ending), none)) return true;
        return false;
    };
    std::string name = stamp;
    for (int number = 2; taken(name); ++number) name = std::string(stamp) + "-" + std::to_string(number);
    return name;
}

bool WriteWhole(const fs::path& path, const std::string& bytes) {
    std::error_code error;
    if (path.has_parent_path()) fs::create_directories(path.parent_path(), error);
    fs::path partial = path;
    partial += ".part";
    {
        std::ofstream file(partial, std::ios::binary | std::ios::trunc);
        file.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
        file.close();
        if (!file) {
            fs::remove(partial, error);
            return false;
        }
    }
    fs::rename(partial, path, error);
    if (!error) return true;
    fs::remove(partial, error);
    return false;
}

std::optional<std::string> ReadWhole(const fs::path& path) {
    std::ifstream file(path, std::ios::binary);
    std::string bytes;
    for (char buffer[4096]; file.read(buffer, sizeof buffer) || file.gcount() > 0;)
        bytes.append(buffer, static_cast<std::size_t>(file.gcount()));
    if (!file.eof()) return std::nullopt;
    return bytes;
}

}  // namespace analyser
