#pragma once

namespace Corvo::DSP {

// What a stream's frames are for the noise reducer, derived from its rate and "FFT size".
struct Format_t {
    int rate = 0, channels = 0;  // Hz; 1 or 2
    int fftSize = 0;             // samples of the longest window in use
    int hop = 0;                 // of that window
    int windowLength = 0;        // samples
    int latency = 0;             // samples
    int bins = 0;                // of that window's spectrum
};

}  // namespace Corvo::DSP
