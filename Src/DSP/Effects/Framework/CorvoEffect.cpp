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
    const int real = SeparateLeftRightControls() == 0 ? 2 * externalIndex : externalIndex;
    return GetParametersInfo()[m_reverse_param_order ? GetParamCountReal() - real - 1 : real];
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
