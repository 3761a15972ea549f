#include "Commands.h"

#include <algorithm>
#include <iterator>

namespace analyser {
namespace {

// clang-format off
constexpr CommandRow kCommands[] = {
    // command          group              text                           shortcut  key              control
    {kShowSpectrum,     "View",            "Spectrum",                    "1",      U'1',            false},
    {kShowSonogram,     "View",            "Sonogram",                    "2",      U'2',            false},
    {kShowBoth,         "View",            "Both",                        "3",      U'3',            false},
    {kShowTuner,        "View",            "Tuner",                       "4",      U'4',            false},
    {kTunerStrip,       "View",            "Tuner above",                 "T",      U't',            false},
    {kFreeze,           "View",            "Freeze",                      "Space",  U' ',            false},
    {kZoomIn,           "View",            "Zoom in",                     "+",      U'+',            false},
    {kZoomOut,          "View",            "Zoom out",                    "-",      U'-',            false},
    {kWholeRange,       "View",            "All frequencies",             "0",      U'0',            false},
    {kFullScreen,       "View",            "Full screen",                 "F",      U'f',            false},
    {kShowKeys,         "View",            "Keys",                        "H",      U'h',            false},
    {kSavePicture,      "Save",            "Picture (PNG), numbers (CSV)", "P",     U'p',            false},
    {kSaveSvg,          "Save",            "Picture as SVG",              "S",      U's',            false},
    {kSavePdf,          "Save",            "Picture as PDF",              "D",      U'd',            false},
    {kCopyReading,      "Save",            "Copy the reading",            "Ctrl+C", U'c',            true},
    {kPlay,             "Time",            "Play or pause",               "K",      U'k',            false},
    {kBack,             "Time",            "5 seconds back",              "Left",   kKeyLeft,        false},
    {kForward,          "Time",            "5 seconds on",                "Right",  kKeyRight,       false},
    {kNow,              "Time",            "Sonogram back to now",        "End",    kKeyEnd,         false},
    {kLowerReference,   "Tuner reference", "The tuner's A 1 Hz lower",    "Comma",  U',',            false},
    {kHigherReference,  "Tuner reference", "The tuner's A 1 Hz higher",   "Full stop", U'.',            false},
    {kCalibrate,        "Tuner reference", "Take what sounds for in tune", "C",     U'c',            false},
    {kTone,             "Tuner reference", "Sound the A",                 "A",      U'a',            false},
    {kResetPeaks,       "",                "Reset peaks",                 "R",      U'r',            false},
    {kSlower,           "",                "Sonogram slower",             "[",      U'[',            false},
    {kFaster,           "",                "Sonogram faster",             "]",      U']',            false},
    {kNextColours,      "",                "Next sonogram colours",       "B",      U'b',            false},
    {kOpenMenu,         "",                "Menu",                        "M",      U'm',            false},
};

struct OtherKey { char32_t key, as; };
constexpr OtherKey kOtherKeys[] = {{kKeyMenu, U'm'},  {kKeyFullScreen, U'f'}, {kKeyHelp, U'h'}, {U'?', U'h'},
                                   {kKeyHome, U'0'},  {kKeyEnter, U'k'},      {U'=', U'+'},     {U'_', U'-'}};
// clang-format on

}  // namespace

std::span<const CommandRow> Commands() { return kCommands; }

const CommandRow* FindCommand(const KeyPress& press) {
    const auto* const other = std::ranges::find(kOtherKeys, press.key, &OtherKey::key);
    const char32_t key = other != std::end(kOtherKeys) ? other->as : press.key;
    const auto* const row = std::ranges::find_if(
        kCommands, [&](const CommandRow& each) { return each.key == key && each.control == press.control; });
    return row != std::end(kCommands) ? row : nullptr;
}

}  // namespace analyser
