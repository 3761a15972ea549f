#pragma once

#include "DSP/Effects/Framework/CorvoEffectBase.h"

namespace Corvo::DSP {

// An effect whose parameters are named, counted and typed by one static table.
class DSP_API CorvoEffect : public CorvoEffectBase {
public:
    // The record's label; a trailing " L" or " R" is dropped.
    std::wstring GetParamName(int index) override;
    std::wstring GetParamUnitsText(int index) override;
    int GetParamCount() override;
    EffectParameterType GetParameterTypeAutomatable(int index) override;
    int SeparateLeftRightControls() override;

    // The first of GetParamCountReal() records, which live as long as the library.
    virtual const MP_PARAMINFO* GetParametersInfo() = 0;

protected:
    CorvoEffect();

    std::int32_t m_chunk_tag = 0;  // stored first in most chunks; kept and given back, never interpreted

private:
    const MP_PARAMINFO& Record(int externalIndex);
};

}  // namespace Corvo::DSP
