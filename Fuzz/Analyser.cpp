// An analyser as a display has it: samples, every entry of the menu, stored settings, refreshes and pictures.
#include <array>

#include "AnalyserPicture.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Spectrum/kivspectrum.h"

namespace {

using Fuzz::Input;

struct Session {
    Input& input;
    kivspectrum analyser{};
    int rate = 48000;

    template <typename Sample>
    void Feed() {
        const int channels = input.Between(1, 3), stride = channels + input.Between(0, 2);
        const int frames = input.Between(0, 9000);
        const auto block = input.Samples<Sample>(static_cast<std::size_t>(frames * stride));
        analyser.Feed(block.data(), frames, stride, channels);
    }
    void Menu() {
        const int command = input.Between(1190, 1410);  // beyond the table too
        analyser.popupmenu_process(command);
        analyser.popupmenu_checked(command);
    }
    void Refresh() { analyser.Refresh(); }
    void Prepare() {
        const std::vector<float>* spectrum = nullptr;
        std::array<bool, 6> flags;
        for (bool& flag : flags) flag = input.Flag();
        if (analyser.GetFFTFor3DSonogram(rate, &spectrum, flags[0], flags[1]))
            Fuzz::Require(!spectrum->empty(), "a frame has a spectrum");
        analyser.PrepareFFTForDrawing(rate, flags[2], flags[3], flags[4], flags[5]);
    }
    void Rate() {
        rate = input.Flag() ? input.Between(8000, 60000) : input.Raw<std::int32_t>();
        analyser.set_parameters(rate);
    }
    void Picture() { Fuzz::DrawAnything(input, analyser); }
    void Pointer() {
        const bool any = input.Flag();
        const float x = any ? input.Raw<float>() : input.Value() * 400.0f;
        analyser.SetPointer(x, any ? input.Raw<float>() : input.Value() * 300.0f);
        if (input.Flag()) analyser.ClearPointer();
    }
    void Switch() {
        switch (input.Between(0, 8)) {
            case 0:
                analyser.SetOn(input.Flag());
                break;
            case 1:
                analyser.SetTunerOn(input.Flag());
                break;
            case 2:
                analyser.ToggleTuner();
                break;
            case 3:
                analyser.SetFrozen(input.Flag());
                break;
            case 4:
                analyser.ToggleDisplayMode();
                break;
            case 5:
                analyser.ToggleDisplayMode2();
                break;
            case 6:
                analyser.ToggleShowInfoBoxes();
                break;
            case 7:
                analyser.allocate(input.Between(0, 1));
                break;
            default:
                analyser.peak_reset();
        }
    }
    // What a host stored, with a word changed.
    void Settings() {
        auto words = reinterpret_cast<std::int32_t*>(&kivspectrum::settings);
        const int word = input.Between(0, 23);
        if (word != 19) words[word] = input.Flag() ? input.Between(-1, 300) : input.Raw<std::int32_t>();
        analyser.ObserverUpdate();
    }
    void Measure() {
        const auto& drawer = *analyser.GetSpectrumDrawer();
        drawer.HighestPeak(input.Raw<double>());
        kivspectrum::SetAnalysisWindowsOverlap(input.Flag() ? input.Value() : input.Raw<float>());
        kivspectrum::SetDpi(input.Flag() ? input.Between(50, 300) : input.Raw<std::int32_t>());
    }
    void Tune() {
        Tuner::SetDetectionMethod(input.Between(-1, 6));
        Tuner::SetTemperament(input.Between(-1, 20));
        Tuner::SetNoteNaming(input.Between(-1, 4));
        Tuner::SetTunedQuantum(input.Raw<float>());
        analyser.GetTuner()->SetSensibilityPreset(input.Between(-1, 5));
        analyser.GetTuner()->SetWindowType(input.Between(-1, 6));
        if (input.Flag())
            TunerCalibrateNow(*analyser.GetTuner());
        else
            TunerCalibrateReset();
    }
    void Colours() {
        Corvo::Sonogram::SetSpeedIndex(input.Between(-1, 9));
        Corvo::Sonogram::SetColourScheme(input.Between(-1, 9));
        const auto x = input.Raw<float>(), y = input.Raw<float>();
        analyser.GetSonogram()->GetPointAmplitude(x, y, {0, 0, 100, 100});
        if (input.Flag())
            analyser.GetSonogram()->LookBack(input.Flag() ? input.Value() * 60.0 : input.Raw<double>());
        const auto amplitude = input.Raw<float>();
        analyser.GetSonogram()->ColorFromAmplitude(amplitude, input.Flag());
    }
};

constexpr void (Session::*kSteps[])() = {
    &Session::Feed<float>, &Session::Feed<double>, &Session::Refresh, &Session::Refresh, &Session::Refresh,
    &Session::Picture,     &Session::Picture,      &Session::Menu,    &Session::Menu,    &Session::Prepare,
    &Session::Rate,        &Session::Pointer,      &Session::Switch,  &Session::Switch,  &Session::Settings,
    &Session::Measure,     &Session::Tune,         &Session::Colours,
};

const Fuzz::Target target("Analyser", [](Input& input) {
    kivspectrum::settings = {};
    Corvo::Sonogram::SetSpeedIndex(3);
    Session session{.input = input};
    session.analyser.SetOn(true);
    for (int step = 0; step < 60 && !input.AtEnd(); ++step) (session.*input.OneOf(kSteps))();
});

}  // namespace
