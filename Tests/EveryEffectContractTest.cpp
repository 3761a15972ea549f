#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <cmath>
#include <stdexcept>
#include <utility>

#include "DSP/Effects/Framework/CorvoEffect.h"
#include "Support/EveryEffect.h"

using namespace TestSupport;

// What hosts and saved projects rely on: every parameter's name, words, texts and place in the chunk, and
// every preset. Written down by hand; a change of the library that fails here breaks projects.
namespace {

using enum Corvo::EffectParameterType;
using Bytes = std::vector<std::uint8_t>;

// A word of the settings, an integer or a float.
struct Word {
    constexpr Word(int value) : bits(std::bit_cast<std::uint32_t>(value)), plain(static_cast<float>(value)) {}
    constexpr Word(double value) : Word(static_cast<float>(value)) {}
    constexpr Word(float value) : bits(std::bit_cast<std::uint32_t>(value)), plain(value) {}
    std::uint32_t bits;
    float plain;
};

// One parameter, or a pair of them.
struct Row {
    const wchar_t *label, *unit;  // the label of the right one ends in " R"
    Corvo::EffectParameterType type;
    std::array<std::size_t, 2> at;  // bytes in the chunk; a second place of 0 means that it is no pair
    std::array<Word, 3> words;      // at normalised 0, 0.5 and 1
    std::array<const wchar_t*, 3> texts;
    float neutral = 0.5f;

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

// Left and right word of a preset.
struct Both {
    Both(double value) : left(value), right(value) {}
    Both(double l, double r) : left(l), right(r) {}
    double left, right;
};
struct Preset {
    const char* name;
    std::vector<Both> words{};  // in the chunk's order, 0 from there on
};

enum class Leading { None, Kept, Version1 };

struct Contract {
    const char *name, *image, *icon;  // null where any will do
    int chunkSize;
    Leading leading;
    // Of the layout in which a word has 8 bytes; 0 where there was none or it is tested apart.
    std::size_t oldWords;
    std::vector<Row> rows;
    std::vector<Preset> presets{};
    int defaultPreset = 0;
    bool reversed = false, paired = false;
    bool singles = false;     // the words of presets are no pairs
    double digits = 0.0;      // to which float words of presets are given; 0 for integers
    bool ownRecord = false;   // settings of another kind, whose values are tested apart
    bool plainRange = false;  // the range is that of the words, not 0..1
    std::vector<std::string> sections{}, pads{};
};

Preset EchoPreset(const char* name, double decay, double mix, double ms, double delay, double out,
                  double old = 0) {
    const double depth = 1.0 - std::trunc(-1174.6484375 * std::log(ms - 19.0));
    if (old == 0.0) return {name, {decay, mix, depth, delay, 0, 0, 0, 0, 0, out, 0, 1}};
    return {name, {decay, mix, depth, delay, 28, -900, 20, old, -960, out, 0, 1}};
}
Preset PitchPreset(const char* name, double ratio) {
    return {name, {ratio, 1000, 4, 3, 0, -900, 20, 2000, -960, 0, {0, 1}}};
}

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
     .presets = {
        {"Default"}, {"Soft Knee Compression"}, {"Compression"}, {"Soft Limiter"}, {"Soft Knee Compressor+Gate"},
        {"Compressor+gate"}, {"Soft Noise Gate"}, {"Noise Gate"}, {"Heavy Limiter"}, {"Inverted dynamic"},
        {"Acoustic Guitar"}, {"Angry Piano"}, {"Big Red Kick"}, {"DI Bass"}, {"Drum Mix"}, {"Edgy Quillon"},
        {"Electric Bass"}, {"FET Bass"}, {"Guitar Crunch"}, {"Intense Vocal"}, {"Jazzy Bass"}, {"Keyboard Wizard"},
        {"Kick Rock"}, {"L.A. Snare"}, {"Modern Acoustic Guitar"}, {"Modern Organ"}, {"Narrator"},
        {"Nashville Jangle"}, {"Nice Overheads"}, {"Pump It"}, {"Radiant Guitar"}, {"Rock Vox"}, {"Soft Mix Buss"},
        {"Studio Vocal"}, {"Sustain That Solo"}, {"Tele Pick'n"}, {"Tom Tom"}, {"Velvet Kit"},
        {"Vintage Electric Bass"}, {"Vintage Organ"}, {"Vintage String Machines"}, {"Wurlie Rhodes"}},
     .defaultPreset = 1, .ownRecord = true},
    {.name = "Tremolo", .image = "builtinTremolo.png", .icon = "BuiltinPlugins/Tremolo@3x.png",
     .chunkSize = 92, .leading = Leading::Kept, .oldWords = 22,
     .rows = {
        {L"Depth L",        L"%",  Continuous, {4, 8},   {0, 500, 1000},    {L"0.0 %", L"50.0 %", L"100.0 %"}},
        {L"Frequency L",    L"Hz", Continuous, {20, 24}, {0, 1500, 3000},   {L"0.0 Hz", L"15.0 Hz", L"30.0 Hz"}},
        {L"Mix L",          L"%",  Continuous, {12, 16}, {0, 500, 1000},    {L"0.0 %", L"50.0 %", L"100.0 %"}},
        {L"Out gain L",     L"dB", Continuous, {76, 80}, {-960, -380, 200}, {L"-Inf. dB", L"-38.0 dB", L"20.0 dB"}},
        {L"Invert Phase L", L"",   List,       {36, 40}, {0, 0, 1},         {L"Disabled ", L"Enabled ", L"Enabled "}, 0.0f}},
     .presets = {
        // name                  depth mix   rate ring invert
        {"AutoVol",             {1000, 1000, 600, 0, 0, -900, 20, 2000, -960}},
        {"Left phase shift",    {0,    1000, 50,  0, {1, 0}, -900, 20, 2000, -960}},
        {"Fast Tremolo",        {1000, 509,  831}},
        {"Hard Pan",            {671,  500,  144}},
        {"Shimmering",          {500,  500,  584}},
        {"Bad Ring Mod",        {1000, 1000, 368, 0, 0, 0, 0, 0, 0, -8}},
        {"Broken Volume Pedal", {1000, 1000}},
        {"Robot",               {1000, 1000, 600, 1, 0, -300, 20, 4000, -960}}},
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
     .presets = {
        //                               decay mix    ms   delay out
        EchoPreset("Echo",               -70,  1000, 300,  -300, 60, 2000),
        EchoPreset("Single delay",       -300, 1000, 500,  -5,   60, 2000),
        EchoPreset("Long Echo",          -70,  1000, 2000, -300, 60, 4000),
        EchoPreset("Cosmic Feedback",    -19,  1238, 140,  -153, 0),
        EchoPreset("Intergalactic",      -66,  1000, 30,   -23,  0),
        EchoPreset("Medium Echo Verb",   -148, 1000, 230,  -165, 40),
        EchoPreset("Lightly Analogued",  -149, 899,  230,  -226, 40),
        EchoPreset("The Follower",       -180, 1000, 359,  -112, 51),
        EchoPreset("Vamping Echo",       -75,  906,  280,  -63,  0),
        EchoPreset("Off",                -300, 1000, 500,  -300, 60, 2000)},
     .sections = {"Delays", "Output"}, .pads = {"Default"}},
    {.name = "Chorus", .image = "builtinChorus.png", .icon = "BuiltinPlugins/Chorus.png",
     .chunkSize = 92, .leading = Leading::Kept, .oldWords = 22,
     .rows = {
        {L"Delay L",     L"ms", Continuous, {12, 16}, {0, 5000, 10000},  {L"0.0 ms", L"500.0 ms", L"1000.0 ms"}},
        {L"Frequency L", L"Hz", Continuous, {4, 8},   {0, 150, 300},     {L"0.00 Hz", L"1.50 Hz", L"3.00 Hz"}},
        {L"Depth L",     L"%",  Continuous, {36, 40}, {0, 500, 1000},    {L"0.0 %", L"50.0 %", L"100.0 %"}},
        {L"Wet level L", L"dB", Continuous, {20, 24}, {-960, -430, 100}, {L"-Inf. dB", L"-43.0 dB", L"10.0 dB"}},
        {L"Dry level L", L"dB", Continuous, {28, 32}, {-960, -430, 100}, {L"-Inf. dB", L"-43.0 dB", L"10.0 dB"}}},
     .presets = {
        // name               frequency delay   wet   dry   depth
        {"Chorus",           {80,       400,      -44,  -60,  30,   -900, 20, 2000, -960}},
        {"Flanger 1",        {10,       70,       -30,  -30,  1000, -900, 20, 2000, -960}},
        {"Flanger 2",        {10,       20,       -30,  -30,  1000, -900, 20, 2000, -960}},
        {"Stereo flanger",   {{39, 23}, {20, 30}, -30,  -30,  1000, -900, 20, 2000, -960}},
        {"13 Strings",       {90,       30,       0,    0,    718}},
        {"ChOSCrus",         {300,      30,       0,    0,    750}},
        {"Flange Bender",    {203,      30,       -39,  -33,  1000}},
        {"Record Scratch",   {200,      3750,     0,    -960, 712}},
        {"The 4 Chorus Men", {278,      30,       -61,  0,    1000}},
        {"Vintage Flange",   {39,       20,       0,    0,    301}},
        {"Off",              {10,       70,       -960, 0,    1000, -900, 20, 2000, -960}}},
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
     .presets = {
        // name                    rate    feedback wet max  min   width
        {"Moderate phasing",     {0.05,   0.7,   0.5,   1600, 440,  0.25}},
        {"Moderate uncolored",   {0.05,   0.7,   1.0,   1600, 440,  0.25}},
        {"Slow",                 {0.0167, 0.56,  0.5,   4170, 440,  0.1}},
        {"Slow uncolored",       {0.0167, 0.56,  1.0,   4170, 440,  0.1}},
        {"Fast",                 {0.3333, 0.56,  0.5,   4170, 440,  0.1}},
        {"High feedback",        {0.05,   0.97,  0.5,   1600, 440,  0.25}},
        {"Engine",               {0.0167, 0.92,  0.65,  3020, 60,   0.065}},
        {"Aliens",               {0.6667, 0.8,   0.5,   7900, 160,  0.5}},
        {"21 Circuits Of Chaos", {0.168,  0.685, 0.303, 680,  4120, 0.199}},
        {"Phase 6",              {0.082,  0.581, 0.5,   770,  7610, 0.25}},
        {"Philter Faze",         {0.074,  0.698, 0.5,   4410, 4420, 0.249}},
        {"Eight Stones",         {0.096,  0.411, 0.5,   210,  6200, 0.25}},
        {"Medium Rare",          {0.151,  0.296, 0.5,   210,  1730, 0.25}},
        {"Down Low",             {0.041,  0.824, 0.5,   170,  1630, 0.25}},
        {"Lofi Phase",           {0.104,  0.219, 0.5,   320,  1320, 0.249}}},
     .singles = true, .digits = 5e-5, .pads = {"Default"}},
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
     .presets = {
        // name                   pre-delay mix length wet  dry damping reflections room
        {"Large Hall",           {{0, 2}, 717,  2836, -75,  -25, 300,  {1786, 1584}, {1049, 762}}},
        {"Large hall 2",         {{0, 2}, 1000, 2500, -75,  -20, 1000, 1000,         1000}},
        {"Cathedral",            {{0, 2}, 1000, 4000, -75,  -25, 800,  1500,         1100}},
        {"Ambience 1",           {{0, 2}, 1000, 1050, -75,  -25, 350,  1548,         857}},
        {"Ambience 2",           {0,      1000, 1050, -75,  -25, 350,  {1786, 1548}, 857}},
        {"Bright room",          {{4, 2}, 700,  1500, -60,  -15, 150,  800,          800}},
        {"Metal Tank",           {{0, 2}, 1000, 1500, -55,  -15, 800,  600,          500}},
        {"Aqua Chamber",         {316,    158,  1209, -140, -41, 2500, 3055,         1900}},
        {"Basilica",             {603,    662,  5000, -164, -21, 482,  469,          2476}},
        {"More Than One Room",   {316,    490,  960,  -159, 0,   1815, 549,          2835}},
        {"Night Club",           {24,     819,  1500, -141, -20, 621,  1784,         1024}},
        {"Sizable Room",         {0,      1059, 1519, -151, -41, 829,  885,          2128}},
        {"Slambience",           {331,    404,  509,  -140, -41, 586,  0,            351}},
        {"Soft Reverb",          {105,    1088, 700,  -131, -22, 907,  270,          1959}},
        {"The Cave",             {12,     935,  5030, -206, -69, 1172, 0,            556}},
        {"The Church Of Reverb", {0,      986,  6010, -140, -50, 1330, 2064,         2835}},
        {"Vocal Hall",           {903,    490,  3019, -225, -69, 1194, 254,          1123}}},
     .reversed = true},
    {.name = "Valvex", .image = "builtinTube.png", .icon = "BuiltinPlugins/valvex.png",
     .chunkSize = 44, .leading = Leading::Kept, .oldWords = 0,
     .rows = {
        {L"Boost L",        L"Amount ", Continuous, {4, 8},   {0.0, 0.5, 1.0}, {L"None | 0", L"Tiny | 50", L"Strong | 100"}},
        {L"Drive L",        L"Amount ", Continuous, {12, 16}, {0.0, 0.5, 1.0}, {L"Easy | 0", L"Angry | 50", L"Furious | 100"}},
        {L"Tone L",         L" ",       Continuous, {20, 24}, {0.0, 0.5, 1.0}, {L"Obscure | 0", L"Bright | 50", L"Holy | 100"}},
        {L"Function L",     L"Type",    List,       {28, 32}, {0.0, 0.5, 1.0}, {L"Martens", L"Doidic A.", L"Araya-S."}},
        {L"Oversampling L", L"x ",      List,       {36, 40}, {0.0, 0.5, 1.0}, {L"1 x ", L"4 x ", L"16 x "}}},
     .presets = {
        // name                          boost  drive  tone   function oversampling
        {"(Default)",                   {0,     0,     1,     0,     0}},
        {"Tube Distortion",             {0.5,   0.3,   1,     0,     0}},
        {"Oversampled Distortion",      {0.5,   0.3,   1,     0,     0.3}},
        {"70s Muff",                    {0.591, 0.774, 0,     0.545, 0.442}},
        {"BRMC Bass Fuzz",              {0.335, 0.526, 0,     0,     0.199}},
        {"Bass Overdrive",              {0.128, 0.437, 0.245, 0,     0.321}},
        {"Blues Drive",                 {0.2,   0.363, 0.756, 0.848, 0.243}},
        {"Classic Stratortion",         {0,     0.007, 0.819, 0.526, 0.583}},
        {"Clean Boost",                 {0.899, 0,     1,     1,     0}},
        {"Country Crunch",              {0.036, 0.162, 0.497, 0,     0}},
        {"DI Bass",                     {0,     0.929, 0,     0.453, 0}},
        {"Drum Kit Warmer",             {0.116, 0.176, 1,     0,     0}},
        {"Fuzz Box",                    {0.276, 0.924, 0,     0,     0}},
        {"Marlo Fuzz",                  {0.26,  0.542, 0.512, 0.526, 0}},
        {"Lofi Drum Kit Amp",           {0.059, 0.872, 0.061, 0.342, 0.738}},
        {"NY Vocal Grit",               {0.081, 0.444, 1,     0.302, 0}},
        {"Overstellar Tele Drive",      {0.311, 0.124, 0.756, 0,     0}},
        {"Riffstortion",                {0.965, 0.003, 0.704, 0.763, 0.49}},
        {"Slide Guitar Drive",          {0.738, 0.25,  0.276, 0.142, 0}},
        {"Snare Warmth",                {0.092, 0.224, 1,     0.21,  0}},
        {"Strata Boost",                {0.859, 0,     0.829, 0.555, 0.726}},
        {"Studio Vocal Howl",           {0.44,  0.056, 1,     1,     0}},
        {"Vocal Boost",                 {0.409, 0,     1,     0.512, 0}},
        {"Rage Oversampled Distorsion", {0.5,   0.8,   1,     0,     0.6}}},
     .digits = 5e-4, .pads = {"Guitar", "Guitar - Clean", "Guitar - Heavy", "Guitar - Heavier", "Drums", "Vocal"}},
    {.name = "Pitch Shift", .image = "builtinPitch.png", .icon = "BuiltinPlugins/PitchShift@3x.png",
     .chunkSize = 92, .leading = Leading::Kept, .oldWords = 0,
     .rows = {{L"Pitch L", L"semitones", Continuous, {4, 8}, {10, 3005, 6000},
               {L"-98.7 semitones - 0.3%", L"0.0 semitones - 100.2%", L"12.0 semitones - 200.0%"}}},
     .presets = {PitchPreset("(Default)", 3000), PitchPreset("1 Octave Up", 6000), PitchPreset("2 Semitones Up", 3367),
                 PitchPreset("1 Semitone Up", 3178), PitchPreset("1 Semitone Down", 2831),
                 PitchPreset("2 Semitones Down", 2672), PitchPreset("1 Octave Down", 1500)},
     .paired = true},
};
// clang-format on

