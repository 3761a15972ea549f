#include <algorithm>
#include <mutex>

#include "Spectrum/AnalyserLock.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Drawer/VectorInterpolationFilterFloat.h"
#include "Spectrum/MessagePoster.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Spectrum/kivspectrum.h"

// The commands of the pop-up menu, which the host builds and words.
namespace {

using Settings = kivspectrum::spectrum_settings;
using Field = std::int32_t Settings::*;
using Lock = std::lock_guard<Corvo::CriticalSection>;

// clang-format off
struct Choice { int first, last; Field field; std::int32_t firstValue; };
constexpr Choice kChoices[] = {
    {1240, 1244, &Settings::window_type,      0},
    {1250, 1253, &Settings::view_option_d,    0},
    {1254, 1255, &Settings::view_option_c,    0},
    {1284, 1290, &Settings::view_option_a,   -1},
    {1291, 1293, &Settings::view_option_b,    0},
    {1296, 1299, &Settings::peak_decay_mode,  0},
    {1300, 1302, &Settings::peak_hold_mode,   0},
    {1307, 1309, &Settings::view_option_e,    1},
    {1393, 1395, &Settings::smoothing_type,   0},
};

struct Toggle { int command; Field field; };
constexpr Toggle kToggles[] = {
    {1282, &Settings::view_flag_a},
    {1306, &Settings::view_flag_b},
    {1312, &Settings::view_flag_c},
    {1314, &Settings::time_smoothing},
};

// What a range of commands does with the number within it.
struct TunerChoice { int first, last; void (*set)(int); };
constexpr TunerChoice kTunerChoices[] = {
    {1317, 1321, [](int n) { Tuner::SetDetectionMethod(n); }},
    {1322, 1323, [](int n) { Tuner::SetShowDenoisedSpectrum(n != 0); }},
    {1324, 1334, [](int n) { Tuner::SetTemperament(n); }},
    {1335, 1337, [](int n) { Tuner::SetNoteNaming(n); }},
    {1338, 1343, [](int n) { Tuner::SetTunedQuantumPreset(n); }},
};
// clang-format on

enum Command {
    kAutomaticTransform = 1200,
    kShortestTransform = 1201,
    kLongestTransform = 1213,
    kShortestWindow = 1220,
    kLongestWindow = 1232,
    kOnOff = 1258,
    kNoOverlap = 1262,
    kFirstOverlap = 1263,
    kLastOverlap = 1267,
    kTunerOnOff = 1283,
    kResetPeaks = 1295,
    kHideNoteNames = 1315,
    kShowNoteNames = 1316,
    kFirstSensitivity = 1344,
    kLastSensitivity = 1349,
    kRedrawTunerPanel = 1350,
    kFirstFilterLength = 1398,
    kLastFilterLength = 1402,
};

constexpr std::int32_t kShortestLength = 128;
constexpr float kOverlaps[] = {0.25f, 0.5f, 0.75f, 0.875f, 0.9375f};
constexpr std::int32_t kFilterLengths[] = {3, 5, 7, 9, 15};

bool Within(int command, int first, int last) { return command >= first && command <= last; }

bool ApplyToTables(int command, Settings& settings) {
    for (const Choice& choice : kChoices)
        if (Within(command, choice.first, choice.last)) {
            settings.*choice.field = command - choice.first + choice.firstValue;
            return true;
        }
    for (const Toggle& toggle : kToggles)
        if (command == toggle.command) {
            settings.*toggle.field = settings.*toggle.field ? 0 : 1;
            return true;
        }
    for (const TunerChoice& choice : kTunerChoices)
        if (Within(command, choice.first, choice.last)) {
            choice.set(command - choice.first);
            return true;
        }
    return false;
}

}  // namespace

bool kivspectrum::ApplyCommand(int command) {
    if (ApplyToTables(command, settings)) return true;
    if (Within(command, kShortestTransform, kLongestTransform)) {
        settings.fft_length_auto = 0;
        settings.fft_length = kShortestLength << (command - kShortestTransform);
    } else if (Within(command, kShortestWindow, kLongestWindow)) {
        settings.window_length = kShortestLength << (command - kShortestWindow);
        if (settings.overlap >= 0.0f) SetAnalysisWindowsOverlap(settings.overlap);
    } else if (Within(command, kFirstOverlap, kLastOverlap)) {
        SetAnalysisWindowsOverlap(kOverlaps[command - kFirstOverlap]);
    } else if (Within(command, kFirstSensitivity, kLastSensitivity)) {
        m_tuner->SetSensibilityPreset(command - kFirstSensitivity);
    } else if (Within(command, kFirstFilterLength, kLastFilterLength)) {
        // Every analyser's filter follows in the walk over them.
        settings.smoothing_filter_length = kFilterLengths[command - kFirstFilterLength];
    } else {
        switch (command) {
            case kAutomaticTransform:
                settings.fft_length_auto = 1;
                break;
            case kNoOverlap:
                settings.overlap = 0.0f;
                settings.hop_length = settings.window_length;
                break;
            case kOnOff:
                SetOn(!GetOn());
                break;
            case kTunerOnOff:
                SetTunerOn(!GetTunerOn());
                break;
            case kResetPeaks:
                peak_reset();
                break;
            case kHideNoteNames:
                settings.view_flag_d = false;
                break;
            case kShowNoteNames:
                settings.view_flag_d = true;
                break;
            case kRedrawTunerPanel:
                needPrepareBitmap = true;
                break;
            default:
                return false;
        }
    }
    return true;
}

bool kivspectrum::popupmenu_process(int command) {
    {
        const Lock classLock(Corvo::AnalyserLock());
        if (!ApplyCommand(command)) return false;
        ObserverUpdate();
    }
    if (command == kRedrawTunerPanel) Tell(kMessageTunerPanelRedraw, 0);
    Tell(kMessageSettingsChanged, command);
    return true;
}
