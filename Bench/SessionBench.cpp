#include <benchmark/benchmark.h>
#include <malloc.h>
#include <sys/resource.h>
#include <time.h>

#include <algorithm>
#include <array>
#include <atomic>
#include <cmath>
#include <deque>
#include <fstream>
#include <memory>
#include <string>
#include <thread>

#include "DSP/Effects/Compressor/Compressor.h"
#include "DSP/Effects/Echo/Echo.h"
#include "DSP/Effects/Gain/GainEfx.h"
#include "DSP/Effects/Reverb/Reverb.h"
#include "DSP/Equalizer/ParEQ.h"
#include "Lv2Peer.h"
#include "Platform/DenormalGuard.h"
#include "Support/EffectCases.h"
#include "Support/Signals.h"

// What does a frame of a track cost in a session of many, whose memory no cache holds? A track is a gain, an
// equaliser of four bands, a compressor, an echo and a reverb, each with settings and sound of its own, after
// two seconds in which all of its memory has been touched. The arguments are tracks and frames of a block.
namespace {

constexpr int kRate = 48000, kMostFrames = 512, kChannels = 2, kBands = 4;
using Planes = std::array<float*, kChannels>;
constexpr int kSoundFrames = 2048, kWarmUpFrames = 2 * kRate;

// What a track is set to.
struct Settings {
    explicit Settings(std::uint64_t track) : random(track + 1) {}
    double Between(double low, double high) { return low + random.Unit() * (high - low); }
    TestSupport::Random random;
};

// The sound of a track, played round and round.
class Sound {
public:
    explicit Sound(std::uint64_t track)
        : m_samples(TestSupport::Noise<float>(kSoundFrames * kChannels, 0.25, track + 1)) {}
    const float* Next(int frames) {
        if (m_at + frames > kSoundFrames) m_at = 0;
        const float* const block = m_samples.data() + m_at * kChannels;
        m_at += frames;
        return block;
    }

private:
    std::vector<float> m_samples;
    int m_at = 0;
};

// What a thread's tracks work on, one after the other.
struct Blocks {
    std::array<std::array<float, kMostFrames * kChannels>, 2> memory{};
    float* Interleaved() { return memory[0].data(); }
    Planes Planar(std::size_t block) { return {memory[block].data(), memory[block].data() + kMostFrames}; }
};

class OurTrack {
public:
    OurTrack(std::uint64_t number, Blocks&) : m_sound(number) {
        Settings draw(number);
        for (auto& record : m_bands) record.SetNumBands(kBands);
        for (int band = 0; band < kBands; ++band) {
            const auto hz = static_cast<int>(draw.Between(1, 2) * 100 * (1 << (2 * band)));
            const auto tenths = static_cast<int>(draw.Between(-100, 100)) | 1;
            for (auto& record : m_bands) record.SetEqData(band, {Corvo::DSP::EQ_PEAK, hz, tenths, 150});
        }
        m_equaliser.Cook(false, false, m_bands.data(), kRate, kChannels);
        Set(m_gain, 0, draw.Between(-12, 0));
        m_compressor.SetPreset(2);
        for (const int side : {0, 1}) {
            Set(m_compressor, side, draw.Between(5, 20));
            Set(m_compressor, 6 + side, draw.Between(-30, -10));
            Set(m_echo, side, draw.Between(200, 600));
            Set(m_reverb, 15 - side, draw.Between(0, 20));            // pre-delay
            Set(m_reverb, 15 - (8 + side), draw.Between(1, 2));       // pattern of reflections
            Set(m_reverb, 15 - (10 + side), draw.Between(0.7, 1.3));  // room
        }
        const auto format = TestSupport::Format<float>();
        for (auto* effect : Effects()) effect->InitProcessing(kMostFrames, &format);
    }

    void Process(Blocks& blocks, int frames) {
        float* const block = blocks.Interleaved();
        std::copy_n(m_sound.Next(frames), frames * kChannels, block);
        const auto format = TestSupport::Format<float>();
        Corvo::DSP::ProcessFlags flags;
        m_gain.Process(block, frames, &format, flags);
        m_equaliser.Process(block, frames, kChannels, false, m_bands.data());
        m_compressor.Process(block, frames, &format, flags);
        m_echo.Process(block, frames, &format, flags);
        m_reverb.Process(block, frames, &format, flags);
    }

private:
    std::array<Corvo::DSP::CorvoEffectBase*, 4> Effects() {
        return {&m_gain, &m_compressor, &m_echo, &m_reverb};
    }
    static void Set(Corvo::DSP::CorvoEffectBase& effect, int parameter, double value) {
        effect.SetParam(parameter, effect.GetParamValueNormalizedFromText(parameter, std::to_string(value)),
                        false);
    }

    Sound m_sound;
    Corvo::DSP::GainEfx::GainEfx m_gain;
    std::array<Corvo::DSP::builtin_effects_data, kChannels> m_bands;
    Corvo::DSP::ParEQ m_equaliser;
    Corvo::DSP::Compressor m_compressor;
    Corvo::DSP::Echo m_echo;
    Corvo::DSP::Reverb m_reverb;
};

#if DSP_HAVE_LILV
class PeerTrack {
public:
    using Controls = Lv2Peer::Controls;

