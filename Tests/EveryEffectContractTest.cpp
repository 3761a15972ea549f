#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <stdexcept>
#include <utility>

#include "DSP/Effects/Chorus/Chorus.h"
#include "DSP/Effects/Echo/Echo.h"
#include "DSP/Effects/PitchShift/PitchShift.h"
#include "DSP/Effects/Reverb/Reverb.h"
#include "DSP/Effects/Tremolo/Autovol.h"
#include "Support/EveryEffect.h"

using namespace TestSupport;

// What hosts and saved projects rely on: every parameter's name, words, texts and place in the chunk, and
// every preset. Written down by hand; a change of the library that fails here breaks projects.
namespace {

using enum Corvo::EffectParameterType;

// A word of the settings, an integer or a float.
struct Word {
    constexpr Word(int value) : bits(std::bit_cast<std::uint32_t>(value)), plain(static_cast<float>(value)) {}
    constexpr Word(double value) : Word(static_cast<float>(value)) {}
    constexpr Word(float value) : bits(std::bit_cast<std::uint32_t>(value)), plain(value) {}
    std::uint32_t bits;
    float plain;
};
// A value that the chunk does not keep.
constexpr Word Unkept(int value) {
    Word word(value);
    word.bits = 0;
    return word;
}

// One parameter, or a pair of them.
struct Row {
    const wchar_t *label, *unit;  // the label of the right one ends in " R"
    Corvo::EffectParameterType type;
    std::array<std::size_t, 2> at;  // bytes in the chunk; a second place of 0 means that it is no pair
    std::array<Word, 3> words;      // at normalised 0, 0.5 and 1
    std::array<const wchar_t*, 3> texts;
    float neutral = 0.5f;
    double step = 0.0;  // where the chunk holds the word times this as a double

