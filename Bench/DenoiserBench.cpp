#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <vector>

#include "DSP/Effects/Denoiser/DenoiserProcessor.h"
#include "EffectRun.h"
#include "FfmpegPeer.h"

// What does taking noise out cost, and how evenly is the work spread: what does the dearest block of 64
// frames cost beside the middle one? Beside others that take noise out by its spectrum.
namespace {

using Corvo::DSP::DenoiserProcessor;

enum Size { kThree, kTwo, k2048, k1024 };
constexpr int kProfile = 0, kLearn = 1, kSize = 8;
constexpr int kRate = 48000;

void Set(DenoiserProcessor& denoiser, Size size, bool learned, int channels) {
    denoiser.SetParam(kSize, static_cast<float>(size) / 3.0f, false);
    if (!learned) return;
    const auto format = TestSupport::Format<float>(channels);
    auto noise = TestSupport::Noise<float>(static_cast<std::size_t>(2 * kRate * channels));
    denoiser.InitProcessing(2 * kRate, &format);
    Corvo::DSP::ProcessFlags flags;
    for (const bool on : {true, false}) {
        denoiser.SetParam(kLearn, on ? 1.0f : 0.0f, false);
        denoiser.Process(noise.data(), on ? 2 * kRate : 1, &format, flags);
    }
    denoiser.SetParam(kProfile, 0.0f, false);
}

template <typename Sample, Size Number, bool Learned>
void BM_DenoiserStereo(benchmark::State& state) {
    DenoiserProcessor denoiser;
    Set(denoiser, Number, Learned, 2);
    RunEffect<Sample>(state, denoiser);
}
BENCHMARK_TEMPLATE(BM_DenoiserStereo, float, kThree, false)->Arg(64)->Arg(512);
BENCHMARK_TEMPLATE(BM_DenoiserStereo, double, kThree, false)->Arg(512);
BENCHMARK_TEMPLATE(BM_DenoiserStereo, float, kThree, true)->Arg(512);
BENCHMARK_TEMPLATE(BM_DenoiserStereo, float, k1024, true)->Arg(512);

// Mono, blocks of 64. Each block's time is the shortest of several runs over the same stream, so that what
// the machine did beside it does not count; counters are shares of a core, and multiples of the median.
template <Size Number, bool Learned>
void BM_DenoiserSpread(benchmark::State& state) {
    using Clock = std::chrono::steady_clock;
    constexpr int kFrames = 64, kBlocks = 2000, kRuns = 15;
    const auto format = TestSupport::Format<float>(1);
    const auto input = TestSupport::Noise<float>(kFrames * kBlocks);
    std::vector<double> seconds(kBlocks, 1.0);
    DenoiserProcessor denoiser;
    Set(denoiser, Number, Learned, 1);
    Corvo::DSP::ProcessFlags flags;
    for (auto _ : state)
        for (int run = 0; run < kRuns; ++run) {
            auto stream = input;
            denoiser.InitProcessing(kFrames, &format);
            for (std::size_t block = 0; block < kBlocks; ++block) {
                const auto start = Clock::now();
                denoiser.Process(stream.data() + block * kFrames, kFrames, &format, flags);
                const std::chrono::duration<double> took = Clock::now() - start;
                seconds[block] = std::min(seconds[block], took.count());
            }
        }
    seconds.erase(seconds.begin(), seconds.begin() + kBlocks / 5);  // until all windows are full
    std::ranges::sort(seconds);
    double sum = 0.0;
    for (const double each : seconds) sum += each;
    const double median = seconds[seconds.size() / 2];
    constexpr double kBlockSeconds = static_cast<double>(kFrames) / kRate;
    state.counters["percent_of_a_core"] = 100.0 * sum / static_cast<double>(seconds.size()) / kBlockSeconds;
    state.counters["median_us"] = 1e6 * median;
    state.counters["q90"] = seconds[seconds.size() * 9 / 10] / median;
    state.counters["q99"] = seconds[seconds.size() * 99 / 100] / median;
    state.counters["worst"] = seconds.back() / median;
}
BENCHMARK_TEMPLATE(BM_DenoiserSpread, kThree, false)->Iterations(1);
BENCHMARK_TEMPLATE(BM_DenoiserSpread, kThree, true)->Iterations(1);
BENCHMARK_TEMPLATE(BM_DenoiserSpread, kTwo, false)->Iterations(1);
BENCHMARK_TEMPLATE(BM_DenoiserSpread, k2048, false)->Iterations(1);
BENCHMARK_TEMPLATE(BM_DenoiserSpread, k1024, true)->Iterations(1);

#if DSP_HAVE_LIBAVFILTER
void BM_FfmpegDenoiser(benchmark::State& state) { RunFfmpeg<float>(state, "afftdn=nr=25:tn=1", "fltp"); }
BENCHMARK(BM_FfmpegDenoiser)->Arg(512)->Arg(4096);
#endif

// sox where it is installed, a whole process on a file of one minute, stereo; dsphost in the same way is
// BM_DsphostDenoise.
constexpr int kMinute = 60;
bool Shell(const std::string& line) { return std::system((line + " > /dev/null 2>&1").c_str()) == 0; }

void RunOnAFile(benchmark::State& state, const std::string& prepare, const std::string& line) {
    const auto folder = std::filesystem::temp_directory_path() / "dsp_bench_denoiser";
    std::filesystem::create_directories(folder);
    const std::string go = "cd '" + folder.string() + "' && ";
    if (!Shell(go + "sox -R -n -r 48000 -c 2 -b 32 -e floating-point in.wav synth " +
               std::to_string(kMinute) + " whitenoise vol 0.1" + prepare)) {
        state.SkipWithError("sox is not installed");
        return;
    }
    for (auto _ : state)
        if (!Shell(go + line)) state.SkipWithError(line.c_str());
    state.SetItemsProcessed(state.iterations() * kMinute * kRate);
    std::filesystem::remove_all(folder);
}
void BM_SoxDenoiser(benchmark::State& state) {
    RunOnAFile(state, " && sox in.wav -n trim 0 2 noiseprof profile",
               "sox in.wav out.wav noisered profile 0.3");
}
BENCHMARK(BM_SoxDenoiser)->Unit(benchmark::kMillisecond)->UseRealTime();
#ifdef DSPHOST_PROGRAM
void BM_DsphostDenoise(benchmark::State& state) {
    RunOnAFile(state, "", DSPHOST_PROGRAM " denoise in.wav out.wav --learn 0:2 -q -y");
}
BENCHMARK(BM_DsphostDenoise)->Unit(benchmark::kMillisecond)->UseRealTime();
#endif

}  // namespace