    PeerTrack(std::uint64_t number, Blocks& blocks) : m_sound(number) {
        const std::string swh = "http://plugin.org.uk/swh-plugins/";
        Settings draw(number);
        Controls bands;
        for (int band = 0; band < kBands; ++band) {
            const auto index = "_" + std::to_string(band);
            bands["ft" + index] = 1;  // bell
            bands["f" + index] = draw.Between(1, 2) * 100 * (1 << (2 * band));
            bands["g" + index] = std::pow(10.0, draw.Between(-10, 10) / 20);
            bands["q" + index] = 1;
        }
        Add(blocks, swh + "amp", {{"gain", draw.Between(-12, 0)}});
        Add(blocks, "http://lsp-plug.in/plugins/lv2/para_equalizer_x16_stereo", bands);
        Add(blocks, swh + "sc4",
            {{"attack", draw.Between(5, 20)}, {"threshold", draw.Between(-30, -10)}, {"ratio", 4}});
        Add(blocks, "http://drobilla.net/plugins/mda/Delay",
            {{"l_delay", draw.Between(0.4, 1)}, {"r_delay", draw.Between(0.1, 0.9)}});
        Add(blocks, "http://calf.sourceforge.net/plugins/Reverb",
            {{"room_size", draw.Between(0, 5.99)}, {"predelay", draw.Between(0, 20)}});
    }

