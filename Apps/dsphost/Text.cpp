#include "Text.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <numeric>
#include <utility>

#include "Errors.h"

namespace dsphost {
namespace {

constexpr std::size_t kShortList = 12;
constexpr std::size_t kSuggestions = 3;

char Lower(char c) { return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c; }

// Edits (insert, delete, replace) that turn one text into the other, whatever the case.
std::size_t Distance(std::string_view a, std::string_view b) {
    std::vector<std::size_t> row(b.size() + 1);
    std::iota(row.begin(), row.end(), std::size_t{0});
    for (std::size_t i = 0; i < a.size(); ++i) {
        std::size_t diagonal = std::exchange(row[0], i + 1);
        for (std::size_t j = 0; j < b.size(); ++j) {
            const std::size_t replaced = diagonal + (Lower(a[i]) == Lower(b[j]) ? 0 : 1);
            diagonal = row[j + 1];
            row[j + 1] = std::min({row[j] + 1, diagonal + 1, replaced});
        }
    }
    return row.back();
}

struct Character {
    std::uint32_t code;
    std::size_t length;  // in bytes; 0 where there is none, and the code is that of the first byte
};

// What a text that is not empty starts with.
Character FirstCharacter(std::string_view utf8) {
    constexpr std::array<std::uint32_t, 5> kLowest{0, 0, 0x80, 0x800, 0x10000};
    const std::uint32_t lead = static_cast<unsigned char>(utf8[0]);
    const std::size_t length = lead < 0x80 ? 1 : lead < 0xC0 ? 0 : lead < 0xE0 ? 2 : lead < 0xF0 ? 3 : 4;
    std::uint32_t code = length > 1 ? lead & (0x7Fu >> length) : lead;
    for (std::size_t i = 1; i < length; ++i) {
        const auto next = i < utf8.size() ? static_cast<unsigned char>(utf8[i]) : 0u;
        if ((next & 0xC0) != 0x80) return {lead, 0};
        code = code << 6 | (next & 0x3F);
    }
    const bool none = code < kLowest[length] || (code >= 0xD800 && code < 0xE000) || code > 0x10FFFF;
    return none || lead > 0xF4 ? Character{lead, 0} : Character{code, length};
}

// Marks that break a line or turn the direction in which what follows is shown.
bool MovesText(std::uint32_t code) {
    return code == 0x061C || code == 0x200E || code == 0x200F || (code >= 0x2028 && code <= 0x202E) ||
           (code >= 0x2066 && code <= 0x2069);
}

}  // namespace

std::string Utf8(std::wstring_view wide) {
    std::string text;
    const auto tail = [&](std::uint32_t code, int shift) {
        text += static_cast<char>(0x80 | ((code >> shift) & 0x3F));
    };
    for (std::size_t i = 0; i < wide.size(); ++i) {
        auto code = static_cast<std::uint32_t>(wide[i]);
        // Where wchar_t has 16 bits, two of them make one character beyond the first 65536.
        if (code >= 0xD800 && code < 0xDC00 && i + 1 < wide.size())
            code = 0x10000 + ((code - 0xD800) << 10) + (static_cast<std::uint32_t>(wide[++i]) - 0xDC00);
        if (code < 0x80) {
            text += static_cast<char>(code);
        } else if (code < 0x800) {
            text += static_cast<char>(0xC0 | (code >> 6));
            tail(code, 0);
        } else if (code < 0x10000) {
            text += static_cast<char>(0xE0 | (code >> 12));
            tail(code, 6);
            tail(code, 0);
        } else {
            text += static_cast<char>(0xF0 | (code >> 18));
            tail(code, 12);
            tail(code, 6);
            tail(code, 0);
        }
    }
    return text;
}

std::wstring Wide(std::string_view utf8) {
    std::wstring wide;
    while (!utf8.empty()) {
        auto [code, length] = FirstCharacter(utf8);
        utf8.remove_prefix(std::max(length, std::size_t{1}));
        if (length == 0) code = 0xFFFD;
        if (code > 0xFFFF && sizeof(wchar_t) == 2) {
            wide += static_cast<wchar_t>(0xD7C0 + (code >> 10));
            code = 0xDC00 + (code & 0x3FF);
        }
        wide += static_cast<wchar_t>(code);
    }
    return wide;
}

std::string Escaped(std::string_view text) {
    std::string escaped;
    while (!text.empty()) {
        const auto [code, length] = FirstCharacter(text);
        const std::size_t bytes = std::max(length, std::size_t{1});
        char number[16];
        if (length == 0 || code < 0x20 || (code >= 0x7F && code < 0xA0)) {
            std::snprintf(number, sizeof number, "\\x%02x", static_cast<unsigned>(code));
            escaped += code == '\n' ? "\\n" : number;
        } else if (MovesText(code)) {
            std::snprintf(number, sizeof number, "\\u%04x", static_cast<unsigned>(code));
            escaped += number;
        } else {
            escaped += text.substr(0, bytes);
        }
        text.remove_prefix(bytes);
    }
    return escaped;
}

std::string Shortened(std::string_view text, std::size_t most) {
    if (text.size() <= most) return std::string(text);
    // Not in the middle of a character.
    while (most > 0 && (static_cast<unsigned char>(text[most]) & 0xC0) == 0x80) --most;
    return std::string(text.substr(0, most)) + "...";
}

std::string ShortenedInside(std::string_view text, std::size_t most) {
    if (text.size() <= most) return std::string(text);
    auto end = text.substr(text.size() - most / 2);
    while (!end.empty() && (static_cast<unsigned char>(end[0]) & 0xC0) == 0x80) end.remove_prefix(1);
    return Shortened(text, most / 2) + std::string(end);
}

std::string_view Trimmed(std::string_view text) {
    constexpr std::string_view kBlanks = " \t\r\n\f\v";
    const auto first = text.find_first_not_of(kBlanks);
    if (first == text.npos)
        return text.substr(text.size());  // within the text, for whoever goes on from there
    return text.substr(first, text.find_last_not_of(kBlanks) - first + 1);
}

bool StartsWithNoCase(std::string_view text, std::string_view start) {
    return text.size() >= start.size() && std::equal(start.begin(), start.end(), text.begin(),
                                                     [](char a, char b) { return Lower(a) == Lower(b); });
}

bool SameNoCase(std::string_view a, std::string_view b) {
    return a.size() == b.size() && StartsWithNoCase(a, b);
}

std::string Joined(std::span<const std::string> texts, std::string_view separator) {
    std::string joined;
    for (const auto& text : texts) {
        if (!joined.empty()) joined += separator;
        joined += text;
    }
    return joined;
}

std::size_t NumberLength(std::string_view text) {
    const std::size_t sign = text.starts_with('+') || text.starts_with('-') ? 1 : 0;
    // Not "inf" and "nan", which from_chars would take.
    if (text.find_first_of("0123456789.", sign) != sign) return 0;
    double value;
    const auto [end, error] = std::from_chars(text.data() + sign, text.data() + text.size(), value);
    return error == std::errc::invalid_argument ? 0 : static_cast<std::size_t>(end - text.data());
}

std::optional<double> ToNumber(std::string_view text) {
    text = Trimmed(text);
    if (text.starts_with('+')) text.remove_prefix(1);
    double value;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    if (error != std::errc{} || end != text.data() + text.size() || !std::isfinite(value)) return {};
    return value;
}

std::string ToText(double number) {
    char text[32];
    return {text, std::to_chars(text, text + sizeof text, number).ptr};
}

std::string Suggestion(std::string_view text, std::span<const std::string> names) {
    if (names.empty()) return "there are none";
    std::vector<std::string> nearest(names.begin(), names.end());
    if (nearest.size() <= kShortList) return "accepted: " + Joined(nearest, ", ");
    std::ranges::stable_sort(nearest, {}, [&](const auto& name) {
        const bool contained = name.size() > text.size() && StartsWithNoCase(name, text);
        return contained ? 0 : Distance(text, name);
    });
    nearest.resize(kSuggestions);
    return "did you mean " + nearest[0] + ", " + nearest[1] + " or " + nearest[2] + "?";
}

std::size_t FindName(std::string_view text, std::span<const std::string> names, std::string_view what) {
    text = Trimmed(text);
    const auto same = std::ranges::find_if(names, [&](const auto& name) { return SameNoCase(name, text); });
    if (same != names.end()) return static_cast<std::size_t>(same - names.begin());

    const auto begins = [&](const auto& name) { return StartsWithNoCase(name, text); };
    std::vector<std::string> candidates;
    if (!text.empty()) std::ranges::copy_if(names, std::back_inserter(candidates), begins);
    if (candidates.size() == 1)
        return static_cast<std::size_t>(std::ranges::find_if(names, begins) - names.begin());
    const std::string shown = Shortened(text, kLongestQuote),
                      asked = std::string(what) + " \"" + shown + "\"";
    if (candidates.size() > 1) throw UserError(asked + " could be several: " + Joined(candidates, ", "));
    throw UserError("there is no " + asked + "; " + Suggestion(shown, names));
}

}  // namespace dsphost
