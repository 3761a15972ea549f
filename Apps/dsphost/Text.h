#pragma once

#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace dsphost {

std::string Utf8(std::wstring_view wide);
// What is no UTF-8 becomes U+FFFD.
std::wstring Wide(std::string_view utf8);
// Control characters, marks that turn the direction and what is no UTF-8 as \n, \x1b or \u202e, so that a
// text keeps to its line and a terminal only shows it.
std::string Escaped(std::string_view text);
// At most `most` bytes, with dots where the rest was.
std::string Shortened(std::string_view text, std::size_t most);
// The same, with the dots in the middle.
std::string ShortenedInside(std::string_view text, std::size_t most);
inline constexpr std::size_t kLongestQuote = 60;  // of what a message repeats
// Blanks removed at both ends.
std::string_view Trimmed(std::string_view text);
// ASCII letters only; everything else compares as it is.
bool SameNoCase(std::string_view a, std::string_view b);
bool StartsWithNoCase(std::string_view text, std::string_view start);
std::string Joined(std::span<const std::string> texts, std::string_view separator);

// How many characters at the start of `text` are a decimal number (sign, point and exponent included); 0 for
// none.
std::size_t NumberLength(std::string_view text);
// The whole of `text` as a finite number; blanks around it are allowed. The point is a point in every locale.
std::optional<double> ToNumber(std::string_view text);
// In as few digits as tell it from every other number.
std::string ToText(double number);

// "accepted: a, b, c" for a short list, else the names most like `text`: "did you mean a, b or c?".
std::string Suggestion(std::string_view text, std::span<const std::string> names);

// Index of the name that `text` stands for: equal but for case, or the only one that it is the beginning of.
// Throws UserError with a suggestion; `what` says what is looked for ("effect", "preset of Echo").
std::size_t FindName(std::string_view text, std::span<const std::string> names, std::string_view what);

}  // namespace dsphost
