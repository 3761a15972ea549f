#pragma once

#include <array>
#include <cstddef>
#include <string_view>

namespace Corvo {

// A short text on the stack, for what changes with every frame. What does not fit is left out.
class ShortText {
public:
    std::string_view View() const { return {m_text.data(), m_length}; }

    ShortText& Add(std::string_view text);
    // With a point whatever the locale, and a real minus sign.
    ShortText& AddNumber(double value, int decimals);
    // "55.03 Hz", "440.0 Hz" or "1.250 kHz".
    ShortText& AddFrequency(double hz);
    // "+12.3", and a real minus sign.
    ShortText& AddDifference(double value, int decimals);
    // "A4 +12c": the note of equal temperament on A = 440 Hz that is nearest; nothing outside 8 Hz..32 kHz.
    ShortText& AddNote(double hz);
    // "A4", in the tuner's naming, from the number of semitones above C-1.
    ShortText& AddNoteName(int semitone);

private:
    std::array<char, 95> m_text{};  // as long as a back-end draws
    std::size_t m_length = 0;
};

}  // namespace Corvo
