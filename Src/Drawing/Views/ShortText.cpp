#include "Drawing/Views/ShortText.h"

#include <algorithm>
#include <charconv>
#include <cmath>

#include "Spectrum/Scales/EqualTemperament.h"
#include "Spectrum/Tuner/Tuner.h"

namespace Corvo {
namespace {

constexpr double kLowestNamed = 8.0, kHighestNamed = 32000.0;
constexpr std::string_view kMinus = "\u2212";

}  // namespace

ShortText& ShortText::Add(std::string_view text) {
    const std::size_t count = std::min(text.size(), m_text.size() - m_length);
    std::copy_n(text.begin(), count, m_text.begin() + static_cast<std::ptrdiff_t>(m_length));
    m_length += count;
    return *this;
}

ShortText& ShortText::AddNumber(double value, int decimals) {
    std::array<char, 32> digits;
    const auto result = std::to_chars(digits.data(), digits.data() + digits.size(), std::abs(value),
                                      std::chars_format::fixed, decimals);
    if (result.ec != std::errc()) return Add("?");
    const std::string_view text(digits.data(), static_cast<std::size_t>(result.ptr - digits.data()));
    const bool isZero = text.find_first_not_of("0.") == std::string_view::npos;
    return Add(value < 0.0 && !isZero ? kMinus : "").Add(text);
}

ShortText& ShortText::AddFrequency(double hz) {
    if (hz < 999.95) return AddNumber(hz, hz < 99.995 ? 2 : 1).Add(" Hz");
    return AddNumber(hz / 1000.0, hz < 9999.5 ? 3 : 2).Add(" kHz");
}

ShortText& ShortText::AddDifference(double value, int decimals) {
    return Add(value < 0.0 ? "" : "+").AddNumber(value, decimals);
}

ShortText& ShortText::AddNote(double hz) {
    if (!(hz >= kLowestNamed && hz <= kHighestNamed)) return *this;
    const double semitone = SemitoneOf(hz);
    const int nearest = static_cast<int>(std::lround(semitone));
    const double cents = 100.0 * (semitone - nearest);
    AddNoteName(nearest).Add(cents >= -0.5 ? " +" : " ");
    return AddNumber(cents, 0).Add("c");
}

ShortText& ShortText::AddNoteName(int semitone) {
    constexpr int kA = 9;  // the tuner counts the notes of an octave from A
    return Add(Tuner::GetNoteName(((semitone - kA) % 12 + 12) % 12))
        .AddNumber(std::floor(semitone / 12.0) - 1.0, 0);
}

}  // namespace Corvo
