#pragma once

#include <cmath>
#include <vector>

#include "DSP/Effects/Compressor/Compressor.h"
#include "Support/EffectRun.h"

namespace TestSupport {

using Corvo::DSP::Compressor;

// The compressor's parameters, left ones; the right one follows each.
enum CompressorParameter : int {
    kAttack = 0,
    kRelease = 2,
    kOutGain = 4,
    kThreshold = 6,
    kRatio = 8,
    kStereoLink = 10,
    kMakeUp = 12,
    kMonitor = 14
};

inline float ThresholdPosition(int tenths) { return (static_cast<float>(tenths) + 799.5f) / 790.0f; }
inline float RatioPosition(int step) { return (static_cast<float>(step) + 0.5f) / 251.0f; }
inline float TimePosition(int hundredths) { return (static_cast<float>(hundredths) - 0.5f) / 99999.0f; }
inline float OutGainPosition(int tenths) {
    return (static_cast<float>(tenths) + (tenths < 0 ? 959.5f : 960.5f)) / 1160.0f;
}

inline double Amplitude(double db) { return std::pow(10.0, db / 20.0); }
inline double Decibels(double amplitude) { return 20.0 * std::log10(amplitude); }

// The steady gain in dB of the left channel for each input level in dB, in ascending order: what a square
// wave of that level comes to. The effect is prepared afresh, so that nothing glides.
inline std::vector<double> SteadyGains(Compressor& effect, const std::vector<double>& levels,
                                       int framesPerLevel = 3000) {
    const auto format = Format<double>(2, 8000);
    effect.InitProcessing(framesPerLevel, &format);
    std::vector<double> gains;
    for (const double level : levels) {
        std::vector<double> block(2 * static_cast<std::size_t>(framesPerLevel), Amplitude(level));
        for (std::size_t i = 0; i < block.size(); ++i)
            if (i / 2 % 8 >= 4) block[i] = -block[i];
        ProcessBlock(effect, block.data(), framesPerLevel, format);
        gains.push_back(Decibels(std::abs(block[block.size() - 2]) / Amplitude(level)));
    }
    return gains;
}

inline std::vector<double> Levels(double from, double to, double step) {
    std::vector<double> levels;
    for (double level = from; level <= to; level += step) levels.push_back(level);
    return levels;
}

}  // namespace TestSupport
