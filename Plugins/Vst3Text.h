#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <string>

namespace Corvo::Plugins {

// Between our texts, which are ASCII, and those of VST3 in 16-bit units, which end with 0.
template <typename Letter, std::size_t kSize>
void CopyText(Letter (&to)[kSize], const std::string& text) {
    const std::size_t count = std::min(text.size(), kSize - 1);
    std::transform(text.begin(), text.begin() + static_cast<std::ptrdiff_t>(count), to,
                   [](char c) { return static_cast<Letter>(c); });
    to[count] = 0;
}

using Vst3String = std::int16_t[128];
inline v3_str_128& AsText(std::int16_t* text) { return *reinterpret_cast<Vst3String*>(text); }

// Letters of other alphabets become "?".
inline std::string Narrow(const std::int16_t* text) {
    std::string narrow;
    for (; *text; ++text) narrow += *text > 0 && *text < 128 ? static_cast<char>(*text) : '?';
    return narrow;
}

}  // namespace Corvo::Plugins
