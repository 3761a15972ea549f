#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>

namespace Corvo::DSP {

// Texts of parameter values and their parsing. Numbers have a point whatever the process's locale.

// As "%.<decimals>f", padded with blanks on the left to `width`.
std::wstring FormatFixed(double value, int decimals, int width = 0);
// As "%d".
std::wstring FormatInteger(std::int64_t value);
// Tenths of a decibel as "-6.0"; "-Inf." at the floor and below.
std::wstring FormatTenthsOfDb(std::int32_t tenths, std::int32_t floor);
// "On" and "Off".
std::wstring FormatSwitch(bool on);
// The text, one blank, the unit; the blank stays when the unit is empty.
std::wstring WithUnit(std::wstring text, std::wstring_view unit);

// The number at the start of `text`, after blanks; "inf" and "nan" are numbers too, so "-Inf." is minus
// infinity. Throws std::invalid_argument("invalid stof argument")
// when there is none and std::out_of_range("stof argument out of range") when a float cannot hold it.
float ParseNumber(std::string_view text);
// The tenths that FormatTenthsOfDb shows as `text`: rounded, because the text is exact to a tenth; "-Inf."
// gives `floor`.
std::int32_t ParseTenthsOfDb(std::string_view text, std::int32_t floor);
// The word that shows as the number at the start of `text` when each unit of it counts `step`; 0 for negative
// numbers and NaN. Throws like ParseNumber.
std::int32_t ParseSteps(std::string_view text, double step);
// Normalised 1 for "On" and 0 for "Off", whatever the case; a number counts as on from 0.5. Throws like
// ParseNumber.
float ParseSwitch(std::string_view text);
// Index of the name that `text` begins with, whatever the case, the longest if several do; -1 if none.
int FindName(std::string_view text, std::span<const std::string_view> names);

// Blanks removed at both ends.
std::string_view Trimmed(std::string_view text);
bool StartsWithNoCase(std::string_view text, std::string_view start);

// Between narrow and wide, for ASCII: everything the library shows.
std::wstring Widen(std::string_view text);
std::string Narrow(std::wstring_view text);

}  // namespace Corvo::DSP
