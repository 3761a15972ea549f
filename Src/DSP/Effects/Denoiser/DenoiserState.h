#pragma once

#include <atomic>
#include <memory>

#include "DSP/Effects/Denoiser/DenoiserEngine.h"
#include "DSP/Effects/Denoiser/DenoiserProcessor.h"
#include "Threads/LatestValue.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP::DenoiserPrivate {

using Denoising::DenoiserEngine;
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
            m_known = *newest;
        return m_known;
    }
    void Load(NoiseProfile profile) {
        Known();
        m_known = std::move(profile);
        m_known.generation = ++m_generation;
        m_toAudio.Draft() = m_known;
        m_toAudio.Publish();
    }

    // No block is being processed. Without memory there is no engine, and the learned noise is kept.
    void Prepare(double preparedRate, std::size_t channels) {
        EndPassage();
        auto made = engine ? std::move(engine) : std::make_unique<DenoiserEngine>();
        made->Prepare(preparedRate, channels);
        made->Adopt(Known());
        engine = std::move(made);
        // Every slot of what the audio thread will hand over gets its room; a value on its way has been
        // taken.
        for (int slot = 0; slot < 3; ++slot) {
            engine->GiveRoom(m_fromAudio.Draft());
            m_fromAudio.Publish();
            m_fromAudio.Take();
        }
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
            engine->Adopt(*loaded);
            m_taken = loaded->generation;
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

    LatestValue<NoiseProfile> m_toAudio, m_fromAudio;
    std::size_t m_channels = 0;      // that the engine is prepared for
    NoiseProfile m_known;            // user-interface thread
    std::uint32_t m_generation = 0;  // user-interface thread
    std::uint32_t m_taken = 0;       // audio thread
};

}  // namespace Corvo::DSP::DenoiserPrivate
