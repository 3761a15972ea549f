#pragma once

namespace Corvo {

// A stretch of the frequency axis, Hz.
struct FrequencySpan {
    double lowest = 0.0, highest = 0.0;  // its ends
    bool operator==(const FrequencySpan&) const = default;
};

// What a place in an analyser's picture stands for.
struct AnalyserReading {
    // The picture that has the place; None between the pictures, where all else is 0.
    enum class Plot { None, Spectrum, Sonogram };
    Plot plot = Plot::None;  // where the place is
    double frequency = 0.0;  // Hz
    double level = 0.0;      // of the spectrum's curve in its scale's unit, or of the sonogram's pixel in dB
    double seconds = 0.0;    // in the sonogram: what its timeline says there
    double since = 0.0;      // the same moment counted from the sonogram's beginning, which does not move
};

}  // namespace Corvo
