#include "DSP/Equalizer/BuiltinEffectsData.h"

#include <algorithm>

namespace Corvo::DSP {
namespace {

constexpr std::int32_t kPeakQ = 200, kOtherQ = 50;

// clang-format off
constexpr std::array kDefaultBands{
    //       type          freq  boost  Q
    _eq_data{EQ_LOWSHELF,   100, 0,     kOtherQ},
    _eq_data{EQ_PEAK,      2500, 0,     kPeakQ},
    _eq_data{EQ_HIGHSHELF, 6000, 0,     kOtherQ},
};
// clang-format on

void SetFlag(std::int32_t& word, std::int32_t flag, bool on) { word = on ? word | flag : word & ~flag; }

// Stores the value and tells the chain, only if it is news.
void Change(std::int32_t& field, std::int32_t value, const builtin_effects_data::BandChain& chain, int band) {
    if (field == value) return;
    field = value;
    chain.Invoke(band);
}

}  // namespace

void _eq_data::set_bypass(bool on) { SetFlag(type, kBypassBand, on); }

void _eq_data::defaults(int which) {
    boost = 0;
    if (which >= 0 && which < static_cast<int>(kDefaultBands.size()))
        *this = kDefaultBands[static_cast<std::size_t>(which)];
}

builtin_effects_data::builtin_effects_data() { defaults(); }
builtin_effects_data::builtin_effects_data(const builtin_effects_data&) = default;
builtin_effects_data& builtin_effects_data::operator=(const builtin_effects_data&) = default;
builtin_effects_data::~builtin_effects_data() = default;

void builtin_effects_data::defaults() {
    phaseShift = 0;
    numBands = 3;
    for (int i = 0; i < 3; ++i) Band(i).defaults(i);
    reserved = {};
}

void builtin_effects_data::defaults(int band, int which) {
    Band(band).defaults(which);
    structure_changed.Invoke();
}

void builtin_effects_data::SetNumBands(int n) {
    numBands = n;
    structure_changed.Invoke();
}

void builtin_effects_data::DeleteBand(int i) {
    if (i >= numBands) return;
    const int end = std::min(numBands, kMaxBands);
    --numBands;
    structure_changed.Invoke();
    for (int band = i + 1; band < end; ++band) Band(band - 1) = Band(band);
    structure_changed.Invoke();
}

void builtin_effects_data::SetEqData(int i, const _eq_data& data) {
    Band(i) = data;
    structure_changed.Invoke();
}

void builtin_effects_data::GetEqData(int i, _eq_data* data) const { *data = Band(i); }

void builtin_effects_data::SetEqType(int i, int t) {
    Band(i).type = t;
    structure_changed.Invoke();
}

int builtin_effects_data::GetEqType(int i) const { return Band(i).type; }

void builtin_effects_data::SetEqFreq(int i, int f) { Change(Band(i).freq, std::max(f, 1), freq_changed, i); }
int builtin_effects_data::GetEqFreq(int i) const { return Band(i).freq; }
void builtin_effects_data::SetEqBoost(int i, int b) { Change(Band(i).boost, b, boost_changed, i); }
int builtin_effects_data::GetEqBoost(int i) const { return Band(i).boost; }
void builtin_effects_data::SetEqQ(int i, int q) { Change(Band(i).Q, q, Q_changed, i); }
int builtin_effects_data::GetEqQ(int i) const { return Band(i).Q; }

void builtin_effects_data::SetDefaultQ(int i) {
    SetEqQ(i, Band(i).filter_type() == EQ_PEAK ? kPeakQ : kOtherQ);
}

void builtin_effects_data::SetBypass(int i, bool on) {
    Band(i).set_bypass(on);
    bypass_changed.Invoke();
}

bool builtin_effects_data::GetBypass(int i) const { return Band(i).bypass(); }

void builtin_effects_data::SetBypassChannel(bool on) {
    SetFlag(bands[0].type, _eq_data::kBypassTrack, on);
    bypass_changed.Invoke();
}

bool builtin_effects_data::GetBypassChannel() const { return bands[0].bypass_track(); }

}  // namespace Corvo::DSP
