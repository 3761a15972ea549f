#include "DSP/Effects/Denoiser/TrackerTables.h"

#include <algorithm>
#include <cmath>

namespace Corvo::DSP::Denoising {
namespace {

constexpr double kBandsPerOctave = 3.0, kLeastHalfBins = 6.0;

// The quiet half of so many bins of white noise, measured over ten frames.
struct White {
    std::size_t bins;
    float level, flatness;
};
// clang-format off
constexpr White kWhite[]{
    {  7, 0.65995f, -0.50892f}, { 13, 0.65240f, -0.51658f}, { 15, 0.64943f, -0.51733f},
    { 16, 0.66555f, -0.51932f}, { 18, 0.66346f, -0.51948f}, { 20, 0.66146f, -0.52097f},
    { 22, 0.65950f, -0.52027f}, { 25, 0.64693f, -0.52031f}, { 27, 0.64635f, -0.52059f},
    { 32, 0.65397f, -0.52190f}, { 35, 0.64538f, -0.52144f}, { 39, 0.64501f, -0.52195f},
    { 44, 0.65066f, -0.52241f}, { 48, 0.64961f, -0.52210f}, { 96, 0.64587f, -0.52314f},
    {144, 0.64437f, -0.52331f}, {192, 0.64427f, -0.52365f}, {240, 0.64381f, -0.52408f},
    {288, 0.64298f, -0.52409f}, {336, 0.64271f, -0.52386f}, {384, 0.64318f, -0.52395f},
    {432, 0.64312f, -0.52387f}};
// clang-format on

const White& WhiteOf(std::size_t bins) {
    const auto above = std::ranges::upper_bound(kWhite, bins, {}, &White::bins);
    return above == std::begin(kWhite) ? *above : *(above - 1);
}

float Logarithm(double x) { return static_cast<float>(std::log(x)); }

}  // namespace

void TrackerTables::Prepare(std::size_t bins) {
    const double last = static_cast<double>(bins) - 1.0;
    const double width = std::exp2(0.5 / kBandsPerOctave) - 1.0;
    bands.clear();
    for (double centre = 1.0, half; centre < last; centre += half) {
        half = std::max(kLeastHalfBins, centre * width);
        const double low = std::max(1.0, std::nearbyint(centre - half)),
                     high = std::min(last, std::nearbyint(centre + half)), middle = 0.5 * (low + high);
        TrackerBand band{};
        band.first = static_cast<std::size_t>(low);
        band.end = static_cast<std::size_t>(high) + 1;
        band.quiet = std::max<std::size_t>((band.end - band.first) / 2, 2);
        band.logCentre = Logarithm(middle);
        band.below = static_cast<std::size_t>(middle);
        band.share = static_cast<float>(std::log(middle / std::floor(middle)) /
                                        std::log((std::floor(middle) + 1.0) / std::floor(middle)));
        const auto& white = WhiteOf(band.end - band.first);
        band.whiteLevel = white.level;
        band.whiteFlatness = white.flatness;
        bands.push_back(band);
    }
    const auto work = [](const TrackerBand& band) { return band.end - band.first + 40; };
    std::size_t total = 0, done = 0, group = 1;
    for (const auto& band : bands) total += work(band);
    groups = {};
    for (std::size_t i = 0; i < bands.size(); ++i) {
        done += work(bands[i]);
        if (group < kGroups && done * kGroups >= total * group) groups[group++] = i + 1;
    }
    groups[kGroups] = bands.size();
    logBin.resize(bins);
    bandBelow.resize(bins);
    bandShare.resize(bins);
    belowFirst = 0;
    for (std::size_t bin = 0, band = 0; bin < bins; ++bin) {
        logBin[bin] = Logarithm(std::max(static_cast<double>(bin), 0.5));
        if (logBin[bin] < bands.front().logCentre) belowFirst = bin + 1;
        while (band + 2 < bands.size() && bands[band + 1].logCentre <= logBin[bin]) ++band;
        bandBelow[bin] = static_cast<std::uint16_t>(band);
        bandShare[bin] = std::clamp(
            (logBin[bin] - bands[band].logCentre) / (bands[band + 1].logCentre - bands[band].logCentre), 0.0f,
            1.0f);
    }
}

}  // namespace Corvo::DSP::Denoising
