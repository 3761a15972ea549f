#if defined(__linux__)
#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <fstream>
#include <string>
#include <vector>

#include "Support/Signals.h"
#include "WavHeader.h"

// Does the memory of `dsphost render` grow with the length of what it renders, and how fast is it? The stream
// is stereo at 96 kHz, made up while it is read; an hour must stay within 64 MiB.
namespace {

constexpr int kRate = 96000, kChannels = 2;
constexpr double kMostMiB = 64.0;

void WriteAll(int file, const void* bytes, std::size_t count) {
    const auto* rest = static_cast<const char*>(bytes);
    while (count > 0) {
        const auto done = write(file, rest, count);
        if (done <= 0) return;
        rest += done;
        count -= static_cast<std::size_t>(done);
    }
}

double PeakMiB(pid_t process) {
    std::ifstream status("/proc/" + std::to_string(process) + "/status");
    std::string word;
    while (status >> word)
        if (word == "VmHWM:") {
            double kib = 0.0;
            status >> kib;
            return kib / 1024.0;
        }
    return 0.0;
}

pid_t StartRender(int (&input)[2]) {
    if (pipe(input) != 0) return -1;
    const pid_t process = fork();
    if (process != 0) return process;
    dup2(input[0], STDIN_FILENO);
    dup2(open("/dev/null", O_WRONLY), STDOUT_FILENO);
    close(input[0]);
    close(input[1]);
    execl(DSPHOST_PROGRAM, DSPHOST_PROGRAM, "render", "-", "-", "--fx", "Gain: Gain=-6", "--fx", "Tremolo",
          "--fx", "Echo", static_cast<char*>(nullptr));
    _exit(127);
}

void BM_RenderStream(benchmark::State& state) {
    const auto noise = TestSupport::Noise<double>(kRate * kChannels);
    std::vector<std::int16_t> second;
    for (const double sample : noise) second.push_back(static_cast<std::int16_t>(sample * 32767.0));
    const auto header = dsphost::MakeWavHeader({kChannels, kRate, SF_FORMAT_PCM_16}, {});
    const std::int64_t seconds = state.range(0) * 60;
    double peak = 0.0;
    for (auto _ : state) {
        int input[2];
        const pid_t process = StartRender(input);
        close(input[0]);
        WriteAll(input[1], header.data(), header.size());
        for (std::int64_t i = 0; i < seconds; ++i) WriteAll(input[1], second.data(), second.size() * 2);
        peak = PeakMiB(process);
        close(input[1]);
        int status = 0;
        waitpid(process, &status, 0);
        if (status != 0) state.SkipWithError("dsphost failed");
        if (peak > kMostMiB) state.SkipWithError("more than 64 MiB");
    }
    state.counters["peak_MiB"] = peak;
    state.counters["x_real_time"] =
        benchmark::Counter(static_cast<double>(seconds), benchmark::Counter::kIsIterationInvariantRate);
}
BENCHMARK(BM_RenderStream)
    ->ArgName("minutes")
    ->Arg(1)
    ->Arg(60)
    ->Iterations(1)
    ->UseRealTime()
    ->Unit(benchmark::kSecond);

}  // namespace
#endif
