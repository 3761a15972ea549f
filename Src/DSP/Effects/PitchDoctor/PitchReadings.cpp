#include "DSP/Effects/PitchDoctor/PitchReadings.h"

#include <algorithm>
#include <cmath>

namespace Corvo::DSP {

namespace {

struct HeardNote {
    DecidedNote note;
    std::vector<float> cents;  // of each reading
};

float Median(std::vector<float>& values) {
    const auto middle = values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2);
    std::ranges::nth_element(values, middle);
    return *middle;
}

}  // namespace

std::vector<DecidedNote> NotesOf(const std::vector<PitchReading>& readings, std::int64_t longestPause,
                                 std::int64_t shortest) {
    std::vector<HeardNote> heard;
    const auto continues = [&](const PitchReading& reading, std::int64_t gap) {
        return !heard.empty() && heard.back().note.note == reading.note &&
               reading.position - heard.back().note.end <= gap;
    };
    const auto leaveOutShort = [&] {
        if (heard.empty() || heard.back().note.end - heard.back().note.start >= shortest) return false;
        heard.pop_back();
        return true;
    };
    for (const auto& reading : readings) {
        if (!reading.IsVoiced() || reading.note < 0) continue;
        // What a short note interrupted goes on.
        if (!continues(reading, longestPause) &&
            !(leaveOutShort() && continues(reading, longestPause + shortest)))
            heard.push_back({{reading.position, reading.position, reading.note, 0.0f}, {}});
        auto& [note, cents] = heard.back();
        note.end = reading.position;
        cents.push_back(1200.0f * std::log2(reading.heardHz / reading.noteHz));
    }
    leaveOutShort();
    std::vector<DecidedNote> notes;
    for (auto& [note, cents] : heard) {
        note.heardCents = Median(cents);
        notes.push_back(note);
    }
    return notes;
}

}  // namespace Corvo::DSP
