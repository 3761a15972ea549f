#include <algorithm>
#include <cmath>
#include <complex>
#include <cstdint>
#include <string>
#include <vector>

#include "C/Calls.h"
#include "C/Format.h"
#include "DSP/Equalizer/ParEQ.h"

namespace {

using namespace Corvo::C;
using Corvo::DSP::_eq_data;
using Corvo::DSP::builtin_effects_data;

constexpr int kMostFrequency = 1000000, kMostQ = 100000;
constexpr double kMostGain = 100.0, kStepsPerDecibel = 10.0;

class Equaliser : public Object {
public:
    static constexpr Kind kKind = Kind::Equaliser;

    Equaliser() : Object(kKind) { m_records[0].SetNumBands(0); }

    void SetBands(const std::vector<_eq_data>& bands) {
        const auto before = static_cast<std::size_t>(m_records[0].GetNumBands());
        for (auto& record : m_records) {
            std::ranges::copy(bands, record.bands.begin());
            for (std::size_t i = bands.size(); i < before; ++i) record.bands[i].boost = 0;
            record.SetNumBands(static_cast<int>(std::max(before, bands.size())));
        }
        // Bands that are gone are cooked once more, as flat ones: they forget their sound.
        if (IsPrepared()) Cook(true);
        for (auto& record : m_records) record.SetNumBands(static_cast<int>(bands.size()));
    }
    void Prepare(const tWAVEFORMATEX& format) {
        m_format = format;
        Cook(false);
    }
    void Invert(bool invert) {
        for (auto& record : m_records) record.SetPhaseShift(invert);
    }
    const builtin_effects_data& Record() const { return m_records[0]; }
    bool IsPrepared() const { return m_format.nChannels > 0; }

    template <typename Sample>
    dsp_status Process(Sample* samples, int frames) {
        if (!IsPrepared() || m_format.wBitsPerSample != 8 * sizeof(Sample)) return DSP_UNPREPARED;
        if (frames < 0) return DSP_OUT_OF_RANGE;
        if (frames > 0 && !samples) return DSP_NULL;
        m_eq.Process(samples, frames, m_format.nChannels, false, m_records);
        return DSP_OK;
    }
    std::complex<double> Response(double frequency) const {
        return m_eq.GetResponse(0, frequency, static_cast<int>(m_format.nSamplesPerSec), m_records);
    }

private:
    void Cook(bool smooth) {
        m_eq.Cook(smooth, false, &m_records[0], static_cast<int>(m_format.nSamplesPerSec),
                  m_format.nChannels);
    }

    Corvo::DSP::ParEQ m_eq;
    builtin_effects_data m_records[2];
    tWAVEFORMATEX m_format{};
};

_eq_data Band(const dsp_band& band) {
    const double steps = band.gain * kStepsPerDecibel;
    Require(Within(band.type, DSP_HIGHPASS, DSP_LOWSHELF),
            "there is no band type " + std::to_string(band.type));
    Require(Within(band.frequency, 1, kMostFrequency), "a band's frequency can be 1 to 1000000 Hz");
    Require(Within(band.q, 1, kMostQ), "a band's q can be 1 to 100000");
    Require(std::abs(band.gain) <= kMostGain && std::abs(steps - std::round(steps)) < 1e-6,
            "a band's gain can be -100 to 100 dB in tenths");
    return {band.type | (band.bypass ? _eq_data::kBypassBand : 0), band.frequency,
            static_cast<std::int32_t>(std::lround(steps)), band.q};
}

}  // namespace

dsp_status DSP_CALL dsp_equaliser_create(dsp_equaliser** equaliser, dsp_error* error) {
    return Create(equaliser, error, [] { return std::make_unique<Equaliser>(); });
}

dsp_status DSP_CALL dsp_equaliser_bands(dsp_equaliser* equaliser, int32_t* count) {
    return With<Equaliser>(equaliser,
                           [count](Equaliser& eq) { return Give(eq.Record().GetNumBands(), count); });
}

dsp_status DSP_CALL dsp_equaliser_set_bands(dsp_equaliser* equaliser, const dsp_band* bands, int32_t count,
                                            dsp_error* error) {
    return With<Equaliser>(equaliser, error, [&](Equaliser& eq) {
        Require(Within(count, 0, builtin_effects_data::kMaxBands), "there can be 0 to 20 bands");
        std::vector<_eq_data> all;
        const auto* at = reinterpret_cast<const char*>(bands);
        for (int i = 0; i < count; ++i) {
            const auto* const band = reinterpret_cast<const dsp_band*>(at);
            all.push_back(Band(Taken(band, "a band")));
            Require(band->size == bands->size && band->size % alignof(dsp_band) == 0,
                    "all bands must have the same size", DSP_BAD_RECORD);
            at += band->size;
        }
        eq.SetBands(all);
    });
}

dsp_status DSP_CALL dsp_equaliser_band(dsp_equaliser* equaliser, int32_t band, dsp_band* record) {
    return With<Equaliser>(equaliser, [&](Equaliser& eq) -> dsp_status {
        if (!Within(band, 0, eq.Record().GetNumBands() - 1)) return DSP_OUT_OF_RANGE;
        const _eq_data& data = eq.Record().bands[static_cast<std::size_t>(band)];
        return GiveRecord(
            {0, data.filter_type(), data.freq, data.Q, data.bypass(), 0, data.boost / kStepsPerDecibel},
            record);
    });
}

dsp_status DSP_CALL dsp_equaliser_invert(dsp_equaliser* equaliser, int32_t invert) {
    return With<Equaliser>(equaliser, [invert](Equaliser& eq) { eq.Invert(invert != 0); });
}

dsp_status DSP_CALL dsp_equaliser_is_inverted(dsp_equaliser* equaliser, int32_t* inverted) {
    return With<Equaliser>(equaliser, [inverted](Equaliser& eq) {
        return Give<int32_t>(eq.Record().GetPhaseShift(), inverted);
    });
}

dsp_status DSP_CALL dsp_equaliser_prepare(dsp_equaliser* equaliser, const dsp_format* format,
                                          dsp_error* error) {
    return With<Equaliser>(equaliser, error,
                           [format](Equaliser& eq) { eq.Prepare(WaveFormat(Taken(format, "the format"))); });
}

dsp_status DSP_CALL dsp_equaliser_process_f32(dsp_equaliser* equaliser, float* samples, int32_t frames) {
    return With<Equaliser>(equaliser, [&](Equaliser& eq) { return eq.Process(samples, frames); });
}
dsp_status DSP_CALL dsp_equaliser_process_f64(dsp_equaliser* equaliser, double* samples, int32_t frames) {
    return With<Equaliser>(equaliser, [&](Equaliser& eq) { return eq.Process(samples, frames); });
}

dsp_status DSP_CALL dsp_equaliser_response(dsp_equaliser* equaliser, const double* frequencies, double* real,
                                           double* imaginary, size_t count) {
    return With<Equaliser>(equaliser, [&](Equaliser& eq) -> dsp_status {
        if (!frequencies && count > 0) return DSP_NULL;
        if (!eq.IsPrepared()) return DSP_UNPREPARED;
        for (std::size_t i = 0; i < count; ++i) {
            const auto response = eq.Response(frequencies[i]);
            if (real) real[i] = response.real();
            if (imaginary) imaginary[i] = response.imag();
        }
        return DSP_OK;
    });
}
