#include "SampleFormat.h"

#include <algorithm>
#include <array>
#include <limits>
#include <vector>

#include "Errors.h"
#include "Text.h"

namespace dsphost {
namespace {

struct FormatRow {
    SampleFormat format;
    const char* name;
    int bits, subtype;
    bool offered;  // as --format
};
struct ContainerRow {
    const char* ending;
    int major;
    int mostChannels = 1024, highestRate = std::numeric_limits<int>::max();
    int anyRateTo = highestRate, step = 1;  // Hz; multiples of it above
};

// clang-format off
constexpr std::array kFormats{
    FormatRow{SampleFormat::S8,     "s8",     8,  SF_FORMAT_PCM_S8, false},
    FormatRow{SampleFormat::S16,    "s16",    16, SF_FORMAT_PCM_16, true},
    FormatRow{SampleFormat::S24,    "s24",    24, SF_FORMAT_PCM_24, true},
    FormatRow{SampleFormat::S32,    "s32",    32, SF_FORMAT_PCM_32, false},
    FormatRow{SampleFormat::F32,    "f32",    0,  SF_FORMAT_FLOAT,  true},
    FormatRow{SampleFormat::F64,    "f64",    0,  SF_FORMAT_DOUBLE, true},
    FormatRow{SampleFormat::Vorbis, "Vorbis", 0,  SF_FORMAT_VORBIS, false},
};
constexpr std::array kContainers{
    ContainerRow{".wav",  SF_FORMAT_WAV},
    ContainerRow{".flac", SF_FORMAT_FLAC, 8, 655350, 65535, 10},
    ContainerRow{".aiff", SF_FORMAT_AIFF},
    ContainerRow{".aif",  SF_FORMAT_AIFF},
    ContainerRow{".ogg",  SF_FORMAT_OGG,  255, 200000},
    ContainerRow{".oga",  SF_FORMAT_OGG,  255, 200000},
    ContainerRow{".w64",  SF_FORMAT_W64},
    ContainerRow{".rf64", SF_FORMAT_RF64},
    ContainerRow{".caf",  SF_FORMAT_CAF},
    ContainerRow{".au",   SF_FORMAT_AU},
};
constexpr std::array kSixteenBitCodecs{
    SF_FORMAT_ULAW, SF_FORMAT_ALAW, SF_FORMAT_IMA_ADPCM, SF_FORMAT_MS_ADPCM, SF_FORMAT_GSM610,
    SF_FORMAT_VOX_ADPCM, SF_FORMAT_G721_32, SF_FORMAT_G723_24, SF_FORMAT_G723_40, SF_FORMAT_DWVW_16,
    SF_FORMAT_DPCM_16, SF_FORMAT_ALAC_16,
};
// clang-format on

const FormatRow& Row(SampleFormat format) { return *std::ranges::find(kFormats, format, &FormatRow::format); }

bool Holds(int container, int subtype) {
    SF_INFO info{};
    info.channels = 1;
    info.samplerate = 48000;
    info.format = container | subtype;
    return sf_format_check(&info) != 0;
}

std::string Endings() {
    std::vector<std::string> endings;
    for (const auto& row : kContainers) endings.emplace_back(row.ending);
    return Joined(endings, " ");
}

// The names that --format takes, those that the container holds.
std::string Offered(std::optional<int> container) {
    std::vector<std::string> names;
    for (const auto& row : kFormats)
        if (row.offered && (!container || SubtypeIn(*container, row.format))) names.emplace_back(row.name);
    return Joined(names, ", ");
}

}  // namespace

std::string Name(SampleFormat format) { return Row(format).name; }
int IntegerBits(SampleFormat format) { return Row(format).bits; }

SampleFormat ParseSampleFormat(const std::string& name) {
    const auto row = std::ranges::find_if(
        kFormats, [&](const FormatRow& each) { return each.offered && SameNoCase(each.name, name); });
    if (row == kFormats.end())
        throw UserError("there is no sample format \"" + name + "\"; accepted: " + Offered({}));
    return row->format;
}

std::optional<SampleFormat> FromSubtype(int subtype) {
    if (const auto row = std::ranges::find(kFormats, subtype, &FormatRow::subtype); row != kFormats.end())
        return row->format == SampleFormat::Vorbis ? std::nullopt : std::optional(row->format);
    if (subtype == SF_FORMAT_PCM_U8) return SampleFormat::S8;
    if (std::ranges::count(kSixteenBitCodecs, subtype) > 0) return SampleFormat::S16;
    if (subtype == SF_FORMAT_ALAC_20 || subtype == SF_FORMAT_ALAC_24 || subtype == SF_FORMAT_DWVW_24)
        return SampleFormat::S24;
    if (subtype == SF_FORMAT_ALAC_32) return SampleFormat::S32;
    return {};
}

int ContainerFor(const std::string& path, bool stream) {
    if (stream) return SF_FORMAT_WAV;
    const auto dot = path.find_last_of("./\\");
    const std::string ending = dot == path.npos || path[dot] != '.' ? "" : path.substr(dot);
    const auto row = std::ranges::find_if(
        kContainers, [&](const ContainerRow& each) { return SameNoCase(each.ending, ending); });
    if (row == kContainers.end())
        throw UserError(path + ": the ending must name an audio format: " + Endings());
    return row->major;
}

void RequireShape(const std::string& path, int container, int channels, int rate) {
    const auto& row = *std::ranges::find(kContainers, container, &ContainerRow::major);
    const bool inSteps = rate <= row.anyRateTo || rate % row.step == 0;
    if (channels <= row.mostChannels && rate <= row.highestRate && inSteps) return;
    const auto text = [](int someChannels, int someRate) {
        return std::to_string(someChannels) + " channels at " + std::to_string(someRate) + " Hz";
    };
    std::string limits = text(row.mostChannels, row.highestRate);
    if (!inSteps)
        limits += ", above " + std::to_string(row.anyRateTo) + " Hz in steps of " + std::to_string(row.step);
    throw UserError(path + ": this kind of file holds up to " + limits + "; the sound has " +
                    text(channels, rate));
}

std::optional<int> SubtypeIn(int container, SampleFormat format) {
    // An 8-bit WAV is unsigned.
    for (const int subtype : {Row(format).subtype, SF_FORMAT_PCM_U8 + 0})
        if ((subtype != SF_FORMAT_PCM_U8 || format == SampleFormat::S8) && Holds(container, subtype))
            return subtype;
    return {};
}

SampleFormat ChooseSampleFormat(const std::string& path, int container, std::optional<SampleFormat> input,
                                std::optional<SampleFormat> asked) {
    if (container == SF_FORMAT_OGG) {
        if (asked) throw UserError(path + ": an Ogg file holds Vorbis; it takes no --format");
        return SampleFormat::Vorbis;
    }
    if (!asked && !input)
        return SubtypeIn(container, SampleFormat::F32) ? SampleFormat::F32 : SampleFormat::S24;
    const SampleFormat format = asked ? *asked : *input;
    if (!SubtypeIn(container, format))
        throw UserError(path + ": this kind of file cannot hold " + Name(format) +
                        " samples; use --format with one of " + Offered(container));
    return format;
}

}  // namespace dsphost
