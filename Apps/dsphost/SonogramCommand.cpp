#include <algorithm>
#include <cmath>
#include <optional>
#include <string>

#include "Arguments.h"
#include "AudioReader.h"
#include "Errors.h"
#include "PictureOptions.h"
#include "Playback.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/kivspectrum.h"

namespace dsphost {
namespace {

constexpr int kSlowest = 0, kFastest = 8, kLastScheme = 6;

void Check(int value, int first, int last, const std::string& option) {
    if (value < first || value > last)
        throw UserError(option + " cannot be " + std::to_string(value) +
                        "; accepted: " + std::to_string(first) + " to " + std::to_string(last));
}

// The fastest speed at which the whole file fits into so many columns; the slowest when none does or its
// length is not known.
int SpeedFor(const AudioReader& input, int columns) {
    if (!input.Frames()) return kSlowest;
    const double seconds = static_cast<double>(*input.Frames()) / input.Rate();
    for (int speed = kFastest; speed > kSlowest; --speed) {
        Corvo::Sonogram::SetSpeedIndex(speed);
        if (seconds * Corvo::Sonogram::GetColumnsPerSecond() <= columns) return speed;
    }
    return kSlowest;
}

// How many columns a file shorter than the picture leaves empty; some stay for the picture's sake.
int SpareColumns(const AudioReader& input, int columns) {
    constexpr double kLeastColumns = 480;
    if (!input.Frames()) return 0;
    const double seconds = static_cast<double>(*input.Frames()) / input.Rate();
    const double needed = std::ceil(seconds * Corvo::Sonogram::GetColumnsPerSecond());
    return std::max(columns - static_cast<int>(std::min(std::max(needed, kLeastColumns), 1.0 * columns)), 0);
}

}  // namespace

void RunSonogram(SonogramArguments arguments) {
    if (arguments.speed) Check(*arguments.speed, kSlowest, kFastest, "--speed");
    Check(arguments.scheme, 0, kLastScheme, "--scheme");
    arguments.writing.rules.inputs = {arguments.input, arguments.drawing.font};
    AudioReader input(arguments.input, arguments.spoolLimit);
    RequireFormat(input, kMostChannels, "the analyser takes the mean of up to 64");
    auto picture = arguments.drawing.Make();

    kivspectrum analyser;
    analyser.set_parameters(input.Rate());
    analyser.SetOn(true);
    analyser.SetTunerOn(arguments.pitch);
    if (arguments.pitch) UseTunerWindow(input.Rate());
    kivspectrum::SetAnalysisWindowsOverlap(kDisplayOverlap);
    analyser.ObserverUpdate();
    arguments.drawing.ApplyTo(analyser);
    const auto output = OpenPicture(arguments.output, arguments.writing.rules);
    Corvo::Sonogram::SetColourScheme(arguments.scheme);
    analyser.ShowSonogram(true);
    const auto draw = [&](auto& target) {
        if (arguments.spectrum)
            analyser.DoDrawSonogramAndSpectrum<PictureDrawing>(target, picture->Whole());
        else
            analyser.DrawSonogramComponents<PictureDrawing>(target, picture->Whole());
    };
    picture->Paint(draw);  // makes the sonogram as wide as it will be
    const int columns = analyser.GetSonogram()->GetBitmap().width;
    Corvo::Sonogram::SetSpeedIndex(arguments.speed ? *arguments.speed : SpeedFor(input, columns));
    picture = arguments.drawing.Make(SpareColumns(input, columns));
    picture->Paint(draw);
    // The spectrum above would otherwise end in silence.
    const bool toTheEnd = !arguments.spectrum;
    PlayThrough(input, analyser, "sonogram", arguments.writing.quiet, toTheEnd, [&](double seconds) {
        analyser.Refresh();
        analyser.GetSonogram()->SetTimeAtRightEdge(seconds);
        analyser.GetSpectrumDrawer()->AgePeaks();  // as drawing every refresh would
    });
    picture->Paint(draw);
    Save(*picture, *output);
}

}  // namespace dsphost
