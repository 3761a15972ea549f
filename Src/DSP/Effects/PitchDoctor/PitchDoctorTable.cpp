#include "DSP/Effects/PitchDoctor/PitchDoctorTable.h"

#include <cmath>
#include <concepts>

#include "DSP/Effects/Parameters/ParameterText.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Spectrum/Tuner/TunerTemperaments.h"

namespace Corvo::DSP {
namespace {

using S = PitchDoctorSettings;

// Every word is a float with the plain value. `span` and `floor` of a row's storage are its range.

float PlainAt(const Storage& storage, float n) { return PlainOfReal(storage.store(storage, n)); }

// A normalised value that gives the word, near `guess`.
float Back(const Storage& storage, std::uint32_t word, double guess) {
    const float start = Limited(static_cast<float>(guess));
    for (float below = start, above = start, step = 0; step < 4; ++step) {
        if (storage.store(storage, below) == word) return below;
        if (storage.store(storage, above) == word) return above;
        below = Limited(std::nextafter(below, 0.0f));
        above = Limited(std::nextafter(above, 1.0f));
    }
    return start;
}

constexpr Storage Kept(Storage::Store store, Storage::Normalised normalised, float low, float high) {
    Storage storage{store, PlainOfReal, normalised};
    storage.map = {high - low, low};
    return storage;
}

std::uint32_t Word(double value) { return std::bit_cast<std::uint32_t>(static_cast<float>(value)); }
double Share(const Storage& storage, std::uint32_t word) {
    return (static_cast<double>(PlainOfReal(word)) - static_cast<double>(storage.map.floor)) /
           static_cast<double>(storage.map.span);
}
double Place(const Storage& storage, double share) {
    return static_cast<double>(storage.map.floor) + share * static_cast<double>(storage.map.span);
}

constexpr Storage Linear(float low, float high) {
    return Kept([](const Storage& s, float n) { return Word(Place(s, static_cast<double>(Limited(n)))); },
                [](const Storage& s, std::uint32_t word) { return Back(s, word, Share(s, word)); }, low,
                high);
}
constexpr Storage Squared(float high) {
    return Kept(
        [](const Storage& s, float n) {
            const double share = static_cast<double>(Limited(n));
            return Word(Place(s, share * share));
        },
        [](const Storage& s, std::uint32_t word) { return Back(s, word, std::sqrt(Share(s, word))); }, 0.0f,
        high);
}
constexpr Storage Whole(float low, float high) {
    return Kept(
        [](const Storage& s, float n) { return Word(std::round(Place(s, static_cast<double>(Limited(n))))); },
        [](const Storage& s, std::uint32_t word) { return Back(s, word, Share(s, word)); }, low, high);
}
// Whole hertz, by ratios.
constexpr Storage Logarithmic(float low, float high) {
    return Kept(
        [](const Storage& s, float n) {
            const auto least = static_cast<double>(s.map.floor), span = static_cast<double>(s.map.span);
            return Word(std::round(least * std::pow(1.0 + span / least, static_cast<double>(Limited(n)))));
        },
        [](const Storage& s, std::uint32_t word) {
            const auto least = static_cast<double>(s.map.floor), span = static_cast<double>(s.map.span);
            return Back(s, word,
                        std::log(static_cast<double>(PlainOfReal(word)) / least) / std::log1p(span / least));
        },
        low, high);
}
constexpr Storage kSwitch = Kept(
    [](const Storage&, float n) { return Word(n >= 0.5f ? 1.0 : 0.0); },
    [](const Storage&, std::uint32_t word) { return PlainOfReal(word) >= 0.5f ? 1.0f : 0.0f; }, 0.0f, 1.0f);
constexpr float kLastLowest = static_cast<float>(kLowestPitches.size() - 1);
constexpr Storage kLowest = Kept(
    [](const Storage&, float n) {
        return Word(static_cast<double>(
            kLowestPitches[static_cast<std::size_t>(std::lround(Limited(n) * kLastLowest))]));
    },
    [](const Storage&, std::uint32_t word) {
        // The one below or at the value.
        std::size_t place = 0;
        while (place + 1 < kLowestPitches.size() && PlainOfReal(word) >= kLowestPitches[place + 1]) ++place;
        return static_cast<float>(place) / kLastLowest;
    },
    kLowestPitches.front(), kLowestPitches.back());

constexpr Shown Plain(int decimals) {
    return {ParameterTexts::Number,
            [](const ParameterRow& row, const std::string& text) {
                return row.storage.normalised(row.storage, Word(static_cast<double>(ParseNumber(text))));
            },
            1.0, decimals};
}
constexpr Shown List(std::span<const Choice> choices) {
    return {[](const ParameterRow& row, double n) {
                const float plain = PlainAt(row.storage, static_cast<float>(n));
                return Widen(row.shown.choices[static_cast<std::size_t>(plain)].text);
            },
            ParameterTexts::ReadChoice,
            1.0,
            0,
            0,
            choices};
}
constexpr Shown kOnOff{[](const ParameterRow&, double n) { return FormatSwitch(n >= 0.5); },
                       ParameterTexts::ReadOnOff};

template <std::size_t N, std::invocable<std::size_t> Name>
constexpr std::array<Choice, N> Choices(Name name) {
    std::array<Choice, N> choices{};
    for (std::size_t i = 0; i < N; ++i)
        choices[i] = {name(i), static_cast<float>(i) / static_cast<float>(N - 1)};
    return choices;
}
template <std::size_t N>
constexpr std::array<Choice, N> Choices(const std::array<const char*, N>& texts) {
    return Choices<N>([&](std::size_t i) { return texts[i]; });
}
template <std::size_t N>
constexpr Storage ListOf(const std::array<Choice, N>&) {
    return Whole(0.0f, static_cast<float>(N - 1));
}

constexpr std::size_t kNotes = 12;
constexpr auto kRoots = Choices<kNotes>({"C", "C#", "D", "D#", "E", "F", "F#", "G", "G#", "A", "A#", "B"});

struct Mode {
    const char* name;
    std::array<bool, kNotes> notes;  // from the root up
};
// clang-format off
constexpr std::array kModes{
    Mode{"Chromatic",        {1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1}},
    Mode{"Major",            {1, 0, 1, 0, 1, 1, 0, 1, 0, 1, 0, 1}},
    Mode{"Natural minor",    {1, 0, 1, 1, 0, 1, 0, 1, 1, 0, 1, 0}},
    Mode{"Harmonic minor",   {1, 0, 1, 1, 0, 1, 0, 1, 1, 0, 0, 1}},
    Mode{"Melodic minor",    {1, 0, 1, 1, 0, 1, 0, 1, 0, 1, 0, 1}},
    Mode{"Major pentatonic", {1, 0, 1, 0, 1, 0, 0, 1, 0, 1, 0, 0}},
    Mode{"Minor pentatonic", {1, 0, 0, 1, 0, 1, 0, 1, 0, 0, 1, 0}},
    Mode{"Blues",            {1, 0, 0, 1, 0, 1, 1, 1, 0, 0, 1, 0}},
    Mode{"Dorian",           {1, 0, 1, 1, 0, 1, 0, 1, 0, 1, 1, 0}},
    Mode{"Phrygian",         {1, 1, 0, 1, 0, 1, 0, 1, 1, 0, 1, 0}},
    Mode{"Lydian",           {1, 0, 1, 0, 1, 0, 1, 1, 0, 1, 0, 1}},
    Mode{"Mixolydian",       {1, 0, 1, 0, 1, 1, 0, 1, 0, 1, 1, 0}},
    Mode{"Whole tone",       {1, 0, 1, 0, 1, 0, 1, 0, 1, 0, 1, 0}},
};
constexpr auto kModeChoices = Choices<kModes.size()>([](std::size_t i) { return kModes[i].name; });
constexpr auto kTemperamentChoices =
    Choices<kTemperaments>([](std::size_t i) -> const char* { return kTemperamentNames[i]; });
constexpr auto kLowestChoices = Choices<4>({"55", "75", "110", "160"});
constexpr Shown kLowestShown{ParameterTexts::Number, ParameterTexts::ReadChoice, 1.0, 0, 0, kLowestChoices};

consteval ParameterRow NoteSwitch(const wchar_t* label, std::size_t note) {
    return {label, L"", MPT_BOOL, kSwitch, kOnOff, WordAt(&S::notes, note), 0, {0, 1, 1}};
}

constexpr std::array<ParameterRow, 32> kRows{{
    // label                   unit         type       kept as                   shown as                   word of the settings       section, range, default
    {L"Scale root",            L"",          MPT_ENUM,  ListOf(kRoots),           List(kRoots),              WordAt(&S::scaleRoot),     0, {0, 11, 0}},
    {L"Scale mode",            L"",          MPT_ENUM,  ListOf(kModeChoices),     List(kModeChoices),        WordAt(&S::scaleMode),     0, {0, 12, 0}},
    NoteSwitch(L"Note C", 0), NoteSwitch(L"Note C#", 1), NoteSwitch(L"Note D", 2), NoteSwitch(L"Note D#", 3),
    NoteSwitch(L"Note E", 4), NoteSwitch(L"Note F", 5), NoteSwitch(L"Note F#", 6), NoteSwitch(L"Note G", 7),
    NoteSwitch(L"Note G#", 8), NoteSwitch(L"Note A", 9), NoteSwitch(L"Note A#", 10), NoteSwitch(L"Note B", 11),
    {L"Retune speed",          L"ms",        MPT_FLOAT, Squared(400.0f),          Plain(1),                  WordAt(&S::retune),        1, {0, 400, 20}},
    {L"Note transition time",  L"ms",        MPT_FLOAT, Squared(500.0f),          Plain(1),                  WordAt(&S::transition),    1, {0, 500, 40}},
    {L"Correction ratio",      L"%",         MPT_FLOAT, Linear(0.0f, 100.0f),     Plain(1),                  WordAt(&S::ratio),         1, {0, 100, 100}},
    {L"Tolerance",             L"cents",     MPT_FLOAT, Linear(0.0f, 50.0f),      Plain(1),                  WordAt(&S::tolerance),     1, {0, 50, 5}},
    {L"Keep vibrato",          L"%",         MPT_FLOAT, Linear(0.0f, 100.0f),     Plain(1),                  WordAt(&S::keepVibrato),   1, {0, 100, 50}},
    {L"Hysteresis",            L"cents",     MPT_FLOAT, Linear(0.0f, 50.0f),      Plain(1),                  WordAt(&S::hysteresis),    1, {0, 50, 25}},
    {L"Note hold",             L"ms",        MPT_FLOAT, Linear(0.0f, 100.0f),     Plain(1),                  WordAt(&S::hold),          1, {0, 100, 25}},
    {L"Formants kept",         L"%",         MPT_FLOAT, Linear(0.0f, 100.0f),     Plain(1),                  WordAt(&S::formantsKept),  2, {0, 100, 100}},
    {L"Formant shift",         L"semitones", MPT_FLOAT, Linear(-12.0f, 12.0f),    Plain(2),                  WordAt(&S::formantShift),  2, {-12, 12, 0}},
    {L"Transpose",             L"semitones", MPT_INT,   Whole(-12.0f, 12.0f),     Plain(0),                  WordAt(&S::transpose),     2, {-12, 12, 0}},
    {L"Offset",                L"cents",     MPT_FLOAT, Linear(-100.0f, 100.0f),  Plain(1),                  WordAt(&S::offset),        2, {-100, 100, 0}},
    {L"Lowest pitch",          L"Hz",        MPT_ENUM,  kLowest,                  kLowestShown,              WordAt(&S::lowest),        2, {55, 160, 75}},
    {L"Highest pitch",         L"Hz",        MPT_FLOAT, Logarithmic(300, 1400),   Plain(0),                  WordAt(&S::highest),       2, {300, 1400, 1400}},
    {L"Silence",               L"dB",        MPT_FLOAT, Linear(-90.0f, -40.0f),   Plain(1),                  WordAt(&S::silence),       2, {-90, -40, -70}},
    {L"Follow tuner",          L"",          MPT_BOOL,  kSwitch,                  kOnOff,                    WordAt(&S::followTuner),   3, {0, 1, 0}},
    {L"Concert pitch",         L"Hz",        MPT_FLOAT, Linear(400.0f, 480.0f),   Plain(1),                  WordAt(&S::concertPitch),  3, {400, 480, 440}},
    {L"Temperament",           L"",          MPT_ENUM,  ListOf(kTemperamentChoices), List(kTemperamentChoices), WordAt(&S::temperament), 3, {0, 10, 0}},
    {L"Mix",                   L"%",         MPT_FLOAT, Linear(0.0f, 100.0f),     Plain(1),                  WordAt(&S::mix),           4, {0, 100, 100}},
}};
static_assert(kRows[kLowestPitchParameter].word == WordAt(&S::lowest));
constexpr int kRetune = 14, kRatio = 16;
// clang-format on

constexpr S kDefaults = [] {
    std::array<float, kRows.size()> words{};
    for (const auto& row : kRows) words[row.word] = row.range.neutral;
    return std::bit_cast<S>(words);
}();

// The defaults with some changes.
struct Preset {
    const char* name;
    void (*change)(S& settings);
};
constexpr std::array kPresets{
    Preset{"(Default)", [](S&) {}},
    Preset{"Natural", [](S& s) { s.retune = 40, s.transition = 80, s.tolerance = 10, s.keepVibrato = 100; }},
    Preset{"Gentle", [](S& s) { s.ratio = 60, s.retune = 80, s.tolerance = 10, s.keepVibrato = 100; }},
    Preset{"Tight", [](S& s) { s.retune = 10, s.transition = 20, s.tolerance = 0, s.keepVibrato = 0; }},
    Preset{"Hard tune",
           [](S& s) {
               s.retune = 0, s.transition = 0, s.ratio = 100, s.tolerance = 0, s.keepVibrato = 0;
               s.hysteresis = 10, s.hold = 10;
           }},
    Preset{"Low voice", [](S& s) { s.lowest = 55, s.highest = 500; }},
    Preset{"High voice, low latency", [](S& s) { s.lowest = 160; }},
    Preset{"Octave down, deep", [](S& s) { s.transpose = -12, s.formantShift = -3; }},
    Preset{"Formants up", [](S& s) { s.ratio = 0, s.formantShift = 4; }},
    Preset{"Just intonation", [](S& s) { s.temperament = 4, s.scaleMode = 1; }},
};

// Where the notes C .. B stand, in cents above C, with A at 900.
std::array<double, kNotes> NoteCents(const std::array<double, kTableNotes>& fromA, std::size_t tonic) {
    constexpr std::size_t kA = 9;
    std::array<double, kNotes> cents{};
    const auto leans = [&](std::size_t note) {  // off equal temperament, by the table's names
        const std::size_t entry = (note + kNotes - kA) % kNotes;
        return 1200.0 * std::log2(fromA[entry] / fromA[0]) - 100.0 * static_cast<double>(entry);
    };
    for (std::size_t note = 0; note < kNotes; ++note)
        cents[note] = 100.0 * static_cast<double>(note) + leans((note + kNotes - tonic) % kNotes) -
                      leans((kA + kNotes - tonic) % kNotes);
    return cents;
}

PitchScale ScaleOf(const S& settings) {
    PitchScale scale;
    const auto root = static_cast<std::size_t>(settings.scaleRoot);
    const auto& mode = kModes[static_cast<std::size_t>(settings.scaleMode)].notes;
    for (std::size_t note = 0; note < kNotes; ++note)
        scale.allowed[note] = settings.notes[note] >= 0.5f && mode[(note + kNotes - root) % kNotes];
    std::array<double, kTableNotes> fromA;
    constexpr double kOctavesToConcert = 4.0;  // the tuner's base is two octaves below
    if (settings.followTuner >= 0.5f) {
        for (int i = 0; i < kTableNotes; ++i) fromA[static_cast<std::size_t>(i)] = Tuner::GetNoteFrequency(i);
        scale.concertHz = kOctavesToConcert * fromA[0];
        scale.cents = NoteCents(fromA, 0);
    } else {
        scale.concertHz = static_cast<double>(settings.concertPitch);
        fromA = TemperedNotes(static_cast<int>(settings.temperament), scale.concertHz);
        scale.cents = NoteCents(fromA, root);
    }
    return scale;
}

}  // namespace

const EffectTable& PitchDoctorTable() {
    static const EffectTable table = [] {
        EffectTable made{.name = "Cantrix",
                         .image = "builtinCantrix.png",
                         .icon = "BuiltinPlugins/Cantrix@3x.png",
                         .rows = kRows,
                         .chunk = {.words = kWordsOf<S>},
                         .pads = {{"Default", {kRetune}, {kRatio}}},
                         .sections = {"Scale", "Correction", "Voice", "Tuning", "Output"},
                         .inputGuard = InputGuard::EveryFormat};
        for (const auto& preset : kPresets) {
            S settings = kDefaults;
            preset.change(settings);
            made.presets.push_back({preset.name, WordsOf(settings)});
        }
        return made;
    }();
    return table;
}

PitchDoctorSettings WithinRanges(const PitchDoctorSettings& settings) {
    auto words = std::bit_cast<std::array<std::uint32_t, kRows.size()>>(settings);
    for (const auto& row : kRows) {
        auto& word = words[row.word];
        word = row.storage.store(row.storage, row.storage.normalised(row.storage, word));
    }
    return std::bit_cast<S>(words);
}

std::size_t LowestPitchOf(const PitchDoctorSettings& settings) {
    std::size_t place = 0;
    while (place + 1 < kLowestPitches.size() && settings.lowest >= kLowestPitches[place + 1]) ++place;
    return place;
}

PitchDoctorVoice VoiceOf(const PitchDoctorSettings& settings) {
    const auto plain = [](float value) { return static_cast<double>(value); };
    PitchDoctorVoice voice;
    voice.scale = ScaleOf(settings);
    voice.control = {.retune = plain(settings.retune) / 1000.0,
                     .transition = plain(settings.transition) / 1000.0,
                     .ratio = plain(settings.ratio) / 100.0,
                     .tolerance = plain(settings.tolerance),
                     .keepVibrato = plain(settings.keepVibrato) / 100.0,
                     .hysteresis = plain(settings.hysteresis),
                     .hold = plain(settings.hold) / 1000.0,
                     .shift = 100.0 * plain(settings.transpose) + plain(settings.offset)};
    voice.grains = {.formantsKept = plain(settings.formantsKept) / 100.0,
                    .formantRatio = std::exp2(plain(settings.formantShift) / 12.0)};
    voice.highestHz = plain(settings.highest);
    voice.silence = plain(settings.silence);
    voice.mix = plain(settings.mix) / 100.0;
    return voice;
}

}  // namespace Corvo::DSP
