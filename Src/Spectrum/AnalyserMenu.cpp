#include "Spectrum/AnalyserMenu.h"

#include <algorithm>
#include <cstddef>
#include <iterator>
#include <type_traits>

#include "Spectrum/AnalyserAction.h"
#include "Spectrum/AnalyserSettings.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Spectrum/Tuner/TunerSensitivity.h"
#include "Spectrum/Tuner/TunerTemperaments.h"

namespace Corvo {
namespace {

using S = SpectrumSettings;
using Action = AnalyserMenuEntry::Action;

// The field takes the value.
template <auto field>
constexpr Action kField{
    [](Analyser&, S& s, int value) {
        s.*field = static_cast<std::remove_reference_t<decltype(s.*field)>>(value);
    },
    [](const Analyser&, const S& s, int value) { return static_cast<int>(s.*field) == value; }};

// The field is switched between 0 and 1.
template <auto field>
constexpr Action kToggle{[](Analyser&, S& s, int) { s.*field = s.*field ? 0 : 1; },
                         [](const Analyser&, const S& s, int) { return s.*field != 0; }};

// A choice that all tuners share.
template <auto set, auto get>
constexpr Action kShared{
    [](Analyser&, S&, int value) { set(value); },
    [](const Analyser&, const S&, int value) { return static_cast<int>(get()) == value; }};

constexpr bool Never(const Analyser&, const S&, int) { return false; }

constexpr Action kAutomaticTransform{[](Analyser&, S& s, int) { s.fft_length_auto = 1; },
                                     [](const Analyser&, const S& s, int) { return s.fft_length_auto != 0; }};
constexpr Action kTransformLength{
    [](Analyser&, S& s, int length) {
        s.fft_length_auto = 0;
        s.fft_length = length;
    },
    [](const Analyser&, const S& s, int length) { return s.fft_length_auto == 0 && s.fft_length == length; }};
constexpr Action kWindowLength{
    [](Analyser&, S& s, int length) { StoreWindowLength(s, length); },
    [](const Analyser&, const S& s, int length) { return s.window_length == length; }};
constexpr Action kNoOverlap{[](Analyser&, S& s, int) {
                                s.overlap = 0.0f;
                                s.hop_length = s.window_length;
                            },
                            [](const Analyser&, const S& s, int) { return s.overlap == 0.0f; }};
constexpr Action kOverlap{
    [](Analyser&, S& s, int sixteenths) { StoreOverlap(s, static_cast<float>(sixteenths) / 16.0f); },
    [](const Analyser&, const S& s, int sixteenths) {
        return s.overlap * 16.0f == static_cast<float>(sixteenths);
    }};

constexpr Action kOnOff{[](Analyser& a, S&, int) { a.SetOn(!a.state.on); },
                        [](const Analyser& a, const S&, int) { return a.state.on.load(); }};
constexpr Action kTunerOnOff{[](Analyser& a, S&, int) { a.SetTunerOn(!a.state.tunerOn); },
                             [](const Analyser& a, const S&, int) { return a.state.tunerOn.load(); }};
constexpr Action kResetPeaks{[](Analyser& a, S&, int) { a.ResetPeaks(); }, Never};
constexpr Action kOnlyTold{[](Analyser&, S&, int) {}, Never};

constexpr Action kMethod = kShared<Tuner::SetDetectionMethod, Tuner::GetDetectionMethod>;
constexpr Action kShowDenoised = kShared<Tuner::SetShowDenoisedSpectrum, Tuner::GetShowDenoisedSpectrum>;
constexpr Action kTemperament = kShared<Tuner::SetTemperament, Tuner::GetTemperament>;
constexpr Action kNaming = kShared<Tuner::SetNoteNaming, Tuner::GetNoteNaming>;
constexpr Action kQuantum{[](Analyser&, S&, int preset) { Tuner::SetTunedQuantumPreset(preset); },
                          [](const Analyser&, const S&, int preset) {
                              return Tuner::GetTunedQuantum() ==
                                     kTunedQuanta[static_cast<std::size_t>(preset)];
                          }};
// Some sensitivities report the same number: all of these count as chosen.
constexpr Action kSensitivity{[](Analyser& a, S&, int preset) { a.GetTuner().SetSensibilityPreset(preset); },
                              [](const Analyser& a, const S&, int preset) {
                                  const auto row = static_cast<std::size_t>(preset);
                                  return a.GetTuner().GetSensibilityPreset() ==
                                         kTunerSensitivities[row].values.reported;
                              }};

// clang-format off
constexpr AnalyserMenuEntry kMenu[] = {
    {1258, "Analyser",               "On",                          &kOnOff,                                0},
    {1200, "Transform length",       "As long as the window",       &kAutomaticTransform,                   0},
    {1201, "Transform length",       "128",                         &kTransformLength,                      128},
    {1202, "Transform length",       "256",                         &kTransformLength,                      256},
    {1203, "Transform length",       "512",                         &kTransformLength,                      512},
    {1204, "Transform length",       "1024",                        &kTransformLength,                      1024},
    {1205, "Transform length",       "2048",                        &kTransformLength,                      2048},
    {1206, "Transform length",       "4096",                        &kTransformLength,                      4096},
    {1207, "Transform length",       "8192",                        &kTransformLength,                      8192},
    {1208, "Transform length",       "16384",                       &kTransformLength,                      16384},
    {1209, "Transform length",       "32768",                       &kTransformLength,                      32768},
    {1210, "Transform length",       "65536",                       &kTransformLength,                      65536},
    {1211, "Transform length",       "131072",                      &kTransformLength,                      131072},
    {1212, "Transform length",       "262144",                      &kTransformLength,                      262144},
    {1213, "Transform length",       "524288",                      &kTransformLength,                      524288},
    {1220, "Window length",          "128",                         &kWindowLength,                         128},
    {1221, "Window length",          "256",                         &kWindowLength,                         256},
    {1222, "Window length",          "512",                         &kWindowLength,                         512},
    {1223, "Window length",          "1024",                        &kWindowLength,                         1024},
    {1224, "Window length",          "2048",                        &kWindowLength,                         2048},
    {1225, "Window length",          "4096",                        &kWindowLength,                         4096},
    {1226, "Window length",          "8192",                        &kWindowLength,                         8192},
    {1227, "Window length",          "16384",                       &kWindowLength,                         16384},
    {1228, "Window length",          "32768",                       &kWindowLength,                         32768},
    {1229, "Window length",          "65536",                       &kWindowLength,                         65536},
    {1230, "Window length",          "131072",                      &kWindowLength,                         131072},
    {1231, "Window length",          "262144",                      &kWindowLength,                         262144},
    {1232, "Window length",          "524288",                      &kWindowLength,                         524288},
    {1240, "Window",                 "Rectangular",                 &kField<&S::window_type>,               0},
    {1241, "Window",                 "Triangular",                  &kField<&S::window_type>,               1},
    {1242, "Window",                 "Hann",                        &kField<&S::window_type>,               2},
    {1243, "Window",                 "Hamming",                     &kField<&S::window_type>,               3},
    {1244, "Window",                 "Blackman",                    &kField<&S::window_type>,               4},
    {1262, "Overlap",                "None",                        &kNoOverlap,                            0},
    {1263, "Overlap",                "25 %",                        &kOverlap,                              4},
    {1264, "Overlap",                "50 %",                        &kOverlap,                              8},
    {1265, "Overlap",                "75 %",                        &kOverlap,                              12},
    {1266, "Overlap",                "87.5 %",                      &kOverlap,                              14},
    {1267, "Overlap",                "93.75 %",                     &kOverlap,                              15},
    {1314, "Smoothing",              "Over time",                   &kToggle<&S::time_smoothing>,           0},
    {1393, "Smoothing",              "Exponential",                 &kField<&S::smoothing_type>,            0},
    {1394, "Smoothing",              "Moving average",              &kField<&S::smoothing_type>,            1},
    {1395, "Smoothing",              "None",                        &kField<&S::smoothing_type>,            2},
    {1398, "Moving average",         "3 spectra",                   &kField<&S::smoothing_filter_length>,   3},
    {1399, "Moving average",         "5 spectra",                   &kField<&S::smoothing_filter_length>,   5},
    {1400, "Moving average",         "7 spectra",                   &kField<&S::smoothing_filter_length>,   7},
    {1401, "Moving average",         "9 spectra",                   &kField<&S::smoothing_filter_length>,   9},
    {1402, "Moving average",         "15 spectra",                  &kField<&S::smoothing_filter_length>,   15},
    {1300, "Peaks",                  "Off",                         &kField<&S::peak_hold_mode>,            0},
    {1301, "Peaks",                  "Falling",                     &kField<&S::peak_hold_mode>,            1},
    {1302, "Peaks",                  "Kept until reset",            &kField<&S::peak_hold_mode>,            2},
    {1295, "Peaks",                  "Reset",                       &kResetPeaks,                           0},
    {1296, "Peaks fall after",       "Never",                       &kField<&S::peak_decay_mode>,           0},
    {1297, "Peaks fall after",       "A long time",                 &kField<&S::peak_decay_mode>,           1},
    {1298, "Peaks fall after",       "A medium time",               &kField<&S::peak_decay_mode>,           2},
    {1299, "Peaks fall after",       "A short time",                &kField<&S::peak_decay_mode>,           3},
    {1284, "Frequency scale",        "Automatic",                   &kField<&S::view_option_a>,             -1},
    {1285, "Frequency scale",        "Linear",                      &kField<&S::view_option_a>,             0},
    {1286, "Frequency scale",        "Logarithmic",                 &kField<&S::view_option_a>,             1},
    {1287, "Frequency scale",        "Octaves",                     &kField<&S::view_option_a>,             2},
    {1288, "Frequency scale",        "Third octaves",               &kField<&S::view_option_a>,             3},
    {1289, "Frequency scale",        "Mel",                         &kField<&S::view_option_a>,             4},
    {1290, "Frequency scale",        "Notes",                       &kField<&S::view_option_a>,             5},
    {1315, "Frequency labels",       "Hertz",                       &kField<&S::view_flag_d>,               0},
    {1316, "Frequency labels",       "Notes",                       &kField<&S::view_flag_d>,               1},
    {1291, "Level scale",            "Decibels",                    &kField<&S::view_option_b>,             0},
    {1292, "Level scale",            "Power",                       &kField<&S::view_option_b>,             1},
    {1293, "Level scale",            "Amplitude",                   &kField<&S::view_option_b>,             2},
    {1250, "Level range",            "60 dB",                       &kField<&S::view_option_d>,             0},
    {1251, "Level range",            "90 dB",                       &kField<&S::view_option_d>,             1},
    {1252, "Level range",            "120 dB",                      &kField<&S::view_option_d>,             2},
    {1253, "Level range",            "144 dB",                      &kField<&S::view_option_d>,             3},
    {1307, "Curve",                  "Line",                        &kField<&S::view_option_e>,             1},
    {1308, "Curve",                  "Filled",                      &kField<&S::view_option_e>,             2},
    {1309, "Curve",                  "Bars",                        &kField<&S::view_option_e>,             3},
    {1254, "Grid",                   "Off",                         &kField<&S::view_option_c>,             0},
    {1255, "Grid",                   "On",                          &kField<&S::view_option_c>,             1},
    {1306, "Show",                   "Labels",                      &kToggle<&S::view_flag_b>,              0},
    {1312, "Show",                   "Info box",                    &kToggle<&S::view_flag_c>,              0},
    {1282, "Show",                   "Channels apart",              &kToggle<&S::view_flag_a>,              0},
    {1283, "Tuner",                  "On",                          &kTunerOnOff,                           0},
    {1350, "Tuner",                  "Redraw the panel",            &kOnlyTold,                             0},
    {1317, "Tuner method",           "Denoised harmonic product",   &kMethod,                               0},
    {1318, "Tuner method",           "Harmonic product",            &kMethod,                               1},
    {1319, "Tuner method",           "Pseudo harmonic product",     &kMethod,                               2},
    {1320, "Tuner method",           "Legacy",                      &kMethod,                               3},
    {1321, "Tuner method",           "Two-way mismatch",            &kMethod,                               4},
    {1344, "Tuner sensitivity",      kTunerSensitivities[0].name,   &kSensitivity,                          0},
    {1345, "Tuner sensitivity",      kTunerSensitivities[1].name,   &kSensitivity,                          1},
    {1346, "Tuner sensitivity",      kTunerSensitivities[2].name,   &kSensitivity,                          2},
    {1347, "Tuner sensitivity",      kTunerSensitivities[3].name,   &kSensitivity,                          3},
    {1348, "Tuner sensitivity",      kTunerSensitivities[4].name,   &kSensitivity,                          4},
    {1349, "Tuner sensitivity",      kTunerSensitivities[5].name,   &kSensitivity,                          5},
    {1322, "Spectrum without noise", "Hidden",                      &kShowDenoised,                         0},
    {1323, "Spectrum without noise", "Shown",                       &kShowDenoised,                         1},
    {1324, "Temperament",            kTemperamentNames[0],          &kTemperament,                          0},
    {1325, "Temperament",            kTemperamentNames[1],          &kTemperament,                          1},
    {1326, "Temperament",            kTemperamentNames[2],          &kTemperament,                          2},
    {1327, "Temperament",            kTemperamentNames[3],          &kTemperament,                          3},
    {1328, "Temperament",            kTemperamentNames[4],          &kTemperament,                          4},
    {1329, "Temperament",            kTemperamentNames[5],          &kTemperament,                          5},
    {1330, "Temperament",            kTemperamentNames[6],          &kTemperament,                          6},
    {1331, "Temperament",            kTemperamentNames[7],          &kTemperament,                          7},
    {1332, "Temperament",            kTemperamentNames[8],          &kTemperament,                          8},
    {1333, "Temperament",            kTemperamentNames[9],          &kTemperament,                          9},
    {1334, "Temperament",            kTemperamentNames[10],         &kTemperament,                          10},
    {1335, "Note names",             "A A# B",                      &kNaming,                               0},
    {1336, "Note names",             "A Bb B",                      &kNaming,                               1},
    {1337, "Note names",             "La La# Si",                   &kNaming,                               2},
    {1338, "Tuned within",           "0.1 cents",                   &kQuantum,                              0},
    {1339, "Tuned within",           "0.5 cents",                   &kQuantum,                              1},
    {1340, "Tuned within",           "1 cent",                      &kQuantum,                              2},
    {1341, "Tuned within",           "2 cents",                     &kQuantum,                              3},
    {1342, "Tuned within",           "5 cents",                     &kQuantum,                              4},
    {1343, "Tuned within",           "10 cents",                    &kQuantum,                              5},
};
// clang-format on

}  // namespace

std::span<const AnalyserMenuEntry> AnalyserMenu() { return kMenu; }

const AnalyserMenuEntry* FindAnalyserMenuEntry(int command) {
    const auto* const found =
        std::find_if(std::begin(kMenu), std::end(kMenu),
                     [=](const AnalyserMenuEntry& entry) { return entry.command == command; });
    return found != std::end(kMenu) ? found : nullptr;
}

}  // namespace Corvo
