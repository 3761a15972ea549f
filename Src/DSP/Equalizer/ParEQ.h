#pragma once

#include <complex>
#include <cstdint>
#include <memory>
#include <vector>

#include "DSP/Equalizer/BuiltinEffectsData.h"
#include "Platform/Export.h"

class kivspectrum;

namespace Corvo::DSP {

struct EqChannel;

// The parametric equaliser: per channel a cascade of up to 20 second-order sections whose coefficients glide
// to new values after every edit.
//
// Construct, Cook, then process; Cook again whenever the settings or the rate change. No latency, and the
// output does not depend on how the stream is cut into blocks. Processing never allocates or locks; it costs
// about 1 ns per band and stereo frame, some 20 ns while the band glides. Samples that are not finite count
// as 0.
//
// Threads: the host keeps Cook, Resize, GetSpectrum and processing of one object apart.
class DSP_API ParEQ {
public:
    ParEQ();
    // A copy shares the channels and their glides with its source until AfterCloneInit(). Whoever lets go
    // of them last frees them.
    ParEQ(const ParEQ& other);
    ParEQ& operator=(const ParEQ& other);
    ~ParEQ();
    // Makes a copy stand alone: without channels, to be cooked.
    void AfterCloneInit();

    // Sets the channel count and makes the channels that are missing; none is freed. Below 0 counts as 0.
    void Resize(int n);
    // As last set by Resize or Cook.
    int GetNumSubChannels() const { return m_channel_count; }

    // Designs the bands of every channel from one record, for `sampleRate` in Hz. With `smooth`, bands that
    // were active glide to their new shape; all others jump and start from silence. A bypassed band, a flat
    // one and all of them under `bypassAll` are left out.
    //
    // The record is taken as it is except that a frequency counts as at least 1 Hz and, but for peaks, as
    // below half the rate, and that a band whose numbers give no stable filter is left out. Throws
    // std::bad_alloc without memory, like Resize and GetSpectrum, and may be repeated. Bands beyond the
    // record's count keep what they have. A null record changes nothing.
    void Cook(bool smooth, bool bypassAll, builtin_effects_data* data, int sampleRate, int numChannels);

    // As Cook, for the channels that are there and without touching their analysers, which lock: once cooked
    // in full, an equaliser takes new bands this way between two blocks of the audio thread.
    void CookBandsOnly(bool smooth, bool bypassAll, const builtin_effects_data& data, int sampleRate);

    // What the cooked bands make of a sine of `frequency` Hz once all glides have ended, polarity included.
    // `records` as for processing. 1 for a channel that was never cooked.
    std::complex<double> GetResponse(int channel, double frequency, int sampleRate,
                                     const builtin_effects_data* records) const;
    // The analyser of a channel's result, which stays the equaliser's and lives as long as its channels; a
    // missing channel is made, as by Resize(channel + 1). Null below 0.
    kivspectrum* GetSpectrum(int channel);

    // Forgets that coefficients are gliding: they rest where they are, whatever a smooth Cook asks of them,
    // until another coefficient begins to glide or a Cook without `smooth` makes them jump.
    void ResetProcessing();

    // Processes interleaved float or double samples in place. `records` is an array with one record per
    // channel, of which only the polarity and, of the first, the band count are read. `feedSpectrum` hands
    // the result to each channel's analyser.
    template <typename Sample>
    void Process(Sample* buf, int frames, int numChannels, bool feedSpectrum, builtin_effects_data* records);

    // Processes one channel: the samples from buf[channel] on in steps of `stride`, as far as they lie below
    // buf[frames * stride]; with a stride below 2 those from buf[0] on. A channel that was never cooked
    // passes unchanged.
    template <typename Sample>
    void ProcessSingle(Sample* buf, int frames, int stride, bool feedSpectrum, int channel,
                       builtin_effects_data* records);

private:
    EqChannel* Channel(int channel) const;

    std::vector<std::shared_ptr<EqChannel>> m_channels;
    std::shared_ptr<std::int32_t> m_glide_counter;  // coefficients on the move, of all channels
    std::int32_t m_channel_count = 0;
};

extern template DSP_API void ParEQ::Process(float*, int, int, bool, builtin_effects_data*);
extern template DSP_API void ParEQ::Process(double*, int, int, bool, builtin_effects_data*);
extern template DSP_API void ParEQ::ProcessSingle(float*, int, int, bool, int, builtin_effects_data*);
extern template DSP_API void ParEQ::ProcessSingle(double*, int, int, bool, int, builtin_effects_data*);

}  // namespace Corvo::DSP
