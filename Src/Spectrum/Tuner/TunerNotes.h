#pragma once

#include "Spectrum/Tuner/TunerTemperaments.h"

namespace Corvo {

struct NearestNote {
    int note = -1;   // 0 A .. 11 G#
    int octave = 0;  // changes at C: the A of 440 Hz is in octave 4
    double cents = 0.0;
};

// The note of the current table, repeated over the octaves, next to a frequency (Hz, above 0). Any thread;
// while another cooks the table, some of its notes may be the new ones already.
NearestNote FindNearestNote(double hz);

}  // namespace Corvo
