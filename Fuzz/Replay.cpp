// Runs the targets without a fuzzer, built by any compiler:
//   fuzz_replay FOLDER...             every file, through the target that its folder is named after
//   fuzz_replay --soak SECONDS SEED FOLDER
//       random input for all targets, most of it for those whose sessions are long; the last of each is kept
//       in FOLDER, as replay takes it; memory must stay flat
#include <chrono>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <random>
#include <string>

#include "Target.h"

namespace {

namespace fs = std::filesystem;

int Run(const Fuzz::Target& target, std::span<const std::uint8_t> bytes) {
    Fuzz::Input input(bytes);
    target.run(input);
    return 1;
}

const Fuzz::Target* Find(const std::string& name) {
    for (const auto* const target : Fuzz::Target::All())
        if (name == target->name) return target;
    return nullptr;
}

int Replay(const fs::path& folder) {
    int files = 0;
    for (const auto& entry : fs::recursive_directory_iterator(folder)) {
        if (!entry.is_regular_file()) continue;
        const auto* const target = Find(entry.path().parent_path().filename().string());
        if (!target) continue;
        std::ifstream file(entry.path(), std::ios::binary);
        const std::vector<char> bytes(std::istreambuf_iterator<char>(file), {});
        std::printf("%s\n", entry.path().string().c_str());
        std::fflush(stdout);  // the last line names the one that fails
        files += Run(*target, {reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size()});
    }
    return files;
}

// Of this process, in MiB; 0 where the system does not say so.
double ResidentMemory() {
    std::ifstream status("/proc/self/statm");
    double total = 0.0, resident = 0.0;
    status >> total >> resident;
    return resident * 4096.0 / (1 << 20);
}

// Those whose sessions are long stand there several times.
std::vector<const Fuzz::Target*> Weighted() {
    auto all = Fuzz::Target::All();
    const auto others = all.size();
    for (const char* const name : {"Effects", "Equaliser", "Analyser"})
        if (const auto* const target = Find(name)) all.insert(all.end(), others, target);
    return all;
}

int Soak(double seconds, unsigned seed, const fs::path& folder) {
    using Clock = std::chrono::steady_clock;
    std::printf("seed %u\n", seed);
    std::fflush(stdout);
    std::mt19937 random(seed);
    const auto all = Weighted();
    std::vector<std::uint8_t> bytes;
    const auto start = Clock::now();
    const auto passed = [&] { return std::chrono::duration<double>(Clock::now() - start).count(); };
    double settled = 0.0;
    for (long runs = 1;; ++runs) {
        bytes.resize(random() % 4000);
        for (auto& byte : bytes) byte = static_cast<std::uint8_t>(random());
        const auto& target = *all[random() % all.size()];
        fs::create_directories(folder / target.name);
        std::ofstream(folder / target.name / "last", std::ios::binary)
            .write(reinterpret_cast<const char*>(bytes.data()), static_cast<std::streamsize>(bytes.size()));
        Run(target, bytes);
        // Caches and pools fill in the first third.
        if (passed() < seconds / 3) settled = ResidentMemory();
        if (passed() < seconds) continue;
        const double end = ResidentMemory();
        std::printf("%ld sessions, %.0f MiB after a third of the time, %.0f MiB at the end\n", runs, settled,
                    end);
        return end < settled * 1.1 + 8.0 ? 0 : 1;
    }
}

}  // namespace

int main(int count, char** arguments) {
    if (count == 5 && std::string(arguments[1]) == "--soak")
        return Soak(std::stod(arguments[2]), static_cast<unsigned>(std::stoul(arguments[3])), arguments[4]);
    int files = 0;
    for (int i = 1; i < count; ++i) files += Replay(arguments[i]);
    std::printf("%d inputs replayed\n", files);
    return files > 0 ? 0 : 1;
}
