#include "PluginTable.h"

#include "Adapter.h"
#include "DSP/Effects/EffectKinds.h"
#include "EqualiserEffect.h"
#include "PitchResults.h"

namespace Corvo::Plugins {
namespace {

// clang-format off
constexpr PluginRow kRows[]{
    // name         id            code    version  LV2                       CLAP                VST3          traits
    {"Gain",        "gain",        "DGai", 2, "AmplifierPlugin",  "utility",          "Tools",        0,                                  "Level, stereo width, pan and polarity"},
    {"Compressor",  "compressor",  "DCmp", 2, "CompressorPlugin", "compressor",       "Dynamics",     kSmooth,                            "Compressor, limiter, gate and expander on a transfer curve, with side-chain"},
    {"Tremolo",     "tremolo",     "DTrm", 2, "ModulatorPlugin",  "tremolo",          "Modulation",   0,                                  "Tremolo, auto-pan and ring modulation"},
    {"Equaliser",   "equaliser",   "DEqu", 2, "ParaEQPlugin",     "equalizer",        "EQ",           kRings | kSmooth,                   "Eight gliding bands: peaks of Q/133 octaves, shelves and passes"},
    {"Valvex",      "valvex",      "DVal", 2, "DistortionPlugin", "distortion",       "Distortion",   0,                                  "Tube distortion of four shapes, oversampled up to 16 times"},
    {"Echo",        "echo",        "DEch", 2, "DelayPlugin",      "delay",            "Delay",        kTempo | kRings,                    "Stereo delay in milliseconds or notes of the host's tempo"},
    {"Chorus",      "chorus",      "DCho", 2, "ChorusPlugin",     "chorus",           "Modulation",   kRings,                             "Chorus and flanger"},
    {"Phaser",      "phaser",      "DPha", 2, "PhaserPlugin",     "phaser",           "Modulation",   kRings | kOnlyClears,               "1 to 30 all-pass stages with feedback"},
    {"Reverb",      "reverb",      "DRev", 2, "ReverbPlugin",     "reverb",           "Reverb",       kRings,                             "Early reflections and damped combs"},
    {"Cantrix",     "cantrix",     "DCan", 4, "PitchPlugin",      "pitch-correction", "Pitch Shift",  kSmooth,                            "Pitch correction of a voice to a scale; formants stay", &kPitchResults},
    {"Pitch Shift", "pitch-shift", "DPit", 2, "PitchPlugin",      "pitch-shifter",    "Pitch Shift",  kMayWait | kShortPieces | kSmooth,  "Transposes by up to an octave up"},
    {"Denoiser",    "denoiser",    "DDen", 2, "SpectralPlugin",   "restoration",      "Restoration",  kSmooth,                            "Takes steady noise out of recordings, learned or found while it plays"},
};
// clang-format on

}  // namespace

std::unique_ptr<DSP::CorvoEffectBase> PluginRow::Make() const {
    const DSP::EffectKind* const kind = DSP::FindEffectKind(name);
    if (!kind) return std::make_unique<EqualiserEffect>();
    return kind->MakeReady();
}

std::span<const PluginRow> PluginRows() { return kRows; }

std::vector<std::string> PresetNamesOf(const PluginRow& row) {
    const auto effect = row.Make();
    std::vector<std::string> names;
    for (int i = 0; i < effect->NumPresets(); ++i) names.push_back(effect->GetPresetName(i));
    return names;
}

std::unique_ptr<Core> MakeCore(const PluginRow& row, int channels, Values values) {
    return std::make_unique<Adapter>(row, channels, values);
}

}  // namespace Corvo::Plugins
