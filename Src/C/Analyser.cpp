#include <algorithm>
#include <cmath>
#include <cstdint>
#include <iterator>
#include <memory>
#include <span>
#include <vector>

#include "C/AnalyserHandle.h"
#include "C/Calls.h"
#include "Picture/DrawingBitmap.h"
#include "Spectrum/AnalyserMenu.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Scales/PowerToDecibels.h"
#include "Spectrum/Scales/SpectrumScales.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Spectrum/kivspectrum.h"

namespace {

using namespace Corvo::C;

constexpr int kMostChannels = 64, kLargestSide = 16384;

struct Analyser : Object {
    static constexpr Kind kKind = Kind::Analyser;
    explicit Analyser(int rate) : Object(kKind) {
        Require(rate > 0, "the rate must be above 0");
        spectrum.set_parameters(rate);
        spectrum.SetOn(true);
    }
    kivspectrum spectrum;
};

template <typename Call>
dsp_status WithAnalyser(dsp_analyser* analyser, Call call) {
    return With<Analyser>(analyser, [&](Analyser& a) { return call(a.spectrum); });
}

template <typename Sample>
dsp_status Feed(dsp_analyser* analyser, const Sample* samples, int32_t frames, int32_t channels) {
    return WithAnalyser(analyser, [&](kivspectrum& a) -> dsp_status {
        if (frames < 0 || !Within(channels, 1, kMostChannels)) return DSP_OUT_OF_RANGE;
        if (frames > 0 && !samples) return DSP_NULL;
        a.Feed(samples, frames, channels, channels);
        return DSP_OK;
    });
}

const std::vector<float>* PowersOf(kivspectrum& analyser, int which) {
    switch (which) {
        case DSP_SPECTRUM_NOW:
            return &analyser.GetPower();
        case DSP_SPECTRUM_SMOOTHED:
            return &analyser.GetSpectrumDrawer()->GetPowerSmoothed();
        case DSP_SPECTRUM_PEAKS:
            return &analyser.GetSpectrumDrawer()->GetPeaks();
        default:
            return nullptr;
    }
}

struct Switch {
    void (kivspectrum::*set)(bool);
    bool (kivspectrum::*get)() const;
};
constexpr Switch kSwitches[]{
    {&kivspectrum::SetOn, &kivspectrum::GetOn},
    {&kivspectrum::SetTunerOn, &kivspectrum::GetTunerOn},
    {&kivspectrum::SetFrozen, &kivspectrum::GetFrozen},
    {&kivspectrum::ShowSonogram, &kivspectrum::IsShowSonogram},
    {&kivspectrum::SetShowInfoBox, &kivspectrum::IsShowInfoBox},
};
static_assert(DSP_SHOW_INFO + 1 == std::size(kSwitches));

// call(kivspectrum&, const Switch&)
template <typename Call>
dsp_status WithSwitch(dsp_analyser* analyser, int32_t which, Call call) {
    return WithAnalyser(analyser, [&](kivspectrum& a) -> dsp_status {
        if (!Within(which, 0, DSP_SHOW_INFO)) return DSP_OUT_OF_RANGE;
        return call(a, kSwitches[which]);
    });
}

dsp_status GiveMenu(int32_t entry, const char* Corvo::AnalyserMenuEntry::*text, char* buffer, size_t size,
                    size_t* needed) {
    if (!Within(entry, 0, dsp_menu_entries() - 1)) return DSP_OUT_OF_RANGE;
    return GiveText(Corvo::AnalyserMenu()[static_cast<std::size_t>(entry)].*text, buffer, size, needed);
}

}  // namespace

dsp_status Corvo::C::AnalyserBehind(dsp_analyser* handle, kivspectrum*& analyser) {
    return WithAnalyser(handle, [&](kivspectrum& found) { analyser = &found; });
}

dsp_status DSP_CALL dsp_analyser_create(int32_t rate, dsp_analyser** analyser, dsp_error* error) {
    return Create(analyser, error, [rate] { return std::make_unique<Analyser>(rate); });
}

