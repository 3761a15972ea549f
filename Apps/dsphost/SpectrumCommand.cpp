#include <algorithm>
#include <bit>
#include <charconv>
#include <memory>
#include <numeric>
#include <optional>
#include <string>
#include <vector>

#include "Arguments.h"
#include "AudioReader.h"
#include "Errors.h"
#include "NoiseProfileFile.h"
#include "PictureOptions.h"
#include "Playback.h"
#include "Progress.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Drawer/VectorInterpolationFilterFloat.h"
#include "Spectrum/Scales/PowerToDecibels.h"
#include "Spectrum/Scales/SpectrumScales.h"
#include "Spectrum/kivspectrum.h"
#include "Text.h"

namespace dsphost {
namespace {

constexpr int kPeaksStay = 2;
constexpr int kShortest = 128, kLongest = 524288;
const std::vector<std::string> kWindows{"rectangular", "triangular", "hann", "hamming", "blackman"};

void Check(const SpectrumArguments& arguments) {
    if (arguments.picture.empty() && arguments.csv.empty())
        throw UserError("an output is missing; accepted: a picture (OUT.png), --csv FILE, or both");
    if (arguments.length < kShortest || arguments.length > kLongest ||
        !std::has_single_bit(static_cast<unsigned>(arguments.length)))
        throw UserError("--length cannot be " + std::to_string(arguments.length) +
                        "; accepted: powers of two from 128 to 524288");
    if (!(arguments.overlap >= 0.0f && arguments.overlap <= 0.99f))
        throw UserError("--overlap cannot be " + std::to_string(arguments.overlap) +
                        "; accepted: 0 to 0.99 of a window");
}

// The mean power spectrum of all whole windows of the input; an input shorter than one is followed by
// silence.
std::vector<double> AveragePower(AudioReader& input, kivspectrum& analyser,
                                 const SpectrumArguments& arguments) {
    const auto channels = static_cast<std::ptrdiff_t>(input.Channels());
    std::vector<double> sum(analyser.GetPower().size());
    std::vector<double> samples(static_cast<std::size_t>(arguments.length * channels));
    Progress progress("spectrum", input.Rate(), input.Frames(), arguments.writing.quiet);
    std::int64_t read = 0, spectra = 0;
    for (int wanted = arguments.length;; wanted = kivspectrum::settings.hop_length) {
        const int got = input.Read(samples.data(), wanted);
        if (got < wanted && spectra > 0) break;
        std::fill(samples.begin() + got * channels, samples.end(), 0.0);
        analyser.Feed(samples.data(), wanted, input.Channels(), input.Channels());
        analyser.PrepareFFTForDrawingHelper(false, false);
        if (arguments.profile.empty()) analyser.GetSpectrumDrawer()->AgePeaks();
        const auto& power = analyser.GetPower();
        for (std::size_t k = 0; k < sum.size(); ++k) sum[k] += power[k];
        ++spectra;
        progress.Update(read += got);
    }
    for (double& power : sum) power /= static_cast<double>(spectra);
    return sum;
}

// The learned noise as this analysis would show it; empty when none is asked for.
std::vector<double> ProfilePower(const SpectrumArguments& arguments, const kivspectrum& analyser, int rate) {
    if (arguments.profile.empty()) return {};
    Corvo::DSP::DenoiserProcessor denoiser;
    LoadNoiseProfile(denoiser, arguments.profile);
    std::vector<float> density(analyser.GetPower().size());
    if (!denoiser.LearnedDensity(rate, density.data(), static_cast<int>(density.size())))
        throw UserError(arguments.profile + ": its noise profile cannot be shown at " + std::to_string(rate) +
                        " Hz");
    const auto& window = analyser.GetWindow();
    const double energy = std::inner_product(window.begin(), window.end(), window.begin(), 0.0);
    std::vector<double> power;
    for (const float each : density) power.push_back(energy * static_cast<double>(each));
    return power;
}

std::string Csv(const std::vector<double>& power, const std::vector<double>& profile,
                const std::vector<float>& window, int rate, int length) {
    // A full-scale sine has half the window's sum as its amplitude.
    const double full = std::accumulate(window.begin(), window.end(), 0.0) / 2.0;
    std::string text = profile.empty() ? "frequency_hz,level_db\n" : "frequency_hz,level_db,profile_db\n";
    const auto append = [&text](double value, int digits, char end) {
        char number[64];
        const auto result =
            std::to_chars(number, number + sizeof number, value, std::chars_format::fixed, digits);
        text.append(number, result.ptr) += end;
    };
    for (std::size_t k = 0; k < power.size(); ++k) {
        const auto decibels = [&](double each) {
            const auto share = static_cast<float>(each / (full * full));
            float level;
            Corvo::PowerToDecibels(&share, &level, 1, 0.0f);
            return level;
        };
        append(static_cast<double>(k) * rate / length, 4, ',');
        append(decibels(power[k]), 3, profile.empty() ? '\n' : ',');
        if (!profile.empty()) append(decibels(profile[k]), 3, '\n');
    }
    return text;
}

// The curve is the mean, over the highest that each frequency ever reached. With a profile that is the curve,
// under the mean.
void Draw(kivspectrum& analyser, const std::vector<double>& power, const std::vector<double>& profile,
          Picture& picture) {
    auto& settings = kivspectrum::settings;
    SpectrumDrawer& drawer = *analyser.GetSpectrumDrawer();
    drawer.UpdateSettings(settings);
    VectorInterpolationFilterFloat unused;
    drawer.SmoothFftSpectrum({power.begin(), power.end()}, 0.0f, unused);
    if (!profile.empty()) {
        drawer.AgePeaks();
        drawer.SmoothFftSpectrum({profile.begin(), profile.end()}, 0.0f, unused);
    }
    picture.Paint([&](auto& target) { analyser.DoDrawSpectrum<PictureDrawing>(target, picture.Whole()); });
}

}  // namespace

void RunSpectrum(SpectrumArguments arguments) {
    Check(arguments);
    RefuseSameOutputs({arguments.picture, arguments.csv});
    arguments.writing.rules.inputs = {arguments.input, arguments.profile, arguments.drawing.font};
    auto& settings = kivspectrum::settings;
    settings.window_type = static_cast<std::int32_t>(FindName(arguments.window, kWindows, "window"));
    settings.window_length = arguments.length;
    settings.time_smoothing = 0;
    settings.peak_hold_mode = kPeaksStay;
    settings.view_option_e = static_cast<std::int32_t>(Corvo::CurveStyle::Filled);
    kivspectrum::SetAnalysisWindowsOverlap(arguments.overlap);

    AudioReader input(arguments.input, arguments.spoolLimit);
    RequireFormat(input, kMostChannels, "the analyser takes the mean of up to 64");
    kivspectrum analyser;
    analyser.set_parameters(input.Rate());
    analyser.SetOn(true);
    arguments.drawing.ApplyTo(analyser);
    std::optional<OutputFile> table;
    std::unique_ptr<OutputFile> drawing;
    std::unique_ptr<Picture> picture;
    if (!arguments.csv.empty()) table.emplace(arguments.csv, arguments.writing.rules);
    if (!arguments.picture.empty()) {
        picture = arguments.drawing.Make();
        drawing = OpenPicture(arguments.picture, arguments.writing.rules);
    }
    const auto profile = ProfilePower(arguments, analyser, input.Rate());
    const auto power = AveragePower(input, analyser, arguments);
    std::vector<OutputFile*> together;
    if (picture) {
        Draw(analyser, power, profile, *picture);
        Write(*picture, *drawing);
        together.push_back(drawing.get());
    }
    if (table) {
        const std::string text = Csv(power, profile, analyser.GetWindow(), input.Rate(), arguments.length);
        table->Bytes().Write(text.data(), text.size());
        together.push_back(&*table);
    }
    CommitTogether(together);
}

}  // namespace dsphost
