// plugin_host [--windows | --presets] FILE...
// Does to CLAP and VST3 plug-ins what a strict host may do, or on a display to their windows, and prints what
// it finds; or prints the states of their presets. Exits 0 when it found nothing, 1 otherwise.
#include <cctype>
#include <chrono>
#include <cstdio>
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

void CheckFile(const std::filesystem::path& path, const std::vector<Check>& checks) {
    g_subject = path.filename().string();
    const auto begin = std::chrono::steady_clock::now();
    const bool clap = path.extension() == ".clap";
    const auto file = clap ? OpenClap(path) : OpenVst3(path);
    Expect(file->Count() > 0, "has no plug-in");
    Expect(std::chrono::steady_clock::now() - begin < std::chrono::seconds(1),
           "takes more than a second to scan");
    for (std::size_t i = 0; i < file->Count(); ++i) {
        g_subject = path.filename().string() + ", " + file->Name(i) + " (" + (clap ? "CLAP" : "VST3") + ")";
        const auto before = g_findings.size();
        for (const auto check : checks) check(*file, i);
        const std::chrono::duration<double> time = std::chrono::steady_clock::now() - begin;
        std::printf("%s: %zu findings, %.1f s\n", g_subject.c_str(), g_findings.size() - before,
                    time.count());
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
        std::fprintf(stderr, "usage: plugin_host [--windows|--presets] FILE.clap|FILE.vst3...\n");
    std::printf("%d files, %zu findings\n", count - first, g_findings.size());
    return count <= first || !g_findings.empty();
}
