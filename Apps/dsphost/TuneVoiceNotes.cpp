#include "TuneVoiceNotes.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <cstdint>
#include <string_view>

namespace dsphost {
namespace {

using Corvo::DSP::DecidedNote;
using namespace std::string_view_literals;

void AppendNumber(std::string& text, double value, int digits, char end) {
    std::array<char, 64> number;
    const double unit = std::pow(10.0, digits);
    value = std::round(value * unit) / unit + 0.0;  // not "-0.0"
    const auto result =
        std::to_chars(number.data(), number.data() + number.size(), value, std::chars_format::fixed, digits);
    text.append(number.data(), result.ptr) += end;
}

void AppendBigEndian(std::string& bytes, std::uint32_t value, int count) {
    while (count-- > 0) bytes += static_cast<char>(value >> (8 * count) & 0xFF);
}

// Seven bits a byte, the highest first; all but the last have the top bit set.
void AppendLength(std::string& bytes, std::uint32_t value) {
    for (int shift = 28; shift > 0; shift -= 7)
        if (value >> shift != 0) bytes += static_cast<char>((value >> shift & 0x7F) | 0x80);
    bytes += static_cast<char>(value & 0x7F);
}

}  // namespace

std::string NoteName(int number) {
    static constexpr std::array kNames{"C", "C#", "D", "D#", "E", "F", "F#", "G", "G#", "A", "A#", "B"};
    const int octave = static_cast<int>(std::floor(number / 12.0));
    return kNames[static_cast<std::size_t>(number - 12 * octave)] + std::to_string(octave - 1);
}

std::string NotesAsCsv(const std::vector<DecidedNote>& notes, int rate) {
    std::string text = "start_s,end_s,midi_note,name,sung_cents\n";
    for (const DecidedNote& note : notes) {
        AppendNumber(text, static_cast<double>(note.start) / rate, 4, ',');
        AppendNumber(text, static_cast<double>(note.end) / rate, 4, ',');
        text += std::to_string(note.note) + "," + NoteName(note.note) + ",";
        AppendNumber(text, static_cast<double>(note.heardCents), 1, '\n');
    }
    return text;
}

std::string NotesAsMidi(const std::vector<DecidedNote>& notes, int rate) {
    constexpr std::uint32_t kTicksPerBeat = 960, kTicksPerSecond = 2 * kTicksPerBeat;
    constexpr auto kTempo = "\x00\xFF\x51\x03\x07\xA1\x20"sv;  // half a second a beat
    constexpr auto kEnd = "\x00\xFF\x2F\x00"sv;
    constexpr char kOn = '\x90', kOff = '\x80', kVelocity = 100;
    std::string track(kTempo);
    std::uint32_t now = 0;
    const auto append = [&](std::int64_t frame, char status, int note) {
        const double ticks = static_cast<double>(frame) / rate * kTicksPerSecond;
        const auto at = std::max(static_cast<std::uint32_t>(std::lround(std::max(ticks, 0.0))), now);
        AppendLength(track, at - now);
        now = at;
        track += {status, static_cast<char>(note & 0x7F), kVelocity};
    };
    for (const DecidedNote& note : notes) {
        append(note.start, kOn, note.note);
        append(note.end, kOff, note.note);
    }
    track += kEnd;
    std::string bytes = "MThd";
    AppendBigEndian(bytes, 6, 4);
    AppendBigEndian(bytes, 0, 2);
    AppendBigEndian(bytes, 1, 2);
    AppendBigEndian(bytes, kTicksPerBeat, 2);
    bytes += "MTrk";
    AppendBigEndian(bytes, static_cast<std::uint32_t>(track.size()), 4);
    return bytes + track;
}

}  // namespace dsphost
