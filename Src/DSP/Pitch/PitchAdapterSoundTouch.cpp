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
constexpr int kPiece = 256;
constexpr float kOctave = 2.0f;
constexpr int kMostFillPieces = 1024;
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

constexpr std::array<float, kFlushFrames * kMostEngineChannels> kSilence{};

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
    // In pieces where the engine first makes more of them, so that this stays small.
    const int piece = m_told.pitch * m_told.speed < 1.0f ? kPiece : frames;
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
    Put(kSilence.data(), kPrimingFrames);
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
// kScratchSamples needs, at the lowest pitch and up to an octave, they grow no more.
void PitchAdapterSoundTouch::Fill() {
    if (!Ready() || (m_filledChannels == m_told.channels && m_filledRate == m_told.rate)) return;
    const auto wanted = m_told;
    const int block = static_cast<int>(kScratchSamples) / m_channels;
    m_scratch.assign(kScratchSamples, 0.0f);
    for (const float pitch : {kLowestPitch, 1.0f, kOctave}) {
        auto other = wanted;
        other.pitch = pitch;
        other.quickSeek = 1;  // as much output of silence, sooner
        Configure(other);
        m_engine->clear();
        if (pitch < 1.0f)
            FillBeforeStart();
        else
            FillWhileRunning(block);
    }
    Configure(wanted);
    m_filledChannels = wanted.channels;
    m_filledRate = wanted.rate;
}

// The lowest pitch asks for the most input: a piece that comes when one frame is missing to a whole sequence.
// The engine begins somewhat before its latency, as its filter starts with silence.
void PitchAdapterSoundTouch::FillBeforeStart() {
    const int early = m_told.filterLength;
    for (int left = m_engine->getSetting(SETTING_INITIAL_LATENCY) - early; left > 0; left -= kPiece)
        Put(m_scratch.data(), std::min(left, kPiece));
    WithEngine([&] { m_engine->putSamples(m_scratch.data(), static_cast<unsigned>(kPiece + early)); });
}

// The others make the most output: of a block that ends one more sequence, with another block still held.
void PitchAdapterSoundTouch::FillWhileRunning(int block) {
    for (int i = 0; Held() < block && i < kMostFillPieces; ++i) Put(m_scratch.data(), kPiece);
    const int frames = block + m_engine->getSetting(SETTING_NOMINAL_INPUT_SEQUENCE);
    const std::vector<float> silence(Samples(frames, m_channels));
    Put(silence.data(), frames);
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
    for (int i = 0; Held() < owed && i < kMostFlushBlocks; ++i) Put(kSilence.data(), kFlushFrames);
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
