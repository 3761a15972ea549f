#pragma once

#include <array>
#include <cstdint>

#include "DSP/Equalizer/EQFilterType.h"
#include "DSP/Equalizer/EqNotification.h"
#include "Platform/Export.h"

namespace Corvo::DSP {

// One band of the equaliser.
struct DSP_API _eq_data {
    static constexpr std::int32_t kTypeMask = 0xFF;        // all that counts when a band is designed
    static constexpr std::int32_t kBypassBand = 0x10000;   // leave this band out
    static constexpr std::int32_t kBypassTrack = 0x20000;  // in band 0: leave the whole channel out

    std::int32_t type = EQ_PEAK;  // EQFilterType in bits 0-15, and the two flags above
    std::int32_t freq = 1000;     // centre or corner in Hz, at least 1
    std::int32_t boost = 0;       // tenths of a decibel; 0 is flat
    std::int32_t Q = 200;         // its meaning depends on the type, see CalcolaCoefficientiBiquad

    // The band's bypass flag, and the channel's.
    bool bypass() const { return (type & kBypassBand) != 0; }
    bool bypass_track() const { return (type & kBypassTrack) != 0; }
    // Sets the band's flag and leaves the rest of the word.
    void set_bypass(bool on);
    // The type without the flags.
    EQFilterType filter_type() const { return static_cast<EQFilterType>(type & kTypeMask); }
    // Clears the boost. `which` 0, 1 and 2 also set type (flags cleared), frequency and Q to those of a low
    // shelf at 100 Hz, a peak at 2500 Hz and a high shelf at 6000 Hz; any other leaves them as they are.
    void defaults(int which);
};
static_assert(sizeof(_eq_data) == 16);

// The setting of a whole equaliser, which the host owns, edits and hands to ParEQ.
//
// Band indices count from 0 and are trusted to be below kMaxBands. Listeners are told synchronously, inside
// the setter. Copies clone the listeners, which allocates; nothing else does. One thread at a time; no locks.
class DSP_API builtin_effects_data {
public:
    static constexpr int kMaxBands = 20;         // that the record has room for
    using BandChain = EqNotificationChain<int>;  // told the band's index
    using Chain = EqNotificationChain<>;         // told that something changed

    // No listeners; otherwise as defaults() leaves it, with every further band a flat peak.
    builtin_effects_data();
    // All fields, and a clone of every listener.
    builtin_effects_data(const builtin_effects_data& other);
    builtin_effects_data& operator=(const builtin_effects_data& other);
    ~builtin_effects_data();

    // Three flat bands, normal polarity. Tells nobody, and leaves bands 3-19 as they are.
    void defaults();
    // _eq_data::defaults(which) for one band. Tells structure_changed.
    void defaults(int band, int which);

    // Not clamped; the processor uses at most kMaxBands. Tells structure_changed.
    void SetNumBands(int n);
    int GetNumBands() const { return numBands; }
    // Does nothing unless i < GetNumBands(). Tells structure_changed twice: when the count has dropped, and
    // when the bands behind have moved down.
    void DeleteBand(int i);

    // All four words. The setter tells structure_changed.
    void SetEqData(int i, const _eq_data& data);
    void GetEqData(int i, _eq_data* data) const;
    // The whole type word. Setting a bare type therefore ends the band's bypass and, in band 0, the
    // channel's. The setter tells structure_changed.
    void SetEqType(int i, int t);
    int GetEqType(int i) const;
    // Hz, raised to at least 1. Tells freq_changed when the value differs.
    void SetEqFreq(int i, int f);
    int GetEqFreq(int i) const;
    // Tenths of a decibel. Tells boost_changed when the value differs.
    void SetEqBoost(int i, int b);
    int GetEqBoost(int i) const;
    // As it is. Tells Q_changed when the value differs.
    void SetEqQ(int i, int q);
    int GetEqQ(int i) const;
    // The Q that suits the band's type: 200 for a peak, 50 for any other.
    void SetDefaultQ(int i);

    // Of one band, and of the whole channel. The setters tell bypass_changed every time.
    void SetBypass(int i, bool on);
    bool GetBypass(int i) const;
    void SetBypassChannel(bool on);
    bool GetBypassChannel() const;
    // Inverted polarity. Tells nobody.
    void SetPhaseShift(bool on) { phaseShift = on ? 1 : 0; }
    bool GetPhaseShift() const { return phaseShift != 0; }

    std::array<_eq_data, kMaxBands> bands;   // of which the first `numBands` count
    std::int32_t numBands = 3;               // as SetNumBands had it
    std::array<std::int32_t, 4> reserved{};  // copied with the record; defaults() clears it
    std::uint8_t phaseShift = 0;             // 1: inverted polarity
    std::int32_t reserved_word = 0;          // copied with the record, used by nothing here
    // Who is told of what; the setters above say when.
    BandChain Q_changed;
    BandChain freq_changed;
    BandChain boost_changed;
    BandChain reserved_changed;  // no operation of this record invokes it
    Chain bypass_changed;
    Chain structure_changed;

private:
    _eq_data& Band(int i) { return bands[static_cast<std::size_t>(i)]; }
    const _eq_data& Band(int i) const { return bands[static_cast<std::size_t>(i)]; }
};

}  // namespace Corvo::DSP
