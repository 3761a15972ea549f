#pragma once

#include <array>
#include <atomic>
#include <cmath>
#include <cstdint>

#include "DSP/Effects/Compressor/Compressor.h"
#include "DSP/Effects/Compressor/CompressorCore.h"
#include "Platform/CriticalSection.h"
#include "Platform/WaveFormat.h"
#include "Threads/LatestValue.h"

namespace Corvo::DSP::CompressorPrivate {

constexpr std::int32_t kMonitorFlag = 1;                              // of the flags word
constexpr std::int32_t kShortestTime = 1, kLongestTime = 100000;      // hundredths of a millisecond
constexpr std::int32_t kSilentOutGain = -960, kHighestOutGain = 200;  // tenths of a decibel

// Settings as they are kept and travel between the threads, with the number of the user interface's
// submission that they are, or derive from.
struct NumberedSettings {
    NumberedSettings() {}  // nothing is written
    NumberedSettings& operator=(const Compressor::Settings& from) {
        parameters = from.parameters;
        curves = from.map;
        return *this;
    }

    std::uint32_t submission;
    union {  // whose members are not made with it
        Compressor::Parameters parameters;
    };
    KeptCurves curves;
};

// What the user interface edits, guarded by the section.
struct UserInterfaceSide {
    CriticalSection section;
    std::int32_t preset = 0;
    EditChannelMode editChannelMode = EditChannelMode::Both;
    NumberedSettings edited;
};

// What belongs to the audio thread alone. What every block needs stands first and together: in a session of
// many tracks each page and each line of it has to be fetched again.
struct AudioSide {
    tWAVEFORMATEX format{};
    CoreCoefficients coefficients;
    CoreState state;
    int gainFramesLeft = 0;  // of the out gain's glide
    std::array<double*, 2> sideChain{};
    int sideChainChannels = 0;  // 0: none was handed over for this block
    NumberedSettings current;   // its parameters, that is
    GlidingMap map;

    void ClearUnlessFinite() {
        for (std::size_t channel = 0; channel < 2; ++channel) {
            if (!std::isfinite(state.envelope[channel])) {
                state.envelope[channel] = 0.0;
                state.segment[channel] = 0;
            }
            if (!std::isfinite(state.displayGain[channel])) state.displayGain[channel] = 1.0;
        }
    }
    // Where the curves have other points than before.
    void FindSegments() {
        for (std::size_t channel = 0; channel < 2; ++channel)
            state.segment[channel] = map.SegmentAt(channel, state.envelope[channel]);
    }
};

// The ways across, and the single values that both sides see.
struct HandOver {
    HandOver() {
        for (std::size_t slot = 0; slot < records.size(); ++slot) {
            auto& way = slot % 2 == 0 ? toAudio : toUserInterface;
            way.Draft() = &records[slot];
            way.Publish();
            way.Take();
        }
    }

    std::atomic<bool> meterOn{false}, usingSideChain{false};
    std::array<std::atomic<float>, 2> displayGain{1.0f, 1.0f};
    LatestValue<NumberedSettings*> toAudio, toUserInterface;
    std::array<NumberedSettings, 6> records;  // three each
};

}  // namespace Corvo::DSP::CompressorPrivate
