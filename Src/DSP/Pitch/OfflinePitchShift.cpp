#include "DSP/Pitch/OfflinePitchShift.h"

#include <algorithm>
#include <cmath>
#include <stdexcept>
#include <string>

namespace Corvo::DSP {
namespace {

constexpr int kBlock = 4096;
constexpr int kClassicSizeIndex = 3;

using Settings = OfflinePitchShift::Settings;

PitchAdapterInfo& InfoOf(const Settings& settings) {
    return *(settings.engine == OfflinePitchShift::Engine::New ? PitchAdapterInfo::SoundTouch
                                                               : PitchAdapterInfo::OldCorvo);
}

void Require(bool holds, const std::string& sentence) {
    if (!holds) throw std::invalid_argument(sentence);
}

const Settings& Checked(const Settings& settings) {
    const bool isNew = settings.engine == OfflinePitchShift::Engine::New;
    Require(isNew || settings.engine == OfflinePitchShift::Engine::Classic, "there is no such engine");
    Require(settings.rate >= 1000 && settings.rate <= 768000, "the rate can be 1000 to 768000 Hz");
    Require(settings.channels == 1 || settings.channels == 2, "the pitch is shifted in mono and stereo");
    Require(std::abs(settings.semitones) <= 36.0, "the pitch can be shifted by -36 to 36 semitones");
    Require(settings.speed >= 0.1 && settings.speed <= 10.0, "the speed can be 0.1 to 10");
    Require(isNew || settings.speed == 1.0, "the engine \"Classic\" keeps the speed");
    const auto qualities = static_cast<int>(InfoOf(settings).GetQualities().size());
    Require(settings.quality >= 0 && settings.quality < qualities,
            "the quality can be 0 to " + std::to_string(qualities - 1));
    return settings;
}

// "New" makes up for its own delay in the path without padding. "Classic" delays by all of its frame but one
// step.
int DelayFrames(const Settings& settings) {
    if (settings.engine == OfflinePitchShift::Engine::New) return 0;
    const auto& info = InfoOf(settings);
    const int size = info.GetFFTSizes()[kClassicSizeIndex];
    return size - size / info.GetQualities()[static_cast<std::size_t>(settings.quality)];
}

std::unique_ptr<PitchAdapter> Prepared(const Settings& settings) {
    std::unique_ptr<PitchAdapter> adapter(PitchAdapter::CreateAdapter(&InfoOf(settings)));
    if (!adapter) throw std::bad_alloc();
    adapter->SetChannelsNum(settings.channels);
    adapter->SetSampleRate(settings.rate);
    adapter->SetFFTSize(kClassicSizeIndex);
    adapter->SetQuality(settings.quality);
    adapter->SetTranspose(static_cast<float>(settings.semitones));
    adapter->SetSpeed(static_cast<float>(settings.speed));
    adapter->CookFactors();
    return adapter;
}

}  // namespace

OfflinePitchShift::OfflinePitchShift(const Settings& settings)
    : m_adapter(Prepared(Checked(settings))),
      m_channels(static_cast<std::size_t>(settings.channels)),
      m_speed(static_cast<float>(settings.speed)),
      m_delay(DelayFrames(settings)),
      m_padding(DelayFrames(settings)),
      m_block(kBlock * m_channels) {}

OfflinePitchShift::~OfflinePitchShift() = default;

void OfflinePitchShift::Feed(const float* samples, int frames) {
    while (frames > 0) {
        const int count = std::min(frames, kBlock);
        std::copy_n(samples, static_cast<std::size_t>(count) * m_channels, m_block.begin());
        samples += static_cast<std::size_t>(count) * m_channels;
        frames -= count;
        m_fed += count;
        Keep(m_block.data(), m_adapter->ProcessInPlaceNoPadding(m_block.data(), count));
    }
}

void OfflinePitchShift::Finish() {
    for (; m_padding > 0; m_padding -= kBlock) {
        std::ranges::fill(m_block, 0.0f);
        Keep(m_block.data(), m_adapter->ProcessInPlaceNoPadding(m_block.data(), std::min(m_padding, kBlock)));
    }
    m_adapter->Flush();
    for (int left; (left = m_adapter->GetNumSamplesAvailable()) > 0;) {
        const int count = std::min(left, kBlock);
        m_adapter->ReceiveSamples(m_block.data(), count);
        Keep(m_block.data(), count);
    }
}

std::int64_t OfflinePitchShift::Available() const {
    return static_cast<std::int64_t>((m_ready.size() - m_taken) / m_channels);
}

int OfflinePitchShift::Take(float* samples, int frames) {
    const auto count = static_cast<int>(std::clamp<std::int64_t>(frames, 0, Available()));
    const std::size_t values = static_cast<std::size_t>(count) * m_channels;
    std::copy_n(m_ready.begin() + static_cast<std::ptrdiff_t>(m_taken), values, samples);
    m_taken += values;
    if (m_taken == m_ready.size()) {
        m_ready.clear();
        m_taken = 0;
    }
    return count;
}

// Leaves out the engine's delay, and stops where the output is long enough.
void OfflinePitchShift::Keep(const float* samples, int frames) {
    const auto owed = static_cast<std::int64_t>(static_cast<double>(m_fed) / m_speed) - m_kept;
    const auto skipped = static_cast<int>(std::min<std::int64_t>(m_delay, frames));
    m_delay -= skipped;
    const auto count = std::min<std::int64_t>(frames - skipped, owed);
    if (count <= 0) return;
    const float* const first = samples + static_cast<std::size_t>(skipped) * m_channels;
    m_ready.insert(m_ready.end(), first, first + static_cast<std::size_t>(count) * m_channels);
    m_kept += count;
}

}  // namespace Corvo::DSP