    std::size_t Sides() const { return at[1] > 0 ? 2 : 1; }
    std::wstring Label(std::size_t side) const {
        std::wstring whole = label;
        if (side == 1 && whole.ends_with(L" L")) whole.back() = L'R';
        return whole;
    }
    std::wstring Name() const {
        const std::wstring whole = label;
        return whole.ends_with(L" L") || whole.ends_with(L" R") ? whole.substr(0, whole.size() - 2) : whole;
    }
};

using Rows = std::vector<Row>;

// The same row for every label, each so many bytes further on.
Rows Bands(std::size_t bytes, std::initializer_list<const wchar_t*> labels, Row row) {
    Rows rows;
    for (const auto* const label : labels) {
        row.label = label;
        rows.push_back(row);
        row.at[0] += bytes;
    }
    return rows;
}
Rows Joined(Rows rows, const Rows& second, const Rows& third) {
    for (const auto* more : {&second, &third}) rows.insert(rows.end(), more->begin(), more->end());
    return rows;
}

enum class Leading { None, Kept, Version1, Version1AndCount };

struct Contract {
    const char *name, *image, *icon;  // null where any will do
    int chunkSize;
    Leading leading;
    // Of the layout in which a word has 8 bytes; 0 where there was none or it is tested apart.
    std::size_t oldWords;
    Rows rows;
    struct {
        int count = 0;
        std::uint64_t sum = 0xCBF29CE484222325;  // FNV-1a of names and chunks, of an own record's of names
    } presets{};
    int defaultPreset = 0;
    bool reversed = false, paired = false;
    bool ownRecord = false;   // settings of another kind, whose values are tested apart
    bool plainRange = false;  // the range is that of the words, not 0..1
    std::vector<std::string> sections{}, pads{};
};

// clang-format off
const Contract kContracts[] = {
    {.name = "Gain", .image = "", .icon = "",
     .chunkSize = 20, .leading = Leading::None, .oldWords = 0,
     .rows = {
        {L"Gain",         L"dB", Continuous, {0},  {0.0001, 1.0, 10.0}, {L"-Inf. dB", L"0.0 dB", L"20.0 dB"}},
        {L"Stereo width", L"",   Continuous, {4},  {0.0, 1.0, 2.0},     {L"0.00 ", L"1.00 ", L"2.00 "}},
        {L"Pan",          L"",   Continuous, {8},  {-1.0, 0.0, 1.0},    {L"-1.00 ", L"0.00 ", L"1.00 "}},
        {L"Flip phase L", L"",   Switch,     {12}, {0.0, 0.5, 1.0},     {L"Off", L"On", L"On"}, 0.0f},
        {L"Flip phase R", L"",   Switch,     {16}, {0.0, 0.5, 1.0},     {L"Off", L"On", L"On"}, 0.0f}},
     .plainRange = true},
    {.name = "Compressor", .image = "", .icon = "",
     .chunkSize = 16112, .leading = Leading::Kept, .oldWords = 0,
     .rows = {
        {L"Attack L",            L"ms", Continuous, {4, 8},         {1, 50000, 100000}, {L"0.01 ms", L"500.00 ms", L"1000.00 ms"}},
        {L"Release L",           L"ms", Continuous, {12, 16},       {1, 50000, 100000}, {L" 0.0 ms", L"500.0 ms", L"1000.0 ms"}},
        {L"Out gain L",          L"dB", Continuous, {20, 24},       {-960, -380, 200},  {L"-Inf. dB", L"-38.0 dB", L"20.0 dB"}},
        {L"Threshold L",         L"dB", Continuous, {16104, 16104}, {-800, -405, -10},  {L"-Inf. dB", L"-40.5 dB", L"-1.0 dB"}},
        {L"Ratio L",             L"",   Continuous, {16108, 16108}, {0, 125, 251},      {L"1.0:1 ", L"1.9:1 ", L"Inf.:1 "}},
        {L"Stereo Link",         L"",   Switch,     {28, 28},       {0, 1, 1},          {L"Off ", L"On ", L"On "}},
        {L"Auto Make-up Gain",   L"",   Switch,     {32, 32},       {0, 1, 1},          {L"Off ", L"On ", L"On "}},
        {L"Monitor sidechain L", L"",   Switch,     {36, 36},       {0, 1, 1},          {L"Off ", L"On ", L"On "}}},
     .presets = {42, 0xB44C6D55FEBE3408},
     .defaultPreset = 1, .ownRecord = true},
    {.name = "Tremolo", .image = "builtinTremolo.png", .icon = "BuiltinPlugins/Tremolo@3x.png",
     .chunkSize = 92, .leading = Leading::Kept, .oldWords = 22,
     .rows = {
        {L"Depth L",        L"%",  Continuous, {4, 8},   {0, 500, 1000},    {L"0.0 %", L"50.0 %", L"100.0 %"}},
        {L"Frequency L",    L"Hz", Continuous, {20, 24}, {0, 1500, 3000},   {L"0.0 Hz", L"15.0 Hz", L"30.0 Hz"}},
        {L"Mix L",          L"%",  Continuous, {12, 16}, {0, 500, 1000},    {L"0.0 %", L"50.0 %", L"100.0 %"}},
        {L"Out gain L",     L"dB", Continuous, {76, 80}, {-960, -380, 200}, {L"-Inf. dB", L"-38.0 dB", L"20.0 dB"}},
        {L"Invert Phase L", L"",   List,       {36, 40}, {0, 0, 1},         {L"Disabled ", L"Enabled ", L"Enabled "}, 0.0f}},
     .presets = {8, 0xE2AD47C6D0F66215},
     .pads = {"Default"}},
    {.name = "Echo", .image = "builtinEcho.png", .icon = "BuiltinPlugins/Echo@3x.png",
     .chunkSize = 100, .leading = Leading::Kept, .oldWords = 22,
     .rows = {
        {L"Depth L",      L"",   Continuous, {20, 24}, {0, 5000, 10000},  {L"20 ms", L"89 ms", L"4999 ms"}},
        {L"Depth mode L", L"",   List,       {92},     {0, 2, 4},         {L"Time (linear)", L"Tempo (straight)", L"Tempo (dotted)"}},
        {L"Depth mode R", L"",   List,       {96},     {1, 1, 1},         {L"Time (linear)", L"Tempo (straight)", L"Tempo (dotted)"}},
        {L"Decay L",      L"dB", Continuous, {4, 8},   {-300, -100, 100}, {L"-Inf. dB", L"-10.0 dB", L"10.0 dB"}},
        {L"Delay L",      L"dB", Continuous, {28, 32}, {-300, -100, 100}, {L"-30.0 dB", L"-10.0 dB", L"10.0 dB"}},
        {L"Mix L",        L"%",  Continuous, {12, 16}, {0, 1000, 2000},   {L"0.0 %", L"100.0 %", L"200.0 %"}},
        {L"Out gain L",   L"dB", Continuous, {76, 80}, {-960, -380, 200}, {L"-Inf. dB", L"-38.0 dB", L"20.0 dB"}}},
     .presets = {10, 0x189180F5EC1687D2},
     .sections = {"Delays", "Output"}, .pads = {"Default"}},
    {.name = "Chorus", .image = "builtinChorus.png", .icon = "BuiltinPlugins/Chorus.png",
     .chunkSize = 92, .leading = Leading::Kept, .oldWords = 22,
     .rows = {
        {L"Delay L",     L"ms", Continuous, {12, 16}, {0, 5000, 10000},  {L"0.0 ms", L"500.0 ms", L"1000.0 ms"}},
        {L"Frequency L", L"Hz", Continuous, {4, 8},   {0, 150, 300},     {L"0.00 Hz", L"1.50 Hz", L"3.00 Hz"}},
        {L"Depth L",     L"%",  Continuous, {36, 40}, {0, 500, 1000},    {L"0.0 %", L"50.0 %", L"100.0 %"}},
        {L"Wet level L", L"dB", Continuous, {20, 24}, {-960, -430, 100}, {L"-Inf. dB", L"-43.0 dB", L"10.0 dB"}},
        {L"Dry level L", L"dB", Continuous, {28, 32}, {-960, -430, 100}, {L"-Inf. dB", L"-43.0 dB", L"10.0 dB"}}},
     .presets = {11, 0x09932BE28C3C5B12},
     .pads = {"Default", "Choruses", "Flangers"}},
    {.name = "Phaser", .image = nullptr, .icon = nullptr,
     .chunkSize = 32, .leading = Leading::Version1, .oldWords = 0,
     .rows = {
        {L"Rate",              L"Hz", Continuous, {4},  {0.0, 0.5, 1.0},        {L"0.00 Hz", L"3.00 Hz", L"6.00 Hz"}},
        {L"Feedback",          L"%",  Continuous, {8},  {0.0, 0.5, 1.0},        {L"0 %", L"50 %", L"100 %"}},
        {L"Wet",               L"%",  Continuous, {12}, {0.0, 0.5, 1.0},        {L"0 %", L"50 %", L"100 %"}},
        {L"Minimum frequency", L"Hz", Continuous, {20}, {0.0, 5000.0, 10000.0}, {L"0 Hz", L"5000 Hz", L"10000 Hz"}},
        {L"Maximum frequency", L"Hz", Continuous, {16}, {0.0, 5000.0, 10000.0}, {L"0 Hz", L"5000 Hz", L"10000 Hz"}},
        {L"Stereo width",      L"%",  Continuous, {24}, {0.0, 0.5, 1.0},        {L"0 %", L"50 %", L"100 %"}},
        {L"Stages",            L"",   Continuous, {28}, {1, 15, 30},            {L"1", L"15", L"30"}}},
     .presets = {15, 0x9D5EDA3B6C1501D5},
     .pads = {"Default"}},
    {.name = "Reverb", .image = nullptr, .icon = nullptr,
     .chunkSize = 76, .leading = Leading::Kept, .oldWords = 18,
     .rows = {
        {L"Pre-delay L",                  L"ms", Continuous, {4, 8},   {0, 1000, 2000},   {L"0.0 ms", L"100.0 ms", L"200.0 ms"}},
        {L"Mix with early reflections L", L"dB", Continuous, {12, 16}, {0, 1000, 2000},   {L"0.0 dB", L"50.0 dB", L"100.0 dB"}},
        {L"Length L",                     L"ms", Continuous, {20, 24}, {0, 5000, 10000},  {L"0 ms", L"5000 ms", L"10000 ms"}},
        {L"Damping L",                    L"%",  Continuous, {44, 48}, {0, 1250, 2500},   {L"0.0 %", L"50.0 %", L"100.0 %"}},
        {L"Early reflections L",          L"",   Continuous, {52, 56}, {0, 2500, 5000},   {L"0.00", L"2.50", L"5.00"}},
        {L"Room size L",                  L"",   Continuous, {60, 64}, {1, 2000, 4000},   {L"0.00", L"2.00", L"4.00"}},
        {L"Wet level L",                  L"dB", Continuous, {28, 32}, {-450, -175, 100}, {L"-Inf. dB", L"-17.5 dB", L"10.0 dB"}},
        {L"Dry level L",                  L"dB", Continuous, {36, 40}, {-450, -175, 100}, {L"-Inf. dB", L"-17.5 dB", L"10.0 dB"}}},
     .presets = {17, 0x1B59544A620F8C0D},
     .reversed = true},
    {.name = "Valvex", .image = "builtinTube.png", .icon = "BuiltinPlugins/valvex.png",
     .chunkSize = 44, .leading = Leading::Kept, .oldWords = 0,
     .rows = {
        {L"Boost L",        L"Amount ", Continuous, {4, 8},   {0.0, 0.5, 1.0}, {L"None | 0", L"Tiny | 50", L"Strong | 100"}},
        {L"Drive L",        L"Amount ", Continuous, {12, 16}, {0.0, 0.5, 1.0}, {L"Easy | 0", L"Angry | 50", L"Furious | 100"}},
        {L"Tone L",         L" ",       Continuous, {20, 24}, {0.0, 0.5, 1.0}, {L"Obscure | 0", L"Bright | 50", L"Holy | 100"}},
        {L"Function L",     L"Type",    List,       {28, 32}, {0.0, 0.5, 1.0}, {L"Martens", L"Doidic A.", L"Araya-S."}},
        {L"Oversampling L", L"x ",      List,       {36, 40}, {0.0, 0.5, 1.0}, {L"1 x ", L"4 x ", L"16 x "}}},
     .presets = {24, 0x67D2D1C77C3DA038},
     .pads = {"Guitar", "Guitar - Clean", "Guitar - Heavy", "Guitar - Heavier", "Drums", "Vocal"}},
    {.name = "Cantrix", .image = "builtinCantrix.png", .icon = "BuiltinPlugins/Cantrix@3x.png",
     .chunkSize = 136, .leading = Leading::Version1AndCount, .oldWords = 0,
     .rows = Joined({
        {L"Scale root", L"", List, {8},  {0.0, 6.0, 11.0}, {L"C", L"F#", L"B"}, 0.0f},
        {L"Scale mode", L"", List, {12}, {0.0, 6.0, 12.0}, {L"Chromatic", L"Minor pentatonic", L"Whole tone"}, 0.0f},
        }, Bands(4, {L"Note C", L"Note C#", L"Note D", L"Note D#", L"Note E", L"Note F", L"Note F#", L"Note G", L"Note G#", L"Note A", L"Note A#", L"Note B"},
              {L"", L"", Switch, {16}, {0.0, 1.0, 1.0}, {L"Off", L"On", L"On"}, 1.0f}), {
        {L"Retune speed",         L"ms",        Continuous, {64},  {0.0, 100.0, 400.0},     {L"0.0 ms", L"100.0 ms", L"400.0 ms"}, 0.2236068f},
        {L"Note transition time", L"ms",        Continuous, {68},  {0.0, 125.0, 500.0},     {L"0.0 ms", L"125.0 ms", L"500.0 ms"}, 0.28284273f},
        {L"Correction ratio",     L"%",         Continuous, {72},  {0.0, 50.0, 100.0},      {L"0.0 %", L"50.0 %", L"100.0 %"}, 1.0f},
        {L"Tolerance",            L"cents",     Continuous, {76},  {0.0, 25.0, 50.0},       {L"0.0 cents", L"25.0 cents", L"50.0 cents"}, 0.1f},
        {L"Keep vibrato",         L"%",         Continuous, {80},  {0.0, 50.0, 100.0},      {L"0.0 %", L"50.0 %", L"100.0 %"}},
        {L"Hysteresis",           L"cents",     Continuous, {84},  {0.0, 25.0, 50.0},       {L"0.0 cents", L"25.0 cents", L"50.0 cents"}},
        {L"Note hold",            L"ms",        Continuous, {88},  {0.0, 50.0, 100.0},      {L"0.0 ms", L"50.0 ms", L"100.0 ms"}, 0.25f},
        {L"Formants kept",        L"%",         Continuous, {92},  {0.0, 50.0, 100.0},      {L"0.0 %", L"50.0 %", L"100.0 %"}, 1.0f},
        {L"Formant shift",        L"semitones", Continuous, {96},  {-12.0, 0.0, 12.0},      {L"-12.00 semitones", L"0.00 semitones", L"12.00 semitones"}},
        {L"Transpose",            L"semitones", Continuous, {100}, {-12.0, 0.0, 12.0},      {L"-12 semitones", L"0 semitones", L"12 semitones"}},
        {L"Offset",               L"cents",     Continuous, {104}, {-100.0, 0.0, 100.0},    {L"-100.0 cents", L"0.0 cents", L"100.0 cents"}},
        {L"Lowest pitch",         L"Hz",        List,       {108}, {55.0, 110.0, 160.0},    {L"55 Hz", L"110 Hz", L"160 Hz"}, 1 / 3.0f},
        {L"Highest pitch",        L"Hz",        Continuous, {112}, {300.0, 648.0, 1400.0},  {L"300 Hz", L"648 Hz", L"1400 Hz"}, 1.0f},
        {L"Silence",              L"dB",        Continuous, {116}, {-90.0, -65.0, -40.0},   {L"-90.0 dB", L"-65.0 dB", L"-40.0 dB"}, 0.4f},
        {L"Follow tuner",         L"",          Switch,     {120}, {0.0, 1.0, 1.0},         {L"Off", L"On", L"On"}, 0.0f},
        {L"Concert pitch",        L"Hz",        Continuous, {124}, {400.0, 440.0, 480.0},   {L"400.0 Hz", L"440.0 Hz", L"480.0 Hz"}},
        {L"Temperament",          L"",          List,       {128}, {0.0, 5.0, 10.0},        {L"Equal", L"Just (Fogliano I)", L"Vallotti"}, 0.0f},
        {L"Mix",                  L"%",         Continuous, {132}, {0.0, 50.0, 100.0},      {L"0.0 %", L"50.0 %", L"100.0 %"}, 1.0f}}),
     .presets = {10, 0x6F1FBE11B4299CAB},
     .sections = {"Scale", "Correction", "Voice", "Tuning", "Output"}, .pads = {"Default"}},
    {.name = "Pitch Shift", .image = "builtinPitch.png", .icon = "BuiltinPlugins/PitchShift@3x.png",
     .chunkSize = 92, .leading = Leading::Kept, .oldWords = 0,
     .rows = {{L"Pitch L", L"semitones", Continuous, {4, 8}, {10, 3005, 6000},
               {L"-98.7 semitones - 0.3%", L"0.0 semitones - 100.2%", L"12.0 semitones - 200.0%"}}},
     .presets = {7, 0x588B90CAFB3BA24F},
     .paired = true},
    {.name = "Denoiser", .image = "builtinDenoiser.png", .icon = "BuiltinPlugins/Denoiser@3x.png",
     .chunkSize = 252, .leading = Leading::Kept, .oldWords = 0,
     .rows = Joined({
        {L"Profile", L"", List, {12}, {0, 1, 2}, {L"Learned", L"Following", L"Adaptive"}, 0.5f, 1},
        {L"Learn", L"", Switch, {20}, {0, Unkept(1), Unkept(1)}, {L"Off ", L"On ", L"On "}, 0.5f, 1},
        {L"Clear profile", L"", Switch, {28}, {0, 0, 0}, {L"Off ", L"On ", L"On "}, 0.5f, 1},
        {L"Reduction", L"dB", Continuous, {36}, {0, 300, 600}, {L"0.0 dB", L"30.0 dB", L"60.0 dB"}, 0.5f, 0.1},
        {L"Sensitivity", L"dB", Continuous, {44}, {-60, 0, 60}, {L"-6.0 dB", L"0.0 dB", L"6.0 dB"}, 0.5f, 0.1},
        {L"Detail", L"dB", Continuous, {52}, {60, 120, 180}, {L"6.0 dB", L"12.0 dB", L"18.0 dB"}, 0.5f, 0.1},
        {L"Residual whitening", L"%", Continuous, {60}, {0, 500, 1000}, {L"0.0 %", L"50.0 %", L"100.0 %"}, 0.5f, 0.1},
        {L"Keep masked noise", L"dB", Continuous, {68}, {0, 150, 300}, {L"0.0 dB", L"15.0 dB", L"Off"}, 0.5f, 0.1},
        {L"FFT size", L"", List, {76}, {0, 1, 3}, {L"512 + 2048 + 8192", L"512 + 4096", L"1024"}, 0.5f, 1},
        {L"Material", L"", List, {84}, {0, 0, 1}, {L"Speech", L"Speech", L"Music"}, 0.5f, 1},
        {L"Listen", L"", List, {92}, {0, 0, 1}, {L"Output", L"Output", L"Residue"}, 0.5f, 1},
        {L"Mix", L"%", Continuous, {100}, {0, 500, 1000}, {L"0.0 %", L"50.0 %", L"100.0 %"}, 0.5f, 0.1}},
        Bands(8, {L"Gain 63 Hz", L"Gain 125 Hz", L"Gain 250 Hz", L"Gain 500 Hz", L"Gain 1 kHz", L"Gain 2 kHz", L"Gain 4 kHz", L"Gain 8 kHz"},
              {L"", L"dB", Continuous, {108}, {-120, 0, 120}, {L"-12.0 dB", L"0.0 dB", L"12.0 dB"}, 0.5f, 0.1}),
        Bands(8, {L"Range 63 Hz", L"Range 125 Hz", L"Range 250 Hz", L"Range 500 Hz", L"Range 1 kHz", L"Range 2 kHz", L"Range 4 kHz", L"Range 8 kHz"},
              {L"", L"dB", Continuous, {172}, {0, 300, 600}, {L"0.0 dB", L"30.0 dB", L"60.0 dB"}, 0.5f, 0.1})),
     .presets = {10, 0x6379DADD34EAE13A},
     .sections = {"Profile", "Reduction", "Engine", "Gains", "Ranges"}},
};
// clang-format on

// Word w is w + 5; the bytes above the lower four do not count.
Bytes CountingChunk(std::size_t leading, std::size_t words, std::size_t width) {
    Bytes chunk(leading + words * width, 0xEE);
    for (std::size_t at = 0; at < leading; ++at) chunk[at] = static_cast<std::uint8_t>(9 + at);
    for (std::size_t i = 0; i < words; ++i) Put(chunk, leading + i * width, static_cast<int>(i) + 5);
    return chunk;
}

class EveryEffectContract : public EveryEffect {
protected:
    const Contract& Promised() const {
        const auto name = GetParam().make()->GetName();
        const auto found =
            std::ranges::find_if(kContracts, [&](const auto& row) { return row.name == name; });
        if (found == std::end(kContracts)) throw std::invalid_argument(name + " has no contract");
        return *found;
    }
    // Calls `check` with every real index, its row, the side, and its external index.
    template <typename Check>
    void ForEachParameter(Check check) const {
        const auto& contract = Promised();
        int count = 0;
        for (const auto& row : contract.rows) count += static_cast<int>(row.Sides());
        int real = 0;
        for (const auto& row : contract.rows)
            for (std::size_t side = 0; side < row.Sides(); ++side, ++real)
                check(row, side, real,
                      contract.paired     ? real / 2
                      : contract.reversed ? count - 1 - real
                                          : real);
    }
};

// The effects that had an older layout offer it by their own type.
template <typename... Effects>
bool FitsOldChunkOf(CorvoEffectBase& effect, const Bytes& chunk) {
    const auto fits = [&](auto* typed) { return typed && typed->FitsOldChunk(chunk); };
    return (fits(dynamic_cast<Effects*>(&effect)) || ...);
}
bool FitsOldChunk(CorvoEffectBase& effect, const Bytes& chunk) {
    using namespace Corvo::DSP;
    return FitsOldChunkOf<Autovol, Chorus, Echo, Reverb, PitchShift>(effect, chunk);
}

}  // namespace

