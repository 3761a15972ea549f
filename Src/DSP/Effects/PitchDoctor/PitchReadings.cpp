#include "DSP/Effects/PitchDoctor/PitchReadings.h"

#include <cmath>

namespace Corvo::DSP {

std::vector<DecidedNote> NotesOf(const std::vector<PitchReading>& readings, std::int64_t longestPause,
                                 std::int64_t shortest) {
    std::vector<DecidedNote> notes;
    int count = 0;  // readings of the last note
    const auto leaveOutShort = [&] {
        if (!notes.empty() && notes.back().end - notes.back().start < shortest) notes.pop_back();
    };
    for (const auto& reading : readings) {
        if (!reading.IsVoiced() || reading.note < 0) continue;
        if (notes.empty() || notes.back().note != reading.note ||
            reading.position - notes.back().end > longestPause) {
            leaveOutShort();
            notes.push_back({reading.position, reading.position, reading.note, 0.0f});
            count = 0;
        }
        auto& note = notes.back();
        note.end = reading.position;
        const float cents = 1200.0f * std::log2(reading.heardHz / reading.noteHz);
        note.heardCents += (cents - note.heardCents) / static_cast<float>(++count);
    }
    leaveOutShort();
    return notes;
}

}  // namespace Corvo::DSP
