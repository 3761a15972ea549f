// plugin_host [--windows | --presets] FILE...
// Does to LV2, CLAP and VST3 plug-ins what a strict host may do, or on a display to their windows, and prints
// what it finds; or prints the states of their presets. Exits 0 when it found nothing, 1 otherwise.
#include <cctype>
#include <cstdio>
#include <ctime>
#include <exception>
#include <map>
#include <mutex>
#include <set>

#include "Checks.h"

namespace PluginHost {
namespace {

std::mutex g_mutex;
std::set<std::string> g_findings;
std::string g_subject;

using Check = void (*)(PluginFile&, std::size_t);
// By the option that asks for them.
const std::map<std::string, std::vector<Check>> kChecks{
    {"", {CheckLife, CheckParameters, CheckState, CheckSound, CheckTiming}},
#ifndef _WIN32
    {"--windows", {CheckWindow}},
#endif
    {"--presets", {PrintPresets}}};

struct Format {
    const char* name;
    std::unique_ptr<PluginFile> (*open)(const std::filesystem::path&);
};
// By the ending.
const std::map<std::string, Format> kFormats{
#ifndef _WIN32
    {".lv2", {"LV2", OpenLv2}},
#endif
    {".clap", {"CLAP", OpenClap}},
    {".vst3", {"VST3", OpenVst3}}};

void CheckFile(const std::filesystem::path& path, const std::vector<Check>& checks) {
    g_subject = path.filename().string();
    const auto begin = std::clock();
    const auto seconds = [&] { return static_cast<double>(std::clock() - begin) / CLOCKS_PER_SEC; };
    const auto [format, open] = kFormats.at(path.extension().string());
    const auto file = open(path);
    Expect(file->Count() > 0, "has no plug-in");
    Expect(seconds() < 1, "takes more than a second to scan");
    for (std::size_t i = 0; i < file->Count(); ++i) {
        g_subject = path.filename().string() + ", " + file->Name(i) + " (" + format + ")";
        const auto before = g_findings.size();
        for (const auto check : checks) check(*file, i);
        std::printf("%s: %zu findings, %.1f s\n", g_subject.c_str(), g_findings.size() - before, seconds());
        std::fflush(stdout);
    }
}

}  // namespace

void Finding(const std::string& text) {
    const std::lock_guard lock(g_mutex);
    std::string kind = g_subject + text;
    std::erase_if(kind, [](unsigned char c) { return std::isdigit(c); });
    if (!g_findings.insert(kind).second) return;
    std::printf("%s: %s\n", g_subject.c_str(), text.c_str());
    std::fflush(stdout);
}

bool IsRealTime() { return g_subject.find("Pitch Shift") == std::string::npos; }

}  // namespace PluginHost

int main(int count, char** arguments) {
    using namespace PluginHost;
    const auto option = kChecks.find(count > 1 ? arguments[1] : "");
    const int first = option == kChecks.end() ? 1 : 2;
    for (int i = first; i < count; ++i) try {
            CheckFile(arguments[i], first == 2 ? option->second : kChecks.at(""));
        } catch (const std::exception& error) {
            Finding(error.what());
        }
    if (count <= first)
        std::fprintf(stderr, "usage: plugin_host [--windows|--presets] BUNDLE.lv2|FILE.clap|FILE.vst3...\n");
    std::printf("%d files, %zu findings\n", count - first, g_findings.size());
    return count <= first || !g_findings.empty();
}
