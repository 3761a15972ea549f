#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "ChainElement.h"
#include "DSP/Equalizer/ParEQ.h"

namespace dsphost {

// The parametric equaliser in the chain; every channel gets the same bands.
//
// Its settings are bands, "FREQ TYPE [GAIN_DB] [q=Q]; ...": FREQ in whole Hz, TYPE a filter's name, GAIN_DB
// in steps of 0.1, Q as the library takes it (what suits the type when left out).
class EqualiserElement : public ChainElement {
public:
    static constexpr const char* kName = "EQ";

    // Throws UserError.
    explicit EqualiserElement(std::string_view settings);
    ~EqualiserElement() override;

    std::string Name() const override { return kName; }
    bool Prepare(int maxFrames, const tWAVEFORMATEX& format, bool planar) override;
    void Process(double* samples, int frames, std::int64_t time) override;

private:
    Corvo::DSP::ParEQ m_eq;
    std::vector<Corvo::DSP::builtin_effects_data> m_records;  // one per channel, at least one
    tWAVEFORMATEX m_format{};
};

// The names that TYPE may have.
std::vector<std::string> FilterTypes();

// What an element of these settings is made of. Throws UserError.
Corvo::DSP::builtin_effects_data ParseBands(std::string_view settings);

}  // namespace dsphost
