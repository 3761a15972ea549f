#pragma once

#include "DSP/Effects/Framework/CorvoEffectBase.h"

namespace Corvo::DSP {

// An effect whose parameters are named, counted and typed by one static table of records.
class DSP_API CorvoEffect : public CorvoEffectBase {
public:
    // The record's label; a trailing " L" or " R" is dropped.
    std::wstring GetParamName(int index) override;
    std::wstring GetParamUnitsText(int index) override;
    int GetParamCount() override;
    EffectParameterType GetParameterTypeAutomatable(int index) override;
    int SeparateLeftRightControls() override;
    float GetParam(int index) override;
    int GetParamCountReal() override;
    std::string GetName() override;
    void GetSettingsChunk(std::vector<std::uint8_t>& chunk) override;
    void SetSettingsChunk(const std::vector<std::uint8_t>& chunk) override;

    // The first of GetParamCountReal() records, which live as long as the library; null when there are none.
    virtual const MP_PARAMINFO* GetParametersInfo();

    // The record of an external parameter below GetParamCount().
    const MP_PARAMINFO& Record(int externalIndex);

protected:
    // For an effect that is described by a table.
    using CorvoEffectBase::CorvoEffectBase;
    // For an effect that brings its records by itself.
    CorvoEffect();

    bool DoSetParam(int index, float normalised, bool fromAutomation) override;
    // Takes the oldest layout of the settings chunk, in which each word has 8 bytes. False, with nothing
    // changed, when there are too few. Public in the effects that had it.
    bool FitsOldChunk(const std::vector<std::uint8_t>& chunk);

    std::int32_t m_chunk_tag = 0;  // stored first in most chunks; kept and given back, never interpreted
};

}  // namespace Corvo::DSP
