#pragma once

#include <cstdint>
#include <vector>

#include "Platform/Export.h"

namespace Corvo::DSP {

// What the pitch correction heard and did at one moment, for editors and for lists of notes. Positions begin
// at 0 again with InitProcessing, Cleanup and InitResetProcessingLight, and go on over edits of the settings;
// readings that were not taken before that are still there. They come up to 10 ms after the voice was heard,
// when its note is known.
struct PitchReading {
    std::int64_t position = 0;     // frames of input since the stream began
    float heardHz = 0.0f;          // 0: not voiced
    float correctionCents = 0.0f;  // so much higher is the output
    std::int32_t note = -1;        // the MIDI number of the note that is meant; -1 while none is decided
    float noteHz = 0.0f;           // where that note stands; 0 without one

    // Whether a pitch was heard.
    bool IsVoiced() const { return heardHz > 0.0f; }
};

// A note as it was decided.
struct DecidedNote {
    std::int64_t start, end;  // positions of its first and last reading
    std::int32_t note;        // MIDI number
    float heardCents;         // median of what was sung, in cents above the note
};

// The notes of readings in their order. In frames: a pause of up to `longestPause` does not end a note, and a
// note shorter than `shortest` is left out, as a glide touches notes on its way; the note before it goes on
// if the voice is back within both.
DSP_API std::vector<DecidedNote> NotesOf(const std::vector<PitchReading>& readings, std::int64_t longestPause,
                                         std::int64_t shortest);

}  // namespace Corvo::DSP