dsp_status DSP_CALL dsp_analyser_switch(dsp_analyser* analyser, int32_t which, int32_t on) {
    return WithSwitch(analyser, which, [on](kivspectrum& a, const Switch& found) {
        (a.*found.set)(on != 0);
        return DSP_OK;
    });
}
dsp_status DSP_CALL dsp_analyser_is_on(dsp_analyser* analyser, int32_t which, int32_t* on) {
    return WithSwitch(analyser, which, [on](kivspectrum& a, const Switch& found) {
        return Give<int32_t>((a.*found.get)(), on);
    });
}

dsp_status DSP_CALL dsp_analyser_feed_f32(dsp_analyser* analyser, const float* samples, int32_t frames,
                                          int32_t channels) {
    return Feed(analyser, samples, frames, channels);
}
dsp_status DSP_CALL dsp_analyser_feed_f64(dsp_analyser* analyser, const double* samples, int32_t frames,
                                          int32_t channels) {
    return Feed(analyser, samples, frames, channels);
}

dsp_status DSP_CALL dsp_analyser_refresh(dsp_analyser* analyser, int32_t* fresh) {
    return WithAnalyser(analyser, [fresh](kivspectrum& a) {
        const bool isNew = a.Refresh();
        if (fresh) *fresh = isNew;
    });
}

dsp_status DSP_CALL dsp_analyser_spectrum(dsp_analyser* analyser, int32_t which, float* decibels,
                                          size_t count, size_t* needed) {
    return WithAnalyser(analyser, [&](kivspectrum& a) -> dsp_status {
        const auto* const powers = PowersOf(a, which);
        if (!powers) return DSP_OUT_OF_RANGE;
        const double full = Corvo::FullScalePower(kivspectrum::GetSettings());
        return GiveArray(powers->size(), decibels, count, needed, [&](float* to) {
            Corvo::PowerToDecibels(powers->data(), to, powers->size(),
                                   static_cast<float>(-10.0 * std::log10(full)));
        });
    });
}

dsp_status DSP_CALL dsp_analyser_frequencies(dsp_analyser* analyser, float* hz, size_t count,
                                             size_t* needed) {
    return WithAnalyser(analyser, [&](kivspectrum& a) {
        const std::size_t bins = a.GetPower().size();
        const double step = a.GetSpectrumDrawer()->GetSamplingFrequency() /
                            (2.0 * static_cast<double>(std::max<std::size_t>(bins, 1)));
        return GiveArray(bins, hz, count, needed, [&](float* to) {
            for (std::size_t k = 0; k < bins; ++k) to[k] = static_cast<float>(static_cast<double>(k) * step);
        });
    });
}

dsp_status DSP_CALL dsp_analyser_highest_peak(dsp_analyser* analyser, double lowest, double* hz,
                                              double* decibels) {
    return WithAnalyser(analyser, [&](kivspectrum& a) -> dsp_status {
        if (std::isnan(lowest)) return DSP_OUT_OF_RANGE;
        const auto peak = a.GetSpectrumDrawer()->HighestPeak(lowest);
        if (hz) *hz = peak.frequency;
        if (decibels) *decibels = peak.level;
        return DSP_OK;
    });
}

dsp_status DSP_CALL dsp_analyser_forget_peaks(dsp_analyser* analyser) {
    return WithAnalyser(analyser, [](kivspectrum& a) { a.peak_reset(); });
}

int32_t DSP_CALL dsp_menu_entries(void) { return static_cast<int32_t>(Corvo::AnalyserMenu().size()); }
dsp_status DSP_CALL dsp_menu_command(int32_t entry, int32_t* command) {
    if (!Within(entry, 0, dsp_menu_entries() - 1)) return DSP_OUT_OF_RANGE;
    return Give(Corvo::AnalyserMenu()[static_cast<std::size_t>(entry)].command, command);
}
dsp_status DSP_CALL dsp_menu_group(int32_t entry, char* buffer, size_t size, size_t* needed) {
    return GiveMenu(entry, &Corvo::AnalyserMenuEntry::group, buffer, size, needed);
}
dsp_status DSP_CALL dsp_menu_text(int32_t entry, char* buffer, size_t size, size_t* needed) {
    return GiveMenu(entry, &Corvo::AnalyserMenuEntry::text, buffer, size, needed);
}

