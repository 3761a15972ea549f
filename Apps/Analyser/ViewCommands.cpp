#include <algorithm>
#include <cmath>
#include <string_view>

#include "Commands.h"
#include "Spectrum/AnalyserMenu.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/Tuner/Tuner.h"
#include "View.h"

// The menu and what its commands do.
namespace analyser {
namespace {

using Corvo::Sonogram;

constexpr int kManyReferences = static_cast<int>(std::size(kReferences));
constexpr const char* kSpeedTexts[kSpeeds] = {
    "5 columns a second", "10", "15", "30", "60", "90", "150", "300", "450"};
constexpr const char* kColourTexts[kColours] = {
    "Blue and red", "Blue and green", "Orange and yellow", "Red", "Green", "Blue", "Grey"};
constexpr double kSkipSeconds = 5.0;

double Reference() { return 4.0 * Tuner::GetCalibrationBase(); }

}  // namespace

void View::OpenMenu() { m_menu.Open(MakeMenu(), {std::max(m_pointer.x, 0.0f), std::max(m_pointer.y, 0.0f)}); }

bool View::TogglePlaying() {
    if (!IsOffered(kPlay)) return false;
    m_shell.TogglePlaying();
    return true;
}

std::vector<MenuGroup> View::MakeMenu() const {
    std::vector<MenuGroup> groups;
    const auto group = [&](std::string_view name) -> std::vector<MenuEntry>& {
        if (groups.empty() || groups.back().text != name) groups.push_back({std::string(name), {}});
        return groups.back().entries;
    };
    const auto add = [&](std::string_view to, std::string text, const char* shortcut, int command) {
        group(to).push_back({std::move(text), shortcut, command, IsChosen(command)});
    };
    const auto inputs = m_shell.Inputs();
    for (const CommandRow& row : Commands()) {
        const std::string_view name = row.group;
        if (name.empty() || !IsOffered(row.command)) continue;
        if (row.command == kLowerReference) {
            for (std::size_t i = 0; i < inputs.size(); ++i)
                add("Input", inputs[i], "", kFirstInput + static_cast<int>(i));
            for (int i = 0; i < kSpeeds; ++i) add("Sonogram speed", kSpeedTexts[i], "", kFirstSpeed + i);
            for (int i = 0; i < kColours; ++i)
                add("Sonogram colours", kColourTexts[i], "", kFirstColours + i);
            for (int i = 0; i < kManyReferences; ++i)
                add(name, "A = " + std::to_string(kReferences[i]) + " Hz", "", kFirstReference + i);
        }
        add(name, row.text, row.shortcut, row.command);
    }
    for (const Corvo::AnalyserMenuEntry& entry : Corvo::AnalyserMenu())
        add(entry.group, entry.text, entry.command == kResetAnalyserPeaks ? "R" : "", entry.command);
    return groups;
}

// False for what the window that it is in has not.
bool View::IsOffered(int command) const {
    if (command == kPlay) return m_shell.GetPlayback().has_value();
    return command != kFullScreen || m_shell.CanFillScreen();
}

void View::SetReference(double hz) {
    const double limited = std::clamp(hz, kLowestReference, kHighestReference);
    if (!TunerCalibrateTo(limited)) return;
    // The tone follows.
    if (m_shell.IsToneOn()) m_shell.SetTone(true);
    char text[64];
    std::snprintf(text, sizeof text, "The tuner's A is at %d.%d Hz.", static_cast<int>(limited),
                  static_cast<int>(std::lround(limited * 10.0)) % 10);
    Say(text);
}

bool View::Skip(double seconds) {
    const auto playback = m_shell.GetPlayback();
    if (!playback) return Scroll(SecondsBack() - seconds);
    m_shell.Seek(std::clamp(playback->position + seconds, 0.0, playback->length));
    return true;
}

// Commands in a row that are done alike; those of the analyser's own that need nothing else come last.
struct View::Action {
    int first, count;
    bool (*act)(View& view, int index);             // false where there is nothing to do
    bool (*isChosen)(const View& view, int index);  // null for what leaves nothing chosen
};

// clang-format off
const View::Action View::kActions[] = {
    {kShowSpectrum, kivspectrum::display_tuner + 1,
     [](View& v, int mode) { v.ShowMode(static_cast<kivspectrum::_display_mode>(mode)); return true; },
     [](const View& v, int mode) { return v.GetAnalyser().GetDisplayMode() == mode; }},
    {kTunerStrip, 1,
     [](View& v, int) { v.ToggleStrip(); return true; },
     [](const View& v, int) { return v.GetAnalyser().IsShowTuner(); }},
    {kFreeze, 1,
     [](View& v, int) { v.ToggleFrozen(); return true; },
     [](const View& v, int) { return v.GetAnalyser().GetFrozen(); }},
    {kZoomIn, 2,
     [](View& v, int out) { v.Zoom(v.ReadingAt(v.m_pointer.x, v.m_pointer.y).frequency, out ? 2.0 : 0.5); return true; },
     nullptr},
    {kWholeRange, 1, [](View& v, int) { v.SetSpan(0.0, 1.0); return true; }, nullptr},
    {kFullScreen, 1, [](View& v, int) { v.m_shell.ToggleFullScreen(); return true; }, nullptr},
    {kShowKeys, 1,
     [](View& v, int) { v.TurnKeys(); return true; },
     [](const View& v, int) { return v.m_keysShown; }},
    {kSavePicture, 3, [](View& v, int kind) { v.Save(static_cast<Kind>(kind)); return true; }, nullptr},
    {kCopyReading, 1, [](View& v, int) { v.CopyReading(); return true; }, nullptr},
    {kPlay, 1, [](View& v, int) { return v.TogglePlaying(); }, nullptr},
    {kBack, 2, [](View& v, int on) { return v.Skip(on ? kSkipSeconds : -kSkipSeconds); }, nullptr},
    {kNow, 1, [](View& v, int) { return v.LookBack(0.0); }, nullptr},
    {kLowerReference, 1, [](View& v, int) { v.SetReference(std::ceil(Reference() - 1.001)); return true; }, nullptr},
    {kHigherReference, 1, [](View& v, int) { v.SetReference(std::floor(Reference() + 1.001)); return true; }, nullptr},
    {kCalibrate, 1, [](View& v, int) { v.Calibrate(); return true; }, nullptr},
    {kTone, 1,
     [](View& v, int) { v.m_shell.SetTone(!v.m_shell.IsToneOn()); return true; },
     [](const View& v, int) { return v.m_shell.IsToneOn(); }},
    {kResetPeaks, 1, [](View& v, int) { for (kivspectrum& each : v.m_analysers) each.peak_reset(); return true; }, nullptr},
    {kSlower, 1, [](View&, int) { Sonogram::SetSpeedIndex(Sonogram::GetSpeedIndex() - 1); return true; }, nullptr},
    {kFaster, 1, [](View&, int) { Sonogram::SetSpeedIndex(Sonogram::GetSpeedIndex() + 1); return true; }, nullptr},
    {kNextColours, 1,
     [](View&, int) { Sonogram::SetColourScheme((Sonogram::GetColourScheme() + 1) % kColours); return true; },
     nullptr},
    {kOpenMenu, 1, [](View& v, int) { v.OpenMenu(); return true; }, nullptr},
    {kFirstSpeed, kSpeeds,
     [](View&, int speed) { Sonogram::SetSpeedIndex(speed); return true; },
     [](const View&, int speed) { return Sonogram::GetSpeedIndex() == speed; }},
    {kFirstColours, kColours,
     [](View&, int scheme) { Sonogram::SetColourScheme(scheme); return true; },
     [](const View&, int scheme) { return Sonogram::GetColourScheme() == scheme; }},
    {kFirstReference, kManyReferences,
     [](View& v, int index) { v.SetReference(kReferences[index]); return true; },
     [](const View&, int index) { return std::abs(Reference() - kReferences[index]) < 0.05; }},
    {kFirstInput, kFirstOfAnalyser - kFirstInput,
     [](View& v, int input) { v.m_shell.ChooseInput(input); ++v.m_choices; return true; },
     [](const View& v, int input) { return v.m_shell.CurrentInput() == input; }},
    {kFirstSensitivity, kSensitivities,
     [](View& v, int index) { s_sensitivity = index; return v.GetAnalyser().popupmenu_process(kFirstSensitivity + index); },
     [](const View&, int index) { return s_sensitivity == index; }},
    {kFirstOfAnalyser, 1000,
     [](View& v, int index) { return v.GetAnalyser().popupmenu_process(kFirstOfAnalyser + index); },
     [](const View& v, int index) { return v.GetAnalyser().popupmenu_checked(kFirstOfAnalyser + index); }},
};
// clang-format on

const View::Action* View::FindAction(int command) {
    for (const Action& action : kActions)
        if (command >= action.first && command - action.first < action.count) return &action;
    return nullptr;
}

bool View::IsChosen(int command) const {
    const Action* const action = FindAction(command);
    return action && action->isChosen && action->isChosen(*this, command - action->first);
}

bool View::Act(int command) {
    const Action* const action = FindAction(command);
    m_dirty = true;
    if (!action || !action->act(*this, command - action->first)) return false;
    FollowFirst();
    return true;
}

bool View::Do(int command) {
    const std::string before = GetSettings();
    const bool done = Act(command);
    if (GetSettings() != before) ++m_choices;
    return done;
}

void View::ToggleStrip() {
    kivspectrum& first = GetAnalyser();
    if (!first.GetTunerOn())
        first.ToggleTuner();
    else
        first.ShowTuner(!first.IsShowTuner());
}

void View::ToggleFrozen() {
    kivspectrum& first = GetAnalyser();
    first.SetFrozen(!first.GetFrozen());
    if (!first.GetFrozen()) LookBack(0.0);
}

// To the list of keys, its next page, and away again.
void View::TurnKeys() {
    m_keysPage = m_keysShown ? m_keysPage + 1 : 0;
    m_keysShown = m_keysPage < (m_keysShown ? m_keyPages : 1);
}

void View::CopyReading() {
    Say(m_shell.Copy(DescribeHeard()) ? "Copied the reading." : "There is no clipboard here.");
}

void View::Calibrate() {
    if (TunerCalibrateNow(*GetAnalyser().GetTuner()))
        SetReference(Reference());
    else
        Say("To calibrate, let one note sound steadily for half a second.");
}

}  // namespace analyser