INSTANTIATE_TEST_SUITE_P(All, EveryEffectContract, testing::ValuesIn(AllEffects()), EffectTestName);

// Catches a wrong span, floor, unit or place in the chunk.
TEST_P(EveryEffectContract, StoresAndShowsEveryParameter) {
    const auto& contract = Promised();
    ForEachParameter([&](const Row& row, std::size_t side, int real, int external) {
        for (std::size_t i = 0; i < 3; ++i) {
            SCOPED_TRACE("parameter " + std::to_string(real) + ", value " + std::to_string(i));
            const auto effect = Make();
            const float value = 0.5f * static_cast<float>(i);
            effect->SetParam(external, value, false);
            if (row.step != 0.0)
                EXPECT_EQ(At<double>(Chunk(*effect), row.at[side]),
                          row.words[i].bits == 0 ? 0.0 : static_cast<double>(row.words[i].plain) * row.step);
            else
                EXPECT_EQ(At<std::uint32_t>(Chunk(*effect), row.at[side]), row.words[i].bits);
            EXPECT_EQ(effect->GetParamPlain(real), contract.ownRecord ? 0.0f : row.words[i].plain);
            EXPECT_EQ(effect->GetParameterFormattedText(external, value), row.texts[i]);
        }
    });
}

// Names and ranges; the choices select what they name.
TEST_P(EveryEffectContract, DescribesItselfAndItsParameters) {
    const auto& contract = Promised();
    const auto effect = Make();
    if (contract.image) {
        EXPECT_EQ(effect->GetImage(), contract.image);
        EXPECT_EQ(effect->GetPluginIconPath(), contract.icon);
    }
    EXPECT_EQ(effect->GetParamUiSections(), contract.sections);
    auto* const recorded = dynamic_cast<Corvo::DSP::CorvoEffect*>(effect.get());
    int count = 0;
    ForEachParameter([&](const Row& row, std::size_t side, int real, int external) {
        SCOPED_TRACE(real);
        ++count;
        const auto description = effect->Describe(external);
        const auto wide = [](const std::string& text) { return std::wstring(text.begin(), text.end()); };
        EXPECT_EQ(description.real, contract.paired ? real / 2 * 2 : real);
        EXPECT_EQ(wide(description.name), row.Name());
        EXPECT_EQ(wide(description.unit), row.unit);
        EXPECT_EQ(description.type, row.type);
        EXPECT_EQ(description.neutral, row.neutral);
        EXPECT_EQ(wide(description.label), contract.paired ? row.Name() : row.Label(side));
        EXPECT_EQ(description.choices.empty(), row.type == Continuous);
        float last = -1.0f;
        for (const auto& [text, value] : description.choices) {
            EXPECT_TRUE(effect->GetParameterFormattedText(external, value).starts_with(wide(text))) << text;
            EXPECT_GT(value, std::exchange(last, value));
        }
        if (!recorded) return;
        const auto& record = recorded->GetParametersInfo()[real];
        EXPECT_EQ(record.szLabel, row.Label(side));
        EXPECT_EQ(record.mopCaps, contract.plainRange ? 0u : 1u);
        EXPECT_EQ(record.mpdMinValue, contract.plainRange ? row.words[0].plain : 0.0f);
        EXPECT_EQ(record.mpdMaxValue, contract.plainRange ? row.words[2].plain : 1.0f);
    });
    EXPECT_EQ(effect->GetParamCountReal(), count);
    EXPECT_EQ(effect->GetAllSupportedParameterIds().back(), count - 1);
    EXPECT_EQ(effect->GetParamCount(), contract.paired ? count / 2 : count);
}