dsp_status DSP_CALL dsp_analyser_command(dsp_analyser* analyser, int32_t command) {
    return WithAnalyser(analyser, [command](kivspectrum& a) -> dsp_status {
        return a.popupmenu_process(command) ? DSP_OK : DSP_UNKNOWN;
    });
}
dsp_status DSP_CALL dsp_analyser_is_checked(dsp_analyser* analyser, int32_t command, int32_t* checked) {
    return WithAnalyser(analyser, [&](kivspectrum& a) -> dsp_status {
        if (!Corvo::FindAnalyserMenuEntry(command)) return DSP_UNKNOWN;
        return Give<int32_t>(a.popupmenu_checked(command), checked);
    });
}

dsp_status DSP_CALL dsp_analyser_tuner(dsp_analyser* analyser, dsp_tuner_reading* reading) {
    return WithAnalyser(analyser, [reading](kivspectrum& a) {
        const Tuner& tuner = *a.GetTuner();
        const TunedNote note = tuner.GetTunedNote();
        dsp_tuner_reading now{};
        now.note = -1;
        if (note.note >= 0)
            now = {0,
                   note.note,
                   note.octave,
                   tuner.IsTunedCentered(),
                   tuner.GetFrequency(),
                   tuner.GetHeardFrequency(),
                   static_cast<double>(tuner.GetErrorCents()),
                   static_cast<double>(tuner.GetProminence())};
        return GiveRecord(now, reading);
    });
}

dsp_status DSP_CALL dsp_note_name(int32_t note, char* buffer, size_t size, size_t* needed) {
    if (!Within(note, 0, 11)) return DSP_OUT_OF_RANGE;
    return GiveText(Tuner::GetNoteName(note), buffer, size, needed);
}

dsp_status DSP_CALL dsp_sonogram_resize(dsp_analyser* analyser, int32_t width, int32_t height) {
    return WithAnalyser(analyser, [&](kivspectrum& a) -> dsp_status {
        if (!Within(width, 1, kLargestSide) || !Within(height, 1, kLargestSide) ||
            static_cast<std::int64_t>(width) * height > Corvo::DrawingBitmap::kMostPixels)
            return DSP_OUT_OF_RANGE;
        a.GetSonogram()->CheckPixelBufferSize(
            {0.0f, 0.0f, static_cast<float>(width), static_cast<float>(height)}, height);
        return DSP_OK;
    });
}

dsp_status DSP_CALL dsp_sonogram_pixels(dsp_analyser* analyser, uint32_t* pixels, size_t count,
                                        size_t* needed) {
    return WithAnalyser(analyser, [&](kivspectrum& a) {
        const auto& picture = a.GetSonogram()->GetBitmap().pixels;
        return GiveArray(picture.size(), pixels, count, needed,
                         [&](std::uint32_t* to) { std::ranges::copy(picture, to); });
    });
}

dsp_status DSP_CALL dsp_sonogram_frequencies(dsp_analyser* analyser, float* hz, size_t count,
                                             size_t* needed) {
    return WithAnalyser(analyser, [&](kivspectrum& a) {
        const auto& sonogram = *a.GetSonogram();
        const int rows = sonogram.GetBitmap().height;
        return GiveArray(static_cast<std::size_t>(rows), hz, count, needed, [&](float* to) {
            for (int row = 0; row < rows; ++row)
                to[row] = static_cast<float>(sonogram.GetFrequencyMap().XToFrequency(rows - row - 0.5));
        });
    });
}

dsp_status DSP_CALL dsp_sonogram_pitches(dsp_analyser* analyser, float* hz, size_t count, size_t* needed) {
    return WithAnalyser(analyser, [&](kivspectrum& a) {
        const auto& sonogram = *a.GetSonogram();
        const int columns = sonogram.GetBitmap().width;
        return GiveArray(static_cast<std::size_t>(columns), hz, count, needed, [&](float* to) {
            for (int column = 0; column < columns; ++column) to[column] = sonogram.GetPitch(column);
        });
    });
}
