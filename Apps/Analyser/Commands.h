#pragma once

#include <span>

#include "Events.h"

namespace analyser {

// What the view can do beside the analyser's own menu, whose commands begin at 1200.
enum Command : int {
    kShowSpectrum = 1,
    kShowSonogram,
    kShowBoth,
    kShowTuner,
    kTunerStrip,
    kFreeze,
    kZoomIn,
    kZoomOut,
    kWholeRange,
    kFullScreen,
    kShowKeys,
    kSavePicture,
    kSaveSvg,
    kSavePdf,
    kCopyReading,
    kPlay,
    kBack,
    kForward,
    kNow,
    kLowerReference,
    kHigherReference,
    kCalibrate,
    kTone,
    kResetPeaks,
    kSlower,
    kFaster,
    kNextColours,
    kOpenMenu,
    kFirstSpeed = 100,      // kSpeeds of them
    kFirstColours = 120,    // kColours
    kFirstReference = 140,  // of kReferences
    kFirstInput = 200,      // as many as there are
    kFirstOfAnalyser = 1200,
    // Of the analyser's own.
    kAnalyserOn = 1258,
    kLargestOverlap = 1267,
    kResetAnalyserPeaks = 1295,
    kFirstSensitivity = 1344,  // kSensitivities of them
};
constexpr int kSpeeds = 9, kColours = 7, kSensitivities = 6;

constexpr bool IsSensitivity(int command) {
    return command >= kFirstSensitivity && command < kFirstSensitivity + kSensitivities;
}

struct CommandRow {
    int command;
    const char* group;  // of the menu; empty for what stands there already in another form
    const char* text;
    const char* shortcut;  // as shown
    char32_t key;
    bool control;
};

std::span<const CommandRow> Commands();
// Null for a key without a meaning.
const CommandRow* FindCommand(const KeyPress& press);

// The A of orchestras then and now, Hz.
inline constexpr int kReferences[] = {415, 430, 432, 435, 438, 440, 441, 442, 443, 444, 445, 446, 466};
constexpr double kLowestReference = 380.0, kHighestReference = 480.0;

}  // namespace analyser