    void Process(Blocks& blocks, int frames) {
        const float* const sound = m_sound.Next(frames);
        const Planes planes = blocks.Planar(0);
        for (int i = 0; i < frames; ++i) {
            planes[0][i] = sound[2 * i];
            planes[1][i] = sound[2 * i + 1];
        }
        for (auto& plugin : m_plugins) plugin.Run(frames);
    }

private:
    // From one of the two blocks into the other.
    void Add(Blocks& blocks, const std::string& uri, const Controls& controls) {
        const std::size_t from = m_plugins.size() % 2;
        m_plugins.emplace_back(uri, controls, kRate, blocks.Planar(from), blocks.Planar(1 - from));
    }
    Sound m_sound;
    std::vector<Lv2Peer> m_plugins;
};
#endif

// The tracks of one thread, made and warmed up as they are asked for: a session of fewer tracks is the
// beginning of one of more.
template <typename Track>
class Session {
public:
    void Process(std::size_t tracks, int frames) {
        const Corvo::DenormalGuard guard;
        for (std::size_t i = 0; i < tracks; ++i) m_tracks[i].Process(m_blocks, frames);
    }
    void Extend(std::size_t tracks) {
        for (std::size_t first = m_tracks.size(); m_tracks.size() < tracks;) {
            m_tracks.emplace_back(m_tracks.size(), m_blocks);
            if (m_tracks.size() == tracks)
                for (int done = 0; done < kWarmUpFrames; done += kMostFrames)
                    for (std::size_t i = first; i < tracks; ++i) m_tracks[i].Process(m_blocks, kMostFrames);
        }
    }
    static Session& OfThread(std::size_t thread) {
        static std::array<Session, 2> sessions;
        return sessions[thread];
    }

private:
    Blocks m_blocks;
    std::deque<Track> m_tracks;
};

template <typename Track>
void RunSession(benchmark::State& state) {
    const auto tracks = static_cast<std::size_t>(state.range(0));
    const auto frames = static_cast<int>(state.range(1));
    auto& session = Session<Track>::OfThread(0);
    try {
        session.Extend(tracks);
        for (auto _ : state) session.Process(tracks, frames);
    } catch (const std::exception& missing) {
        state.SkipWithError(missing.what());
    }
    state.SetItemsProcessed(state.iterations() * state.range(0) * state.range(1));
}
const std::vector<std::vector<std::int64_t>> kSizes{{1, 4, 16, 64, 256}, {64, 512}};
void BM_Session(benchmark::State& state) { RunSession<OurTrack>(state); }
BENCHMARK(BM_Session)->ArgsProduct(kSizes);
#if DSP_HAVE_LILV
void BM_SessionPeers(benchmark::State& state) { RunSession<PeerTrack>(state); }
BENCHMARK(BM_SessionPeers)->ArgsProduct(kSizes);
#endif

double Seconds(clockid_t clock) {
    timespec time{};
    clock_gettime(clock, &time);
    return static_cast<double>(time.tv_sec) + 1e-9 * static_cast<double>(time.tv_nsec);
}
double ThreadSeconds() { return Seconds(CLOCK_THREAD_CPUTIME_ID); }

// The same on one thread, or shared out to two that work side by side: the time is the slower one's, on the
// processor, which says nothing of waiting, or on the wall, which tells of all that the machine does
// meanwhile. The arguments are tracks in all, frames and threads.
template <clockid_t clock>
void BM_SessionThreads(benchmark::State& state) {
    constexpr int kBlocks = 64;
    const auto threads = static_cast<std::size_t>(state.range(2));
    const auto tracks = static_cast<std::size_t>(state.range(0)) / threads;
    const auto frames = static_cast<int>(state.range(1));
    for (std::size_t i = 0; i < threads; ++i) Session<OurTrack>::OfThread(i).Extend(tracks);
    for (auto _ : state) {
        std::array<double, 2> seconds{};
        std::atomic<std::size_t> waiting = threads;
        const auto work = [&](std::size_t i) {
            for (--waiting; waiting > 0;) std::this_thread::yield();
            const double start = Seconds(clock);
            for (int block = 0; block < kBlocks; ++block)
                Session<OurTrack>::OfThread(i).Process(tracks, frames);
            seconds[i] = Seconds(clock) - start;
        };
        {
            std::vector<std::jthread> running;
            for (std::size_t i = 0; i < threads; ++i) running.emplace_back(work, i);
        }
        state.SetIterationTime(std::max(seconds[0], seconds[1]));
    }
    state.SetItemsProcessed(state.iterations() * kBlocks * state.range(0) * state.range(1));
}
constexpr clockid_t kProcessor = CLOCK_THREAD_CPUTIME_ID, kWall = CLOCK_MONOTONIC;
BENCHMARK_TEMPLATE(BM_SessionThreads, kProcessor)->ArgsProduct({{64}, {64, 512}, {1, 2}})->UseManualTime();
BENCHMARK_TEMPLATE(BM_SessionThreads, kWall)->ArgsProduct({{64}, {64, 512}, {1, 2}})->UseManualTime();

// Two seconds of noise that an effect learns.
void Learn(Corvo::DSP::CorvoEffectBase& effect) {
    constexpr int kLearn = 1;  // parameter of the denoiser
    Sound sound(1);
    std::array<float, kMostFrames * kChannels> block;
    const auto format = TestSupport::Format<float>();
    Corvo::DSP::ProcessFlags flags;
    effect.SetParam(kLearn, 1.0f, false);
    for (int done = 0; done < 2 * kRate; done += kMostFrames) {
        std::copy_n(sound.Next(kMostFrames), block.size(), block.begin());
        effect.Process(block.data(), kMostFrames, &format, flags);
    }
    effect.SetParam(kLearn, 0.0f, false);
    effect.Process(block.data(), kMostFrames, &format, flags);
}

// Kilobytes that are given out, from the heap or by the system, whether they have been touched or not.
double GivenOut() {
    std::ifstream file("/proc/self/statm");
    double pages = 0;
    file >> pages;
    const auto heap = mallinfo2();
    return 4 * pages - (static_cast<double>(heap.arena) - static_cast<double>(heap.uordblks)) / 1024;
}

// Opening a project: an effect is made, takes its saved settings and is prepared, while others of its kind
// are open. Each has the settings of another preset. KB is the memory that this touches, none of which was in
// use before; KB_most is all that an instance has for itself, whether it touches it or not.
void OpenEffect(benchmark::State& state, const TestSupport::EffectCase& effect, bool learned) {
    constexpr std::size_t kInstances = 64;
    const auto format = TestSupport::Format<float>();
    const auto saved = effect.Make();
    saved->InitProcessing(kMostFrames, &format);
    if (learned) Learn(*saved);
    std::vector<std::vector<std::uint8_t>> chunks(
        static_cast<std::size_t>(std::max(saved->NumPresets(), 1)));  // without presets, as it is new
    for (std::size_t preset = 0; preset < chunks.size(); ++preset) {
        saved->SetPreset(static_cast<int>(preset));
        saved->GetSettingsChunk(chunks[preset]);
    }
    std::vector<std::unique_ptr<Corvo::DSP::CorvoEffectBase>> open;
    open.reserve(kInstances);
    long pages = 0;
    double space = 0;
    for (auto _ : state) {
        if (open.size() == kInstances) {
            open.clear();
            malloc_trim(0);
        }
        const auto& chunk = chunks[open.size() % chunks.size()];
        const double spaceBefore = GivenOut();
        rusage before{}, after{};
        getrusage(RUSAGE_THREAD, &before);
        const double start = ThreadSeconds();
        open.push_back(effect.Make());
        open.back()->SetSettingsChunk(chunk);
        open.back()->InitProcessing(kMostFrames, &format);
        state.SetIterationTime(ThreadSeconds() - start);
        getrusage(RUSAGE_THREAD, &after);
        pages += after.ru_minflt - before.ru_minflt;
        space += GivenOut() - spaceBefore;
    }
    state.counters["KB"] = 4.0 * static_cast<double>(pages) / static_cast<double>(state.iterations());
    state.counters["KB_most"] = space / static_cast<double>(state.iterations());
}
[[maybe_unused]] const bool kOpenings = [] {
    for (const auto& row : TestSupport::AllEffects())
        for (const bool learned : {false, true}) {
            const std::string name = row.name;
            if (learned && name != "Denoiser") continue;
            benchmark::RegisterBenchmark(
                ("BM_Open/" + name + (learned ? " that has learned" : "")).c_str(),
                [&row, learned](benchmark::State& state) { OpenEffect(state, row, learned); })
                ->UseManualTime();
        }
    return true;
}();

}  // namespace
