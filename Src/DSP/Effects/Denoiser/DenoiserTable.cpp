#include "DSP/Effects/Denoiser/DenoiserTable.h"

#include <cmath>

#include "DSP/Effects/Denoiser/DenoiserPresets.h"
#include "DSP/Effects/Parameters/ParameterText.h"

namespace Corvo::DSP::Denoising {
namespace {

using DenoiserPresets::kMaskedOff;

constexpr Choice kProfiles[]{{"Learned", 0.0f}, {"Following", 0.5f}, {"Adaptive", 1.0f}};
constexpr Choice kMaterials[]{{"Speech", 0.0f}, {"Music", 1.0f}};
constexpr Choice kListens[]{{"Output", 0.0f}, {"Residue", 1.0f}};
constexpr Choice kSizes[]{{kSizeSets[0].name, 0.0f},
                          {kSizeSets[1].name, FixedPoint{3.0f, 0.0f}.Normalised(1)},
                          {kSizeSets[2].name, FixedPoint{3.0f, 0.0f}.Normalised(2)},
                          {kSizeSets[3].name, 1.0f}};
constexpr std::int32_t kNeverSilent = -10000;

// Decibels, and "Off" at the top.
constexpr Shown kMasked{
    [](const ParameterRow& row, double normalised) {
        if (row.storage.map.Word(static_cast<float>(normalised)) >= kMaskedOff) return std::wstring(L"Off");
        return ParameterTexts::Number(row, normalised);
    },
    [](const ParameterRow& row, const std::string& text) {
        return StartsWithNoCase(Trimmed(text), "Off") ? 1.0f : ParameterTexts::ReadInteger(row, text);
    },
    0.1, 1};

enum Section { kProfile, kReduction, kEngine, kGains, kRanges };

constexpr ParameterRow BandGain(const wchar_t* label, std::size_t band) {
    return {label,
            L"dB",
            MPT_FLOAT,
            {240.0f, -120.0f},
            TenthsOfDb(kNeverSilent),
            WordAt(&Settings::gains, 0) + band,
            kGains};
}
constexpr ParameterRow BandRange(const wchar_t* label, std::size_t band) {
    return {label,  L"dB", MPT_FLOAT, {600.0f, 0.0f}, Steps(0.1), WordAt(&Settings::ranges, 0) + band,
            kRanges};
}

// clang-format off
constexpr std::array<ParameterRow, 28> kRows{{
    // label                 unit   type       span     floor     shown as                  word of the settings             section
    {L"Profile",             L"",   MPT_ENUM,  {   2.0f,   0.0f}, OneOf(kProfiles),         WordAt(&Settings::profile),      kProfile},
    {L"Learn",               L"",   MPT_BOOL,  SwitchWord(),      OnOff(),                  WordAt(&Settings::learn),        kProfile},
    {L"Clear profile",       L"",   MPT_BOOL,  SwitchWord(),      OnOff(),                  WordAt(&Settings::clear),        kProfile},
    {L"Reduction",           L"dB", MPT_FLOAT, { 600.0f,   0.0f}, Steps(0.1),               WordAt(&Settings::reduction),    kReduction},
    {L"Sensitivity",         L"dB", MPT_FLOAT, { 120.0f, -60.0f}, TenthsOfDb(kNeverSilent), WordAt(&Settings::sensitivity),  kReduction},
    {L"Detail",              L"dB", MPT_FLOAT, { 120.0f,  60.0f}, Steps(0.1),               WordAt(&Settings::detail),       kReduction},
    {L"Residual whitening",  L"%",  MPT_FLOAT, {1000.0f,   0.0f}, Steps(0.1),               WordAt(&Settings::whitening),    kReduction},
    {L"Keep masked noise",   L"dB", MPT_FLOAT, { 300.0f,   0.0f}, kMasked,                  WordAt(&Settings::masked),       kReduction},
    {L"FFT size",            L"",   MPT_ENUM,  {   3.0f,   0.0f}, OneOf(kSizes),            WordAt(&Settings::fftSize),      kEngine},
    {L"Material",            L"",   MPT_ENUM,  {   1.0f,   0.0f}, OneOf(kMaterials),        WordAt(&Settings::material),     kEngine},
    {L"Listen",              L"",   MPT_ENUM,  {   1.0f,   0.0f}, OneOf(kListens),          WordAt(&Settings::listen),       kEngine},
    {L"Mix",                 L"%",  MPT_FLOAT, {1000.0f,   0.0f}, Steps(0.1),               WordAt(&Settings::mix),          kEngine},
    BandGain(L"Gain 63 Hz", 0),  BandGain(L"Gain 125 Hz", 1), BandGain(L"Gain 250 Hz", 2), BandGain(L"Gain 500 Hz", 3),
    BandGain(L"Gain 1 kHz", 4),  BandGain(L"Gain 2 kHz", 5),  BandGain(L"Gain 4 kHz", 6),  BandGain(L"Gain 8 kHz", 7),
    BandRange(L"Range 63 Hz", 0), BandRange(L"Range 125 Hz", 1), BandRange(L"Range 250 Hz", 2), BandRange(L"Range 500 Hz", 3),
    BandRange(L"Range 1 kHz", 4), BandRange(L"Range 2 kHz", 5),  BandRange(L"Range 4 kHz", 6),  BandRange(L"Range 8 kHz", 7),
}};
// clang-format on

}  // namespace

const EffectTable& Table() {
    static const EffectTable table{
        .name = "Denoiser",
        .image = "builtinDenoiser.png",
        .icon = "BuiltinPlugins/Denoiser@3x.png",
        .rows = kRows,
        .chunk = {.words = kWordsOf<Settings>},
        .presets = PresetsOf(DenoiserPresets::kPresets),
        .sections = {"Profile", "Reduction", "Engine", "Gains", "Ranges"},
    };
    return table;
}

double PlainValue(const ParameterRow& row, std::int32_t word) {
    return row.type == MPT_FLOAT ? word * row.shown.step : word;
}

std::int32_t WordOf(const ParameterRow& row, double plain) {
    const auto range = row.storage.map;
    const double word = row.type == MPT_FLOAT ? plain / row.shown.step : plain;
    return static_cast<std::int32_t>(std::lround(std::clamp<double>(
        word, static_cast<double>(range.floor), static_cast<double>(range.floor + range.span))));
}

EngineSettings EngineSettingsOf(const Settings& settings) {
    auto words = std::bit_cast<std::array<std::int32_t, kWordsOf<Settings>>>(settings);
    for (const auto& row : kRows) {
        const auto map = row.storage.map;
        words[row.word] = std::clamp(words[row.word], static_cast<std::int32_t>(map.floor),
                                     static_cast<std::int32_t>(map.floor + map.span));
    }
    const auto s = std::bit_cast<Settings>(words);
    const auto tenths = [](std::int32_t word) { return 0.1f * static_cast<float>(word); };
    const auto share = [](std::int32_t word) { return 0.001f * static_cast<float>(word); };
    EngineSettings made{.profile = static_cast<ProfileMode>(s.profile),
                        .sizeSet = s.fftSize,
                        .learn = s.learn != 0,
                        .music = s.material != 0,
                        .residue = s.listen != 0,
                        .reductionDb = tenths(s.reduction),
                        .sensitivityDb = tenths(s.sensitivity),
                        .mix = share(s.mix),
                        .gains = {.detailDb = tenths(s.detail),
                                  .whitening = share(s.whitening),
                                  .keepMasked = s.masked < kMaskedOff,
                                  .maskingOffsetDb = tenths(s.masked)}};
    for (std::size_t i = 0; i < kGainBands; ++i) {
        made.gainDb[i] = tenths(s.gains[i]);
        made.rangeDb[i] = tenths(s.ranges[i]);
    }
    return made;
}

}  // namespace Corvo::DSP::Denoising
