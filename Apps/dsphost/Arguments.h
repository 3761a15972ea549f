#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "AudioReader.h"
#include "OutputFile.h"
#include "PictureOptions.h"
#include "Render.h"

namespace dsphost {

// What each command is asked for, with its defaults, and the function that does it. CommandLine.cpp fills the
// records. A command throws UserError or IoError.

// What every command that writes takes.
struct WritingOptions {
    OutputRules rules;
    bool quiet = false;
};

// What every command that reads audio takes.
struct ReadingOptions {
    std::string input;
    std::int64_t spoolLimit = AudioReader::kUsualSpoolLimit;
};

struct ConvertArguments : ReadingOptions {
    std::string output, format, dither = "none";
    int rate = 0;
    bool exact = false;
    WritingOptions writing;
};
void RunConvert(ConvertArguments arguments);

struct DenoiseArguments : ReadingOptions {
    std::string output, profile, saveProfile, settings, residue, format;
    std::vector<std::string> learn;
    WritingOptions writing;
};
void RunDenoise(DenoiseArguments arguments);

struct EffectsArguments {
    std::string effect;
    bool json = false;
};
void RunEffects(EffectsArguments arguments);

struct EqCurveArguments {
    std::string effect, output;
    int rate = 48000;
    bool json = false;
    WritingOptions writing;
};
void RunEqCurve(EqCurveArguments arguments);

struct PitchArguments : ReadingOptions {
    std::string output, engine = "new", format;
    double semitones = 0.0, speed = 1.0;
    int quality = 4;
    WritingOptions writing;
};
void RunPitch(PitchArguments arguments);

struct RenderArguments : ReadingOptions {
    std::string output, format, automation, tail = "0";
    std::vector<std::string> effects, chunks;
    RenderOptions options;
    WritingOptions writing;
};
void RunRender(RenderArguments arguments);

struct SonogramArguments : ReadingOptions {
    std::string output;
    int scheme = 0;
    std::optional<int> speed;
    bool spectrum = false, pitch = false;
    PictureOptions drawing;
    WritingOptions writing;
};
void RunSonogram(SonogramArguments arguments);

struct SpectrumArguments : ReadingOptions {
    std::string picture, csv, profile, window = "blackman";
    int length = 4096;
    float overlap = 0.5f;
    PictureOptions drawing;
    WritingOptions writing;
};
void RunSpectrum(SpectrumArguments arguments);

struct TunerArguments : ReadingOptions {
    std::string output, method = "denoised", temperament = "Equal", sensitivity = "Standard";
    std::optional<double> at;
    bool json = false;
    PictureOptions drawing;
    WritingOptions writing;
};
void RunTuner(TunerArguments arguments);
const std::vector<std::string>& DetectionMethods();

// Texts of the effect's parameters; empty: its default.
struct TuneVoiceArguments : ReadingOptions {
    std::string output, format, scale = "Chromatic", retune, transition, ratio, lowest, notes, curve;
    PictureOptions drawing;
    WritingOptions writing;
};
void RunTuneVoice(TuneVoiceArguments arguments);

}  // namespace dsphost
