#include "DSP/Pitch/PitchAdapter.h"

#include <algorithm>
#include <atomic>
#include <cmath>

#include "DSP/Pitch/PitchAdapterCorvoOld.h"
#include "DSP/Pitch/PitchAdapterSoundTouch.h"
#include "DSP/Pitch/ShortFader.h"

namespace Corvo::DSP {
namespace {

class ClassicInfo : public PitchAdapterInfo {
public:
    ClassicInfo() : PitchAdapterInfo("Classic") {}
    std::vector<int> GetFFTSizes() const override {
        return {PitchAdapterCorvoOld::kFFTSizes.begin(), PitchAdapterCorvoOld::kFFTSizes.end()};
    }
    std::vector<int> GetQualities() const override {
        return {PitchAdapterCorvoOld::kOversampling.begin(), PitchAdapterCorvoOld::kOversampling.end()};
    }
};

class NewInfo : public PitchAdapterInfo {
public:
    NewInfo() : PitchAdapterInfo("New") {}
    std::vector<int> GetQualities() const override { return {0, 1, 2, 3, 4, 5, 6, 7, 8, 9}; }
};

ClassicInfo g_classic;
NewInfo g_new;
std::atomic<std::int64_t> g_shortFader{0};

constexpr float kTwelfthRootOfTwo = 1.0594631f;

}  // namespace

PitchAdapterInfo* const PitchAdapterInfo::OldCorvo = &g_classic;
PitchAdapterInfo* const PitchAdapterInfo::SoundTouch = &g_new;

PitchAdapterInfo::PitchAdapterInfo(const std::string& name) : m_name(name) {}
std::string PitchAdapterInfo::GetName() const { return m_name; }
std::vector<int> PitchAdapterInfo::GetFFTSizes() const { return {}; }
std::vector<int> PitchAdapterInfo::GetQualities() const { return {}; }
std::vector<PitchAdapterInfo*> PitchAdapterInfo::GetPitchAdapters() { return {OldCorvo, SoundTouch}; }

PitchAdapter* PitchAdapter::CreateAdapter(PitchAdapterInfo* info) {
    if (info == PitchAdapterInfo::OldCorvo) return new PitchAdapterCorvoOld;
    if (info == PitchAdapterInfo::SoundTouch) return new PitchAdapterSoundTouch;
    return nullptr;
}

PitchAdapter* PitchAdapter::CreateAdapter(int index) {
    const auto place = static_cast<std::size_t>(std::clamp(index, 0, PitchAdapterInfo::kCount - 1));
    return CreateAdapter(PitchAdapterInfo::GetPitchAdapters()[place]);
}

PitchAdapter::PitchAdapter() = default;
PitchAdapter::PitchAdapter(const PitchAdapter&) = default;
PitchAdapter& PitchAdapter::operator=(const PitchAdapter&) = default;
PitchAdapter::~PitchAdapter() = default;

void PitchAdapter::Clear() {}
void PitchAdapter::SetChannelsNum(int channels) { m_channels = channels; }
void PitchAdapter::SetSpeed(float) {}
void PitchAdapter::CookFactors() {}
void PitchAdapter::SetFFTSize(int) {}
void PitchAdapter::SetQuality(int) {}
int PitchAdapter::ProcessInPlaceNoPadding(double* buffer, int frames) {
    ProcessInPlace(buffer, frames);
    return frames;
}
int PitchAdapter::ProcessInPlaceNoPadding(float* buffer, int frames) {
    ProcessInPlace(buffer, frames);
    return frames;
}
void PitchAdapter::Flush() {}
int PitchAdapter::GetNumSamplesAvailable() { return 0; }
void PitchAdapter::ReceiveSamples(double*, int) {}
void PitchAdapter::ReceiveSamples(float*, int) {}
int PitchAdapter::GetLatency() { return 0; }

void PitchAdapter::SetTranspose(float semitones) {
    const float factor = std::pow(kTwelfthRootOfTwo, semitones);
    for (int channel = 0; channel < m_channels; ++channel) SetPitchFactor(channel, factor);
}

void SetShortFaderNumSamples(std::int64_t samples) { g_shortFader = samples; }
std::int64_t ShortFaderNumSamples() { return g_shortFader; }

}  // namespace Corvo::DSP
