#include "PluginTable.h"

#include "Adapter.h"
#include "DSP/Effects/EffectKinds.h"
#include "EqualiserEffect.h"
#include "PitchResults.h"

namespace Corvo::Plugins {
namespace {

// clang-format off
constexpr PluginRow kRows[]{
    // name         id            code    version  LV2                       CLAP                VST3          real time, short pieces, tempo, rings, smooth
    {"Gain",        "gain",        "DGai", 2, "AmplifierPlugin",  "utility",          "Tools",        true,  false, false, false, false, "Level, stereo width, pan and polarity"},
    {"Compressor",  "compressor",  "DCmp", 2, "CompressorPlugin", "compressor",       "Dynamics",     true,  false, false, false, true,  "Compressor, limiter, gate and expander on a transfer curve, with side-chain"},
    {"Tremolo",     "tremolo",     "DTrm", 2, "ModulatorPlugin",  "tremolo",          "Modulation",   true,  false, false, false, false, "Tremolo, auto-pan and ring modulation"},
    {"Equaliser",   "equaliser",   "DEqu", 2, "ParaEQPlugin",     "equalizer",        "EQ",           true,  false, false, true,  true,  "Eight gliding bands: peaks of Q/133 octaves, shelves and passes"},
    {"Valvex",      "valvex",      "DVal", 2, "DistortionPlugin", "distortion",       "Distortion",   true,  false, false, false, false, "Tube distortion of four shapes, oversampled up to 16 times"},
    {"Echo",        "echo",        "DEch", 2, "DelayPlugin",      "delay",            "Delay",        true,  false, true,  true,  false, "Stereo delay in milliseconds or notes of the host's tempo"},
    {"Chorus",      "chorus",      "DCho", 2, "ChorusPlugin",     "chorus",           "Modulation",   true,  false, false, true,  false, "Chorus and flanger"},
    {"Phaser",      "phaser",      "DPha", 2, "PhaserPlugin",     "phaser",           "Modulation",   true,  false, false, true,  false, "1 to 30 all-pass stages with feedback"},
    {"Reverb",      "reverb",      "DRev", 2, "ReverbPlugin",     "reverb",           "Reverb",       true,  false, false, true,  false, "Early reflections and damped combs"},
    {"Cantrix",     "cantrix",     "DCan", 4, "PitchPlugin",      "pitch-correction", "Pitch Shift",  true,  false, false, false, true,  "Pitch correction of a voice to a scale; formants stay", &kPitchResults},
    {"Pitch Shift", "pitch-shift", "DPit", 2, "PitchPlugin",      "pitch-shifter",    "Pitch Shift",  false, true,  false, false, true,  "Transposes by up to an octave up"},
    {"Denoiser",    "denoiser",    "DDen", 2, "SpectralPlugin",   "restoration",      "Restoration",  true,  false, false, false, true,  "Takes steady noise out of recordings, learned or found while it plays"},
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
