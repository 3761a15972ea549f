#include "DSP/Pitch/PitchAdapterSoundTouch.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <limits>
#include <mutex>
#include <new>

#include "DSP/Pitch/ShortFader.h"
#include "Platform/DenormalGuard.h"
#include "Platform/FiniteSamples.h"

namespace Corvo::DSP {
namespace {

constexpr int kMostEngineChannels = 16;
constexpr int kPrimingFrames = 28;
constexpr int kFlushFrames = 128;
constexpr int kPiece = 1024;
constexpr float kOctave = 2.0f;
constexpr int kShortestFilter = 8, kMostTaps = 128;
// A rate just above 1, at a tempo of 100.
constexpr float kFillPitch = 0.01f, kFillSpeed = 100.5f;
// The engine can only be flushed by more input; far more than its longest sequence ends the attempt.
constexpr int kMostFlushBlocks = 1 << 16;
// The engine throws at higher rates, and at a few Hz its sequences are too short to move on by a frame. It
// only sizes them by the rate, so they become shorter or longer.
constexpr int kLowestRate = 1000, kHighestRate = 192000;
constexpr float kLowestPitch = 0.02f;
// Above this the engine would make thousands of frames of every one it is given.
constexpr float kHighestPitch = 64.0f;
// Beyond these the engine's own counts overflow.
constexpr float kLowestSpeed = 0.01f, kHighestSpeed = 100.0f;
// Blocks up to this size need no new memory, whatever their precision.
constexpr std::size_t kScratchSamples = 16384;

// Silence to give to the engine. It is never written to: a constant would lie in the library's file.
std::array<float, 1 << 18> g_silence{};

std::size_t Samples(int frames, int channels) {
    return static_cast<std::size_t>(std::max(frames, 0)) * static_cast<std::size_t>(std::max(channels, 0));
}

}  // namespace

PitchAdapterSoundTouch::PitchAdapterSoundTouch()
    : m_engine(std::make_unique<soundtouch::SoundTouch>()),
      m_fadePosition(static_cast<std::int64_t>(static_cast<std::uint64_t>(ShortFaderNumSamples()) + 1)) {
    m_scratch.reserve(kScratchSamples);
    TakeLatency();
}
PitchAdapterSoundTouch::~PitchAdapterSoundTouch() = default;

// An engine that ran out of memory may hold pointers to what it has freed: it is never touched again, not
// even to destroy it.
template <typename Call>
void PitchAdapterSoundTouch::WithEngine(Call&& call) {
    try {
        call();
    } catch (const std::bad_alloc&) {
        static_cast<void>(m_engine.release());
        throw;
    }
}

void PitchAdapterSoundTouch::Configure(const Configuration& wanted) {
    if (!m_engine) {
        m_engine = std::make_unique<soundtouch::SoundTouch>();
        m_told = {};
        m_filledChannels = m_filledRate = 0;
    }
    WithEngine([&] {
        if (wanted.channels != m_told.channels) {
            m_told.channels = 0;  // stays so when the engine refuses
            m_engine->setChannels(wanted.channels);
        }
        if (wanted.rate != m_told.rate) m_engine->setSampleRate(wanted.rate);
        if (wanted.pitch != m_told.pitch) m_engine->setPitch(wanted.pitch);
        if (wanted.speed != m_told.speed) m_engine->setRate(wanted.speed);
        const auto set = [&](int setting, int Configuration::*value) {
            if (wanted.*value != m_told.*value) m_engine->setSetting(setting, wanted.*value);
        };
        set(SETTING_USE_AA_FILTER, &Configuration::filter);
        set(SETTING_AA_FILTER_LENGTH, &Configuration::filterLength);
        set(SETTING_USE_QUICKSEEK, &Configuration::quickSeek);
    });
    m_told = wanted;
}

void PitchAdapterSoundTouch::Reset() {
    m_inputFrames = m_outputFrames = 0;
    if (m_engine) m_engine->clear();
    m_atRest = true;
    m_fadePosition = 0;
    TakeLatency();
}

void PitchAdapterSoundTouch::TakeLatency() {
    if (m_engine) m_latency.store(m_engine->getSetting(SETTING_INITIAL_LATENCY), std::memory_order_relaxed);
}

// The engine takes 16 channels, but its anti-alias filter ends the process when it is given more than 15.
PitchAdapterSoundTouch::Configuration PitchAdapterSoundTouch::WithFilter(Configuration wanted) const {
    wanted.filter = m_wantsFilter && wanted.channels < kMostEngineChannels;
    return wanted;
}

void PitchAdapterSoundTouch::Put(const float* samples, int frames) {
    if (!Ready()) return;
    // Pieces of which it makes about kPiece frames, at most, leave its buffers small. At high rates they
    // would change the sound: its resampler then steps over the end of what it has.
    const float rate = m_told.pitch * m_told.speed;
    const int piece = rate > kOctave ? frames : std::clamp(static_cast<int>(kPiece * rate), 1, kPiece);
    for (int count; frames > 0; frames -= count, samples += Samples(count, m_channels)) {
        count = std::min(frames, piece);
        WithEngine([&] { m_engine->putSamples(samples, static_cast<unsigned>(count)); });
    }
}

int PitchAdapterSoundTouch::Take(float* buffer, int frames) {
    if (!Ready() || frames <= 0) return 0;
    return static_cast<int>(m_engine->receiveSamples(buffer, static_cast<unsigned>(frames)));
}

std::int64_t PitchAdapterSoundTouch::Held() const { return m_engine ? m_engine->numSamples() : 0; }

// Output frames that the input is worth, less those taken.
std::int64_t PitchAdapterSoundTouch::Owed() const {
    return static_cast<std::int64_t>(static_cast<double>(m_inputFrames) / m_told.speed) - m_outputFrames;
}

void PitchAdapterSoundTouch::Clear() {
    const std::lock_guard lock(m_lock);
    Reset();
}

void PitchAdapterSoundTouch::SetSampleRate(int rate) {
    const std::lock_guard lock(m_lock);
    Reset();
    m_rateSet = rate > 0;
    auto wanted = m_told;
    if (m_rateSet) wanted.rate = static_cast<unsigned>(std::clamp(rate, kLowestRate, kHighestRate));
    Configure(wanted);
    TakeLatency();
    Put(g_silence.data(), kPrimingFrames);
}

void PitchAdapterSoundTouch::SetChannelsNum(int channels) {
    const std::lock_guard lock(m_lock);
    m_channels = channels;
    Reset();
    auto wanted = m_told;
    wanted.channels = static_cast<unsigned>(channels);
    Configure(WithFilter(wanted));
    TakeLatency();
}

void PitchAdapterSoundTouch::SetPitchFactor(int channel, float factor) {
    const std::lock_guard lock(m_lock);
    if (channel != 0) return;  // all channels share one pitch
    auto wanted = m_told;
    wanted.pitch = factor > kLowestPitch ? std::min(factor, kHighestPitch) : kLowestPitch;
    Configure(wanted);
    Reset();
}

void PitchAdapterSoundTouch::SetSpeed(float speed) {
    if (!(speed > 0.0f) || !std::isfinite(speed)) return;
    const std::lock_guard lock(m_lock);
    auto wanted = m_told;
    wanted.speed = std::clamp(speed, kLowestSpeed, kHighestSpeed);
    Configure(wanted);
    Reset();
}

void PitchAdapterSoundTouch::SetQuality(int index) {
    const std::lock_guard lock(m_lock);
    Fill();
    Reset();
    m_wantsFilter = index >= 3;
    auto wanted = WithFilter(m_told);
    wanted.filterLength = index <= 4 ? 32 : index == 5 ? 64 : 128;
    wanted.quickSeek = index < 4;
    Configure(wanted);
    TakeLatency();
}

// The engine's buffers keep their size when it is cleared: once they have held the most that a block of
// kScratchSamples needs, from the lowest pitch to an octave up, they grow no more.
void PitchAdapterSoundTouch::Fill() {
    if (!Ready() || (m_filledChannels == m_told.channels && m_filledRate == m_told.rate)) return;
    const auto wanted = m_told;
    try {
        GrowBuffers();
        Configure(wanted);
    } catch (const std::bad_alloc&) {
        m_told = wanted;  // for the engine to come
        throw;
    }
    m_filledChannels = wanted.channels;
    m_filledRate = wanted.rate;
}

// No call makes the engine's buffers large, so silence goes through them, with as little work as can be. It
// first stretches and then resamples above a rate of 1, and the other way round up to it; what it holds moves
// on when the rate passes 1.
void PitchAdapterSoundTouch::GrowBuffers() {
    const auto tell = [&](float pitch, float speed) {
        auto other = m_told;
        other.pitch = pitch;
        other.speed = speed;
        other.filter = m_told.channels < kMostEngineChannels;
        other.filterLength = kShortestFilter;
        other.quickSeek = 1;
        Configure(other);
    };
    tell(kLowestPitch, 1.0f);
    const auto lowest = static_cast<float>(m_engine->getSetting(SETTING_INITIAL_LATENCY)) / kLowestPitch;
    tell(kOctave, 1.0f);
    const int sequence = m_engine->getSetting(SETTING_NOMINAL_INPUT_SEQUENCE) * static_cast<int>(kOctave);
    // What the resampler is given at once: from the stretcher, or at the start, when it holds half a filter.
    const int passed = std::max(kPiece + sequence, static_cast<int>(kMostTaps / 2 / kLowestPitch)) + kPiece;
    // What is held when a block is taken: less than two of them, and than two sequences.
    const int block = static_cast<int>(kScratchSamples) / m_channels;
    const int held = 2 * std::max(block + sequence, passed);

    // Sequences so long, and so much stretching, that the stretcher waits for more than it is given here.
    const auto giveStretcher = [&](int frames) {
        tell(kFillPitch, kFillSpeed);
        m_engine->clear();
        const int most = static_cast<int>(g_silence.size()) / m_channels;
        for (int count; frames > 0; frames -= count) {
            count = std::min(frames, most);
            m_engine->putSamples(g_silence.data(), static_cast<unsigned>(count));
        }
    };
    WithEngine([&] {
        m_engine->setSetting(SETTING_SEQUENCE_MS, 1 + static_cast<int>(1000.0 * held / m_told.rate));
        giveStretcher(static_cast<int>(lowest) + kPiece + kMostTaps);
        giveStretcher(held + passed + kMostTaps);
        // One sequence goes to the stretcher's output and from there to the resampler's, the rest through
        // that.
        tell(1.0f, 1.0f);
        m_engine->putSamples(g_silence.data(), 1);
        tell(kFillPitch, kFillSpeed);
        m_engine->setSetting(SETTING_SEQUENCE_MS, 0);  // back to what it finds best
        m_engine->clear();
    });
}

void PitchAdapterSoundTouch::ProcessInPlace(float* buffer, int frames) {
    const DenormalGuard guard;
    const std::lock_guard lock(m_lock);
    m_atRest = false;
    ReplaceNonFinite(buffer, frames, m_channels);
    Put(buffer, frames);
    if (Held() < frames)
        std::fill_n(buffer, Samples(frames, m_channels), 0.0f);
    else
        Take(buffer, frames);
}

int PitchAdapterSoundTouch::ProcessInPlaceNoPadding(float* buffer, int frames) {
    const DenormalGuard guard;
    const std::lock_guard lock(m_lock);
    m_atRest = false;
    ReplaceNonFinite(buffer, frames, m_channels);
    Put(buffer, frames);
    m_inputFrames += std::max(frames, 0);
    const int taken = Take(buffer, frames);
    m_outputFrames += taken;
    return taken;
}

template <typename Call>
int PitchAdapterSoundTouch::ThroughScratch(double* buffer, int frames, Call call) {
    const std::lock_guard lock(m_lock);
    const std::size_t count = Samples(frames, m_channels);
    if (m_scratch.size() < count) m_scratch.resize(count);
    std::transform(buffer, buffer + count, m_scratch.begin(), [](double s) { return static_cast<float>(s); });
    const int result = call(m_scratch.data());
    std::copy_n(m_scratch.begin(), count, buffer);
    return result;
}

void PitchAdapterSoundTouch::ProcessInPlace(double* buffer, int frames) {
    ThroughScratch(buffer, frames, [&](float* scratch) {
        ProcessInPlace(scratch, frames);
        return frames;
    });
}

int PitchAdapterSoundTouch::ProcessInPlaceNoPadding(double* buffer, int frames) {
    return ThroughScratch(buffer, frames,
                          [&](float* scratch) { return ProcessInPlaceNoPadding(scratch, frames); });
}

void PitchAdapterSoundTouch::Flush() {
    const DenormalGuard guard;
    const std::lock_guard lock(m_lock);
    if (m_atRest) return;
    m_atRest = true;
    if (!Ready()) return;
    const std::int64_t owed = Owed();
    for (int i = 0; Held() < owed && i < kMostFlushBlocks; ++i) Put(g_silence.data(), kFlushFrames);
}

int PitchAdapterSoundTouch::GetNumSamplesAvailable() {
    const std::lock_guard lock(m_lock);
    const std::int64_t held = Held();
    const std::int64_t count = m_atRest ? std::min(held, Owed()) : held;
    using Limits = std::numeric_limits<int>;
    return static_cast<int>(std::clamp<std::int64_t>(count, Limits::min(), Limits::max()));
}

void PitchAdapterSoundTouch::ReceiveSamples(float* buffer, int frames) {
    if (frames <= 0) return;
    const int taken = Take(buffer, frames);
    std::fill_n(buffer + Samples(taken, m_channels), Samples(frames - taken, m_channels), 0.0f);
    m_outputFrames += frames;
}

void PitchAdapterSoundTouch::ReceiveSamples(double* buffer, int frames) {
    ThroughScratch(buffer, frames, [&](float* scratch) {
        ReceiveSamples(scratch, frames);
        return frames;
    });
}

int PitchAdapterSoundTouch::GetLatency() { return m_latency.load(std::memory_order_relaxed); }

}  // namespace Corvo::DSP
