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
    if (arguments.picture == "-" && arguments.csv == "-")
        throw UserError("picture and table cannot both go to standard output");
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
        analyser.GetSpectrumDrawer()->AgePeaks();
        const auto& power = analyser.GetPower();
        for (std::size_t k = 0; k < sum.size(); ++k) sum[k] += power[k];
        ++spectra;
        progress.Update(read += got);
    }
    for (double& power : sum) power /= static_cast<double>(spectra);
    return sum;
}

std::string Csv(const std::vector<double>& power, const std::vector<float>& window, int rate, int length) {
    // A full-scale sine has half the window's sum as its amplitude.
    const double full = std::accumulate(window.begin(), window.end(), 0.0) / 2.0;
    std::string text = "frequency_hz,level_db\n";
    const auto append = [&text](double value, int digits, char end) {
        char number[64];
        const auto result =
            std::to_chars(number, number + sizeof number, value, std::chars_format::fixed, digits);
        text.append(number, result.ptr) += end;
    };
    for (std::size_t k = 0; k < power.size(); ++k) {
        const auto share = static_cast<float>(power[k] / (full * full));
        float level;
        Corvo::PowerToDecibels(&share, &level, 1, 0.0f);
        append(static_cast<double>(k) * rate / length, 4, ',');
        append(level, 3, '\n');
    }
    return text;
}

// The curve is the mean, over the highest that each frequency ever reached.
void Draw(kivspectrum& analyser, const std::vector<double>& power, Picture& picture) {
    auto& settings = kivspectrum::settings;
    SpectrumDrawer& drawer = *analyser.GetSpectrumDrawer();
    drawer.UpdateSettings(settings);
    VectorInterpolationFilterFloat unused;
    drawer.SmoothFftSpectrum({power.begin(), power.end()}, 0.0f, unused);
    picture.Paint([&](auto& target) { analyser.DoDrawSpectrum<PictureDrawing>(target, picture.Whole()); });
}

}  // namespace

void RunSpectrum(SpectrumArguments arguments) {
    Check(arguments);
    arguments.writing.rules.inputs = {arguments.input};
    auto& settings = kivspectrum::settings;
    settings.window_type = static_cast<std::int32_t>(FindName(arguments.window, kWindows, "window"));
    settings.window_length = arguments.length;
    settings.time_smoothing = 0;
    settings.peak_hold_mode = kPeaksStay;
    settings.view_option_e = static_cast<std::int32_t>(Corvo::CurveStyle::Filled);
    kivspectrum::SetAnalysisWindowsOverlap(arguments.overlap);

    AudioReader input(arguments.input);
    RequireFormat(input, kMostChannels, "the analyser takes the mean of up to 64");
    kivspectrum analyser;
    analyser.set_parameters(input.Rate());
    analyser.SetOn(true);
    arguments.drawing.ApplyTo(analyser);
    std::optional<OutputFile> table, drawing;
    std::unique_ptr<Picture> picture;
    if (!arguments.csv.empty()) table.emplace(arguments.csv, arguments.writing.rules);
    if (!arguments.picture.empty()) {
        picture = arguments.drawing.Make();
        drawing.emplace(arguments.picture, arguments.writing.rules);
    }
    const auto power = AveragePower(input, analyser, arguments);
    if (picture) Draw(analyser, power, *picture);
    if (table) {
        const std::string text = Csv(power, analyser.GetWindow(), input.Rate(), arguments.length);
        table->Bytes().Write(text.data(), text.size());
    }
    if (picture) Save(*picture, *drawing);
    if (table) table->Commit();
}

}  // namespace dsphost
