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

constexpr int kSpeeds = 9, kColours = 7, kManyReferences = static_cast<int>(std::size(kReferences));
constexpr const char* kSpeedTexts[kSpeeds] = {
    "5 columns a second", "10", "15", "30", "60", "90", "150", "300", "450"};
constexpr const char* kColourTexts[kColours] = {
    "Blue and red", "Blue and green", "Orange and yellow", "Red", "Green", "Blue", "Grey"};
constexpr int kFirstSensitivity = 1344, kLastSensitivity = 1349;
constexpr double kSkipSeconds = 5.0;

double Reference() { return 4.0 * Tuner::GetCalibrationBase(); }

bool IsWithin(int command, int first, int count) { return command >= first && command < first + count; }

}  // namespace

std::vector<MenuGroup> View::MakeMenu() const {
    std::vector<MenuGroup> groups;
    const auto group = [&](std::string_view name) -> std::vector<MenuEntry>& {
        if (groups.empty() || groups.back().text != name) groups.push_back({std::string(name), {}});
        return groups.back().entries;
    };
    const auto add = [&](std::string_view to, std::string text, const char* shortcut, int command) {
        group(to).push_back({std::move(text), shortcut, command, IsChosen(command)});
    };
    const bool plays = m_shell.GetPlayback().has_value();
    const auto inputs = m_shell.Inputs();
    for (const CommandRow& row : Commands()) {
        const std::string_view name = row.group;
        if (name.empty() || (row.command == kPlay && !plays)) continue;
        if (row.command == kFullScreen && !m_shell.CanFillScreen()) continue;
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
        add(entry.group, entry.text, entry.command == 1295 ? "R" : "", entry.command);
    return groups;
}

bool View::IsChosen(int command) const {
    const kivspectrum& first = GetAnalyser();
    const auto mode = first.GetDisplayMode();
    if (IsWithin(command, kFirstSpeed, kSpeeds)) return Sonogram::GetSpeedIndex() == command - kFirstSpeed;
    if (IsWithin(command, kFirstColours, kColours))
        return Sonogram::GetColourScheme() == command - kFirstColours;
    if (IsWithin(command, kFirstReference, kManyReferences))
        return std::abs(Reference() - kReferences[command - kFirstReference]) < 0.05;
    if (command >= kFirstSensitivity && command <= kLastSensitivity)
        return command - kFirstSensitivity == s_sensitivity;
    if (command >= kFirstOfAnalyser) return first.popupmenu_checked(command);
    if (command >= kFirstInput) return m_shell.CurrentInput() == command - kFirstInput;
    switch (command) {
        case kShowSpectrum:
            return mode == kivspectrum::display_spectrum;
        case kShowSonogram:
            return mode == kivspectrum::display_sonogram;
        case kShowBoth:
            return mode == kivspectrum::display_both;
        case kShowTuner:
            return mode == kivspectrum::display_tuner;
        case kTunerStrip:
            return first.IsShowTuner();
        case kFreeze:
            return first.GetFrozen();
        case kTone:
            return m_shell.IsToneOn();
        case kShowKeys:
            return m_keysShown;
        default:
            return false;
    }
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

bool View::Do(int command) {
    kivspectrum& first = GetAnalyser();
    m_dirty = true;
    ++m_choices;
    if (command >= kFirstOfAnalyser) {
        if (!first.popupmenu_process(command)) return false;
        if (command >= kFirstSensitivity && command <= kLastSensitivity)
            s_sensitivity = command - kFirstSensitivity;
        FollowFirst();
        return true;
    }
    if (IsWithin(command, kFirstSpeed, kSpeeds)) {
        Sonogram::SetSpeedIndex(command - kFirstSpeed);
        return true;
    }
    if (IsWithin(command, kFirstColours, kColours)) {
        Sonogram::SetColourScheme(command - kFirstColours);
        return true;
    }
    if (IsWithin(command, kFirstReference, kManyReferences)) {
        SetReference(kReferences[command - kFirstReference]);
        return true;
    }
    if (command >= kFirstInput) {
        m_shell.ChooseInput(command - kFirstInput);
        return true;
    }
    const auto skip = [&](double seconds) {
        const auto playback = m_shell.GetPlayback();
        if (!playback) return LookBack(SecondsBack() - seconds);
        m_shell.Seek(std::clamp(playback->position + seconds, 0.0, playback->length));
        return true;
    };
    switch (command) {
        case kShowSpectrum:
            ShowMode(kivspectrum::display_spectrum);
            break;
        case kShowSonogram:
            ShowMode(kivspectrum::display_sonogram);
            break;
        case kShowBoth:
            ShowMode(kivspectrum::display_both);
            break;
        case kShowTuner:
            ShowMode(kivspectrum::display_tuner);
            break;
        case kTunerStrip:
            if (!first.GetTunerOn())
                first.ToggleTuner();
            else
                first.ShowTuner(!first.IsShowTuner());
            break;
        case kFreeze:
            first.SetFrozen(!first.GetFrozen());
            if (!first.GetFrozen()) LookBack(0.0);
            break;
        case kZoomIn:
        case kZoomOut: {
            const auto pointed = ReadingAt(m_pointer.x, m_pointer.y);
            Zoom(pointed.frequency, command == kZoomIn ? 0.5 : 2.0);
            break;
        }
        case kWholeRange:
            SetSpan(0.0, 1.0);
            break;
        case kFullScreen:
            m_shell.ToggleFullScreen();
            break;
        case kShowKeys:
            m_keysShown = !m_keysShown;
            break;
        case kSavePicture:
            Save(Kind::Png);
            break;
        case kSaveSvg:
            Save(Kind::Svg);
            break;
        case kSavePdf:
            Save(Kind::Pdf);
            break;
        case kCopyReading:
            Say(m_shell.Copy(DescribeHeard()) ? "Copied the reading." : "There is no clipboard here.");
            break;
        case kPlay:
            m_shell.TogglePlaying();
            return m_shell.GetPlayback().has_value();
        case kBack:
            return skip(-kSkipSeconds);
        case kForward:
            return skip(kSkipSeconds);
        case kNow:
            return LookBack(0.0);
        case kLowerReference:
            SetReference(std::ceil(Reference() - 1.001));
            break;
        case kHigherReference:
            SetReference(std::floor(Reference() + 1.001));
            break;
        case kCalibrate:
            if (TunerCalibrateNow(*first.GetTuner()))
                SetReference(Reference());
            else
                Say("To calibrate, let one note sound steadily for half a second.");
            break;
        case kTone:
            m_shell.SetTone(!m_shell.IsToneOn());
            break;
        case kResetPeaks:
            for (kivspectrum& each : m_analysers) each.peak_reset();
            break;
        case kSlower:
            Sonogram::SetSpeedIndex(Sonogram::GetSpeedIndex() - 1);
            break;
        case kFaster:
            Sonogram::SetSpeedIndex(Sonogram::GetSpeedIndex() + 1);
            break;
        case kNextColours:
            Sonogram::SetColourScheme((Sonogram::GetColourScheme() + 1) % kColours);
            break;
        case kOpenMenu:
            m_menu.Open(MakeMenu(), m_pointer.x >= 0.0f ? m_pointer : Corvo::PointF{0.0f, 0.0f});
            break;
        default:
            return false;
    }
    FollowFirst();
    return true;
}

}  // namespace analyser
