#pragma once

#include <SoundTouch.h>

#include <atomic>
#include <memory>
#include <vector>

#include "DSP/Pitch/PitchAdapter.h"
#include "Platform/CriticalSection.h"

namespace Corvo::DSP {

// The "New" back-end: the SoundTouch engine behind the adapter's operations. Every configuration call is a
// reset: it empties the engine and its counts.
//
// The engine is told only what changes, as it allocates for that, and SetQuality, the last of the
// calls that prepare, fills its buffers to the largest. Where it runs out of memory it is replaced at the
// next configuration call.
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
    // What the engine is told.
    struct Configuration {
        unsigned rate = 0, channels = 0;  // 0: not yet
        float pitch = 1.0f, speed = 1.0f;
        int filterLength = 64, filter = 1, quickSeek = 0;
        bool operator==(const Configuration&) const = default;
    };

    template <typename Call>
    void WithEngine(Call&& call);
    void Configure(const Configuration& wanted);
    void Reset();
    void TakeLatency();
    Configuration WithFilter(Configuration wanted) const;
    void Fill();
    void GrowBuffers();
    // The engine throws when it is given samples before it knows rate and channels.
    bool Ready() const {
        return m_engine && m_rateSet && m_told.channels > 0 &&
               m_told.channels == static_cast<unsigned>(m_channels);
    }
    void Put(const float* samples, int frames);
    int Take(float* buffer, int frames);
    std::int64_t Held() const;
    std::int64_t Owed() const;
    template <typename Call>
    int ThroughScratch(double* buffer, int frames, Call call);

    std::unique_ptr<soundtouch::SoundTouch> m_engine;
    Configuration m_told;                             // what it knows
    unsigned m_filledChannels = 0, m_filledRate = 0;  // for which its buffers are filled
    bool m_atRest = true;
    CriticalSection m_lock;
    std::int64_t m_inputFrames = 0, m_outputFrames = 0;  // of the path without padding
    std::int64_t m_fadePosition;
    std::vector<float> m_scratch;
    bool m_rateSet = false;
    bool m_wantsFilter = true;
    std::atomic<int> m_latency;  // asked for without the lock
};

}  // namespace Corvo::DSP