std::uint32_t WordAt(const Bytes& chunk, std::size_t at) {
    std::uint32_t word = 0;
    for (std::size_t i = 4; i-- > 0;) word = word << 8 | chunk.at(at + i);
    return word;
}

// Word w is w + 5; the bytes above the lower four do not count.
Bytes CountingChunk(std::size_t leading, std::size_t words, std::size_t width) {
    Bytes chunk(leading + words * width, 0xEE);
    for (std::size_t at = 0; at < leading; ++at) chunk[at] = static_cast<std::uint8_t>(9 + at);
    for (std::size_t i = 0; i < 4 * words; ++i)
        chunk[leading + i / 4 * width + i % 4] =
            static_cast<std::uint8_t>((static_cast<std::uint32_t>(i / 4) + 5) >> (8 * (i % 4)));
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
            EXPECT_EQ(WordAt(Chunk(*effect), row.at[side]), row.words[i].bits);
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
    ASSERT_EQ(effect->NumPresets(), static_cast<int>(contract.presets.size()));
    for (int preset = 0; preset < effect->NumPresets(); ++preset) {
        const auto& [name, words] = contract.presets[static_cast<std::size_t>(preset)];
        EXPECT_EQ(effect->GetPresetName(preset), name);
        effect->SetPreset(preset);
        const auto values = effect->GetPresetValues(preset);
        for (int i = 0; i < effect->GetParamCount(); ++i)
            EXPECT_EQ(values[static_cast<std::size_t>(i)], contract.ownRecord ? -1.0f : effect->GetParam(i))
                << name << ", parameter " << i;
        if (contract.ownRecord) continue;
        const auto chunk = Chunk(*effect);
        EXPECT_EQ(WordAt(chunk, 0), contract.leading == Leading::Version1 ? 1u : 0u);
        for (std::size_t word = 0; 4 + 4 * word < chunk.size(); ++word) {
            const std::size_t at = contract.singles ? word : word / 2;
            const double expected = at >= words.size()                   ? 0.0
                                    : !contract.singles && word % 2 == 1 ? words[at].right
                                                                         : words[at].left;
            const std::uint32_t bits = WordAt(chunk, 4 + 4 * word);
            const double stored = contract.digits > 0.0 ? static_cast<double>(std::bit_cast<float>(bits))
                                                        : std::bit_cast<std::int32_t>(bits);
            EXPECT_LE(std::abs(stored - expected), contract.digits) << name << ", word " << word;
        }
    }
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
    if (contract.ownRecord) GTEST_SKIP() << "tested apart";
    const std::size_t leading = contract.leading == Leading::None ? 0 : 4,
                      words = (static_cast<std::size_t>(contract.chunkSize) - leading) / 4;
    auto today = CountingChunk(leading, words, 4);
    const auto effect = GetParam().make();
    effect->SetSettingsChunk(today);
    if (contract.leading == Leading::Version1) std::ranges::copy(Bytes{1, 0, 0, 0}, today.begin());
    EXPECT_EQ(Chunk(*effect), today);
    ForEachParameter([&](const Row& row, std::size_t side, int real, int) {
        const auto bits = WordAt(today, row.at[side]);
        const bool isFloat = row.words[2].bits == std::bit_cast<std::uint32_t>(row.words[2].plain);
        EXPECT_EQ(effect->GetParamPlain(real),
                  isFloat ? std::bit_cast<float>(bits) : static_cast<float>(bits))
            << "parameter " << real;
    });
    if (contract.oldWords == 0) return;
    const auto tabled = GetParam().make();
    auto& old = dynamic_cast<Corvo::DSP::CorvoEffect&>(*tabled);
    const auto wide = CountingChunk(leading, contract.oldWords, 8), fresh = Chunk(old);
    EXPECT_FALSE(old.FitsOldChunk({wide.begin(), wide.end() - 1}));
    EXPECT_EQ(Chunk(old), fresh) << "a byte is missing";
    EXPECT_TRUE(old.FitsOldChunk(wide));
    std::fill(today.begin() + static_cast<std::ptrdiff_t>(4 + 4 * contract.oldWords), today.end(),
              std::uint8_t{0});
    EXPECT_EQ(Chunk(old), today);
}
