#include "DSP/Effects/Framework/CorvoEffect.h"

#include <iterator>
#include <string_view>

namespace Corvo::DSP {
namespace {

// A field that is full has no terminator.
std::wstring_view Text(const wchar_t (&field)[32]) {
    const std::wstring_view whole(field, std::size(field));
    return whole.substr(0, whole.find(L'\0'));
}

}  // namespace

CorvoEffect::CorvoEffect() = default;

const MP_PARAMINFO& CorvoEffect::Record(int externalIndex) {
    static constexpr MP_PARAMINFO kNone{};
    const MP_PARAMINFO* const records = GetParametersInfo();
    const int real = RealIndex(externalIndex);
    return records && real >= 0 && real < GetParamCountReal() ? records[real] : kNone;
}

bool CorvoEffect::DoSetParam(int index, float normalised, bool fromAutomation) {
    return CorvoEffectBase::DoSetParam(index, normalised, fromAutomation);
}
float CorvoEffect::GetParam(int index) { return CorvoEffectBase::GetParam(index); }
int CorvoEffect::GetParamCountReal() { return CorvoEffectBase::GetParamCountReal(); }
std::string CorvoEffect::GetName() { return CorvoEffectBase::GetName(); }
const MP_PARAMINFO* CorvoEffect::GetParametersInfo() { return TableRecords(); }

void CorvoEffect::GetSettingsChunk(std::vector<std::uint8_t>& chunk) { WriteChunk(chunk, m_chunk_tag); }
void CorvoEffect::SetSettingsChunk(const std::vector<std::uint8_t>& chunk) { TakeChunk(chunk, m_chunk_tag); }
bool CorvoEffect::FitsOldChunk(const std::vector<std::uint8_t>& chunk) {
    return TakeChunk(chunk, m_chunk_tag, true);
}

std::wstring CorvoEffect::GetParamName(int index) {
    const auto label = Text(Record(index).szLabel);
    const bool sided = label.size() >= 3 && (label.ends_with(L" L") || label.ends_with(L" R"));
    return std::wstring(sided ? label.substr(0, label.size() - 2) : label);
}

std::wstring CorvoEffect::GetParamUnitsText(int index) {
    return std::wstring(Text(Record(index).szUnitText));
}

int CorvoEffect::GetParamCount() {
    return SeparateLeftRightControls() != 0 ? GetParamCountReal() : GetParamCountReal() / 2;
}

EffectParameterType CorvoEffect::GetParameterTypeAutomatable(int index) {
    switch (Record(index).mpType) {
        case MPT_BOOL:
            return EffectParameterType::Switch;
        case MPT_ENUM:
            return EffectParameterType::List;
        default:
            return EffectParameterType::Continuous;
    }
}

int CorvoEffect::SeparateLeftRightControls() { return 1; }

}  // namespace Corvo::DSP