TEST_P(EveryEffectContract, HasItsPresets) {
    const auto& contract = Promised();
    const auto effect = GetParam().make();
    EXPECT_EQ(effect->GetDefaultPreset(), contract.defaultPreset);
    EXPECT_EQ(effect->GetSettingsChunkSize(), contract.chunkSize);
    ASSERT_EQ(effect->NumPresets(), contract.presets.count);
    auto sum = Contract{}.presets.sum;
    const auto add = [&](const auto& bytes) {
        for (const auto byte : bytes) sum = (sum ^ static_cast<std::uint8_t>(byte)) * 0x100000001B3;
    };
    for (int preset = 0; preset < effect->NumPresets(); ++preset) {
        effect->SetPreset(preset);
        add(effect->GetPresetName(preset));
        if (!contract.ownRecord) add(Chunk(*effect));
        const auto values = effect->GetPresetValues(preset);
        for (int i = 0; i < effect->GetParamCount(); ++i)
            EXPECT_EQ(values[static_cast<std::size_t>(i)], contract.ownRecord ? -1.0f : effect->GetParam(i))
                << effect->GetPresetName(preset) << ", parameter " << i;
    }
    EXPECT_EQ(sum, contract.presets.sum) << "the name or a word of a preset changed";
    GenericUIData pads;
    effect->InitializeXyEditingData(pads);
    EXPECT_EQ(effect->WantsXySerialization(), !contract.pads.empty());
    std::vector<std::string> names;
    for (const auto& pad : pads.groups) {
        if (names.empty() || names.back() != pad.name) names.push_back(pad.name);
        for (const auto& axis : {pad.x_axis, pad.y_axis})
            for (const int parameter : axis)
                EXPECT_TRUE(parameter >= 0 && parameter < effect->GetParamCountReal());
    }
    EXPECT_EQ(names, contract.pads);
}

