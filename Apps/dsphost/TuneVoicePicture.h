#pragma once

#include <string>
#include <vector>

#include "DSP/Effects/PitchDoctor/PitchReadings.h"
#include "Drawing/DrawTarget.h"

namespace dsphost {

// What became of a voice: the pitch that was heard, the corrected one and the notes.
struct VoiceCurve {
    std::vector<Corvo::DSP::PitchReading> readings;
    std::vector<Corvo::DSP::DecidedNote> notes;
    int rate = 48000;
    double seconds = 0.0;
    std::string title;
};

// Draws it over the rows of a piano roll, as large as `whole`.
void DrawVoiceCurve(Corvo::DrawTarget& target, const Corvo::RectF& whole, const VoiceCurve& curve);

}  // namespace dsphost
