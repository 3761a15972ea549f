#pragma once

#include <string>
#include <vector>

#include "DSP/Effects/PitchDoctor/PitchReadings.h"

namespace dsphost {

// "A4" for the MIDI number 69.
std::string NoteName(int number);

// A line per note: start and end in seconds, MIDI number, name, and how far the voice was off (the median, in
// cents).
std::string NotesAsCsv(const std::vector<Corvo::DSP::DecidedNote>& notes, int rate);
// A standard MIDI file of one track at 120 beats a minute.
std::string NotesAsMidi(const std::vector<Corvo::DSP::DecidedNote>& notes, int rate);

}  // namespace dsphost