// Catches words read from the wrong places, words that get lost, and the oldest layout half loaded.
TEST_P(EveryEffectContract, TakesChunksWordByWord) {
    const auto& contract = Promised();
    if (contract.ownRecord || contract.rows.front().step != 0.0) GTEST_SKIP() << "tested apart";
    const bool counted = contract.leading == Leading::Version1AndCount;
    const std::size_t leading = contract.leading == Leading::None ? 0
                                : counted                         ? 8
                                                                  : 4,
                      words = (static_cast<std::size_t>(contract.chunkSize) - leading) / 4;
    auto today = CountingChunk(leading, words, 4);
    const auto effect = GetParam().make();
    effect->SetSettingsChunk(today);
    if (contract.leading == Leading::Version1 || counted) Put(today, 0, 1);
    if (counted) Put(today, 4, static_cast<int>(words));
    EXPECT_EQ(Chunk(*effect), today);
    ForEachParameter([&](const Row& row, std::size_t side, int real, int) {
        const auto bits = At<std::uint32_t>(today, row.at[side]);
        const bool isFloat = row.words[2].bits == std::bit_cast<std::uint32_t>(row.words[2].plain);
        EXPECT_EQ(effect->GetParamPlain(real),
                  isFloat ? std::bit_cast<float>(bits) : static_cast<float>(bits))
            << "parameter " << real;
    });
    if (contract.oldWords == 0) return;
    const auto old = GetParam().make();
    const auto wide = CountingChunk(leading, contract.oldWords, 8), fresh = Chunk(*old);
    EXPECT_FALSE(FitsOldChunk(*old, {wide.begin(), wide.end() - 1}));
    EXPECT_EQ(Chunk(*old), fresh) << "a byte is missing";
    EXPECT_TRUE(FitsOldChunk(*old, wide));
    std::fill(today.begin() + static_cast<std::ptrdiff_t>(4 + 4 * contract.oldWords), today.end(),
              std::uint8_t{0});
    EXPECT_EQ(Chunk(*old), today);
}
