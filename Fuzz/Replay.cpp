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

#include "Support/Sanitizers.h"
#include "Target.h"
#if WITH_ADDRESS_SANITIZER
#include <sanitizer/allocator_interface.h>
#elif defined(__GLIBC__)
#include <malloc.h>
#endif

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

// Allocated and not freed, in KiB; 0 where the system does not say so. What a process has in pages says
// little: the allocator keeps some of what large sessions have freed.
double MemoryInUse() {
#if WITH_ADDRESS_SANITIZER
    return static_cast<double>(__sanitizer_get_current_allocated_bytes()) / 1024.0;
#elif defined(__GLIBC__)
    const auto info = mallinfo2();
    return static_cast<double>(info.uordblks + info.hblkhd) / 1024.0;
#else
    return 0.0;
#endif
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
    long settledRuns = 0;
    for (long runs = 1;; ++runs) {
        bytes.resize(random() % 4000);
        for (auto& byte : bytes) byte = static_cast<std::uint8_t>(random());
        const auto& target = *all[random() % all.size()];
        fs::create_directories(folder / target.name);
        std::ofstream(folder / target.name / "last", std::ios::binary)
            .write(reinterpret_cast<const char*>(bytes.data()), static_cast<std::streamsize>(bytes.size()));
        Run(target, bytes);
        // Caches and pools fill in the first third, and in 500 sessions: a soak of less says nothing of
        // memory.
        if (passed() < seconds / 3 || runs <= 500) {
            settled = MemoryInUse();
            settledRuns = runs;
        }
        if (passed() < seconds) continue;
        const double end = MemoryInUse();
        std::printf("%ld sessions, %.0f KiB in use after %ld, %.0f KiB at the end\n", runs, settled,
                    settledRuns, end);
        // What a session may leave for good, beside caches that go on filling.
        constexpr double kPerSession = 0.25, kCaches = 512.0;
        return end - settled < kPerSession * static_cast<double>(runs - settledRuns) + kCaches ? 0 : 1;
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
