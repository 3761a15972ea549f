#pragma once

#include <atomic>
#include <memory>

#include "DSP/Effects/Denoiser/DenoiserEngine.h"
#include "DSP/Effects/Denoiser/DenoiserProcessor.h"
#include "Platform/UntouchedZeros.h"
#include "Threads/LatestValue.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP::DenoiserPrivate {

using Denoising::DenoiserEngine;
using Denoising::LearnedNoise;
using Denoising::NoiseProfile;

// The engine, and the learned noise on its way between the threads.
//
// The audio thread learns and hands the whole profile to the user-interface thread, which keeps it for the
// chunk. In the other direction goes the profile of a chunk that is loaded, or an empty one after "Clear
// profile". Every load and every clear has a number, the generation, and a learned profile carries the
// generation it started from. One that arrives with an older generation is dropped.
struct State {
    tWAVEFORMATEX format{};  // the audio thread's
    std::unique_ptr<DenoiserEngine> engine;
    std::atomic<std::uint32_t> rate{48000};
    std::atomic<bool> clearRequested{false};  // by automation, on the audio thread

    // User-interface thread.
    const NoiseProfile& Known() {
        if (const auto* newest = m_fromAudio.Take(); newest && newest->generation == m_generation)
            m_known = std::make_shared<const NoiseProfile>(newest->Profile());
        return *m_known;
    }
    void Load(NoiseProfile profile) {
        profile.generation = m_generation + 1;
        m_known = std::make_shared<const NoiseProfile>(std::move(profile));
        ++m_generation;
        m_toAudio.Draft() = m_known;
        m_toAudio.Publish();
    }

    // No block is being processed. Without memory there is no engine, and the learned noise is kept.
    void Prepare(double preparedRate, std::size_t channels, int sizeSet) {
        EndPassage();
        auto made = engine ? std::move(engine) : std::make_unique<DenoiserEngine>();
        made->Prepare(preparedRate, channels, sizeSet);
        // One that is still on its way is no newer than what is known.
        if (const auto* loaded = m_toAudio.Take()) m_taken = (*loaded)->generation;
        made->Adopt(Known());
        GiveRoom(static_cast<std::uint32_t>(preparedRate));
        engine = std::move(made);
        rate.store(static_cast<std::uint32_t>(preparedRate));
        m_channels = channels;
    }
    bool IsPreparedFor(double wantedRate, std::size_t wantedChannels) const {
        return engine && rate == static_cast<std::uint32_t>(wantedRate) && m_channels == wantedChannels;
    }
    void Free() {
        EndPassage();
        engine.reset();
    }

    // Audio thread.
    void TakeProfiles() {
        if (const auto* loaded = m_toAudio.Take()) {
            engine->Adopt(**loaded);
            m_taken = (*loaded)->generation;
        }
        if (TakeFlag(clearRequested)) {
            engine->Forget();
            HandOver();
        }
    }
    void HandOverLearned() {
        if (engine->TakeNewlyLearned()) HandOver();
    }

private:
    // To every slot of what the audio thread will hand over; a value on its way has been taken.
    void GiveRoom(std::uint32_t preparedRate) {
        const std::size_t each = LearnedNoise::MostPowers(preparedRate);
        m_room = UntouchedZeros<float>(3 * each);
        for (std::size_t slot = 0; slot < 3; ++slot) {
            m_fromAudio.Draft().power = std::span(m_room).subspan(slot * each, each);
            m_fromAudio.Publish();
            m_fromAudio.Take();
        }
    }
    void HandOver() {
        auto& draft = m_fromAudio.Draft();
        engine->Export(draft);
        draft.generation = m_taken;
        m_fromAudio.Publish();
    }
    // What the engine has learned outlives it.
    void EndPassage() {
        if (!engine) return;
        engine->EndPassage();
        HandOverLearned();
    }

    LatestValue<std::shared_ptr<const NoiseProfile>> m_toAudio;  // the audio thread only looks at them
    LatestValue<LearnedNoise> m_fromAudio;
    UntouchedZeros<float> m_room;  // of m_fromAudio
    std::size_t m_channels = 0;    // that the engine is prepared for
    std::shared_ptr<const NoiseProfile> m_known = std::make_shared<NoiseProfile>();  // user-interface thread
    std::uint32_t m_generation = 0;                                                  // user-interface thread
    std::uint32_t m_taken = 0;                                                       // audio thread
};

}  // namespace Corvo::DSP::DenoiserPrivate
