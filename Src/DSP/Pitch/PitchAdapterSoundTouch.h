#pragma once

#include <SoundTouch.h>

#include <atomic>
#include <vector>

#include "DSP/Pitch/PitchAdapter.h"
#include "Platform/CriticalSection.h"

namespace Corvo::DSP {

// The "New" back-end: the SoundTouch engine behind the adapter's operations. Every configuration call is a
// reset: it empties the engine and its counts.
class PitchAdapterSoundTouch final : public PitchAdapter {
public:
    PitchAdapterSoundTouch();
    PitchAdapterSoundTouch(const PitchAdapterSoundTouch&) = delete;
    PitchAdapterSoundTouch& operator=(const PitchAdapterSoundTouch&) = delete;

    void Clear() override;
    void SetSampleRate(int rate) override;
    void SetChannelsNum(int channels) override;
    void SetPitchFactor(int channel, float factor) override;
    void SetSpeed(float speed) override;
    void SetQuality(int index) override;
    void ProcessInPlace(double* buffer, int frames) override;
    void ProcessInPlace(float* buffer, int frames) override;
    int ProcessInPlaceNoPadding(double* buffer, int frames) override;
    int ProcessInPlaceNoPadding(float* buffer, int frames) override;
    void Flush() override;
    int GetNumSamplesAvailable() override;
    void ReceiveSamples(double* buffer, int frames) override;
    void ReceiveSamples(float* buffer, int frames) override;
    ~PitchAdapterSoundTouch() override;
    int GetLatency() override;

private:
    void Reset();
    void TakeLatency();
    void ApplyFilter();
    // The engine throws when it is given samples before it knows rate and channels.
    bool Ready() const { return m_rateSet && m_engineChannels > 0 && m_engineChannels == m_channels; }
    void Put(const float* samples, int frames);
    int Take(float* buffer, int frames);
    std::int64_t Owed() const;
    template <typename Call>
    int ThroughScratch(double* buffer, int frames, Call call);

    soundtouch::SoundTouch m_engine;
    bool m_atRest = true;
    CriticalSection m_lock;
    std::int64_t m_inputFrames = 0, m_outputFrames = 0;  // of the path without padding
    float m_speed = 1.0f;
    std::int64_t m_fadePosition;
    std::vector<float> m_scratch;
    bool m_rateSet = false;
    bool m_wantsFilter = true;
    std::int32_t m_engineChannels = 0;
    std::atomic<int> m_latency;  // asked for without the lock
};

}  // namespace Corvo::DSP
