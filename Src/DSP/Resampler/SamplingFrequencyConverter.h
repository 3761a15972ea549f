#pragma once

#include <memory>

#include "DSP/Resampler/Dither.h"
#include "DSP/Resampler/SampleFormats.h"
#include "Platform/Export.h"

struct PolePairLowPass;

// Converts interleaved audio to another sample rate by the factor L / M: L - 1 zeros after each sample, a
// Butterworth low-pass of order 10 at 0.455 of the lower rate, every M-th sample kept. Sample formats are
// converted on the way, with dither where it is asked for. Cf. R. E. Crochiere and L. R. Rabiner, "Multirate
// Digital Signal Processing" (1983).
//
// Life: InitConversion or InitConversionByFactors, then Init, then any number of blocks, which continue
// each other: a stream cut into blocks gives the same bits as in one. FreeRings at the end.
//
// The filter is one transfer function in two forms. sfreq_conv_lowpass is its direct form, over histories
// the caller names. Blocks run the sum of its five pole pairs, which passes over the stuffed zeros for
// free and stays exact where the direct form drowns in its own rounding (factors above 16). Its state is
// kept beside the histories, which every block leaves as the direct form would have them: a host may read
// them or go on from them with the step. A channel whose histories the host has zeroed starts afresh.
//
// Samples that are not finite count as 0.
//
// Cost: 4 to 6 ns for a stereo frame of input at the usual rates in blocks of 512 frames, a third more
// in blocks of 64, and what the dither takes of each sample that comes out.
//
// Copying and moving copy member by member: both objects then point to the same rings, and only one of
// them may free those. Filter and histories are independent.
//
// Threads: an object belongs to one thread at a time. Initialisers and Init allocate, blocks never do.
struct DSP_API SamplingFrequencyConverter {
    static constexpr int kMaxChannels = 48;  // of a stream
    static constexpr int kMaxOrder = 40;     // that a history has room for
    static constexpr int kOrder = 10;        // of the low-pass
    // Each step of the raised rate takes 192 bytes of tables, which must fit a 32-bit address space.
    static constexpr int kMaxFactor = 0x7FFFFFFF / 256;

    // Not set up: blocks return 0.
    SamplingFrequencyConverter();
    ~SamplingFrequencyConverter();
    // Both then point to the same rings; see above.
    SamplingFrequencyConverter(const SamplingFrequencyConverter& other);
    SamplingFrequencyConverter& operator=(const SamplingFrequencyConverter& other);

    // Picks the first pair of factors up to 49 that is nearest to outRate / inRate, stopping at the first
    // within 0.001. 0, with the object untouched, when there is nothing to convert or no way to: equal
    // rates, rates below 1, an output more than 10000 times the input, no memory. Else 1.
    int InitConversion(int inRate, int outRate);
    // Takes the factors given, which need not be reduced. Returns 1; 0, with the object untouched, for
    // factors outside 1..kMaxFactor or no memory.
    int InitConversionByFactors(int upFactor, int downFactor);
    // Makes rings for 0..48 channels and starts the stream. Rings of an earlier Init are not freed. Without
    // memory blocks return 0 until the next Init.
    void Init(int channels);
    // Starts afresh like `design`, which is initialised, in the rings this object has: neither allocates
    // nor frees as long as whoever set up `design` keeps it. False, nothing done, if the rings are too short.
    bool Restart(const SamplingFrequencyConverter& design);
    // Frees the rings of this object and of all its copies; blocks then return 0 until the next Init.
    void FreeRings();

    // Converts `frames` frames and returns how many were written: at most (frames * L) / M + 1. Frame
    // strides are in bytes; a channel's sample sits at channel * stride / channels, at any alignment. The
    // buffers must not overlap. `dither`: one per channel, or null. Returns 0, nothing done, without
    // frames, for channels outside 1..48 and for an object that is not set up for that many.
    template <typename In, typename Out>
    int sfreq_conversion_core_block(int frames, char* in, char* out, int channels, int inFrameBytes,
                                    int outFrameBytes, CDither<double>* dither);

    // One step of the low-pass in direct form. Histories hold `zeros` + 1 and `poles` + 1 values, the
    // newest last.
    double sfreq_conv_lowpass(double x, double* xHistory, double* yHistory);

    // What the conversion delays a low frequency by, in samples of the L-times raised rate.
    double GroupDelay() const;

    // Samples are read out as soon as they are there, so between blocks a ring holds nothing unread: the
    // newest samples behind the write position are kept, L times the filter's output.
    double* rings[kMaxChannels]{};
    int ringLength = 0;
    int writePosition = 0, readPosition = 0;
    // Times a position went round; both are kept small by taking off what they have in common.
    int writeWraps = 0, readWraps = 0;
    int up = 0;    // L
    int down = 0;  // M

    // The low-pass in direct form: how many coefficients count, and what its input is divided by.
    struct LowPass {
        int poles = 0, zeros = 0;  // at most kMaxOrder
        double gain = 0.0;         // of the coefficients below at 0 Hz, divided by L
        // Of z^0, z^1, ...; the feedback ones are negated.
        double feedForward[kMaxOrder + 1]{};
        double feedback[kMaxOrder + 1]{};
    } lowPass;  // of the factors last taken

    // Inputs divided by the gain, and outputs, at the raised rate. The initialisers clear channels 0 and 1.
    double inputHistory[kMaxChannels][kMaxOrder + 1]{};
    double outputHistory[kMaxChannels][kMaxOrder + 1]{};

    // The pole pairs' state, value and change, two channels side by side.
    static constexpr int kChannelsPerGroup = 2;
    double pairStates[kMaxChannels / kChannelsPerGroup][kOrder][kChannelsPerGroup]{};
    std::shared_ptr<const PolePairLowPass> pairs;  // never changes once made; shared by copies

    int ringCapacity = 0;  // what Init allocated

private:
    void StartStream();
    void ClearFirstChannels();
};
