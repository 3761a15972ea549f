#include <algorithm>
#include <cmath>
#include <cstdint>
#include <string>
#include <vector>

#include "C/Calls.h"
#include "C/EffectStream.h"
#include "DSP/Effects/ParameterInput.h"
#include "DSP/Effects/SettingsInput.h"

// An effect's parameters, automation, presets and state.

namespace {

using namespace Corvo::C;
using Corvo::DSP::CorvoEffectBase;

// The library's texts are plain ASCII, which is UTF-8.
std::string Trimmed(const std::wstring& text) {
    std::string narrow;
    for (const wchar_t letter : text) narrow += static_cast<char>(letter);
    narrow.erase(narrow.find_last_not_of(' ') + 1);
    return narrow.erase(0, narrow.find_first_not_of(' '));
}

// With a parameter that the effect has; call(CorvoEffectBase&).
template <typename Call>
dsp_status WithParameter(dsp_effect* effect, int32_t parameter, dsp_error* error, Call call) {
    return With<EffectStream>(effect, error, [&](EffectStream& stream) -> dsp_status {
        const int count = stream.effect->GetParamCount();
        if (!Within(parameter, 0, count - 1))
            throw Refusal{DSP_OUT_OF_RANGE, "there is no parameter " + std::to_string(parameter) +
                                                "; there are " + std::to_string(count)};
        return call(*stream.effect);
    });
}

std::vector<std::uint8_t> StateOf(CorvoEffectBase& effect) {
    std::vector<std::uint8_t> bytes;
    effect.GetSettingsChunk(bytes);
    return bytes;
}

}  // namespace

dsp_status DSP_CALL dsp_effect_parameters(dsp_effect* effect, int32_t* count) {
    return With<EffectStream>(
        effect, [count](EffectStream& stream) { return Give(stream.effect->GetParamCount(), count); });
}

dsp_status DSP_CALL dsp_effect_parameter(dsp_effect* effect, int32_t parameter, dsp_parameter* record) {
    return WithParameter(effect, parameter, nullptr, [&](CorvoEffectBase& fx) {
        const auto description = fx.Describe(parameter);
        return GiveRecord({0, static_cast<int32_t>(description.type),
                           static_cast<int32_t>(description.choices.size()), description.neutral},
                          record);
    });
}

dsp_status DSP_CALL dsp_effect_parameter_text(dsp_effect* effect, int32_t parameter, int32_t which,
                                              char* buffer, size_t size, size_t* needed) {
    return WithParameter(effect, parameter, nullptr, [&](CorvoEffectBase& fx) -> dsp_status {
        const auto give = [&](const std::string& text) { return GiveText(text, buffer, size, needed); };
        switch (which) {
            case DSP_TEXT_NAME:
                return give(fx.Describe(parameter).name);
            case DSP_TEXT_LABEL:
                return give(fx.Describe(parameter).label);
            case DSP_TEXT_UNIT:
                return give(fx.Describe(parameter).unit);
            case DSP_TEXT_VALUE:
                return give(Trimmed(
                    fx.GetParameterFormattedText(parameter, static_cast<double>(fx.GetParam(parameter)))));
            default:
                return DSP_OUT_OF_RANGE;
        }
    });
}

dsp_status DSP_CALL dsp_effect_find_parameter(dsp_effect* effect, const char* name, int32_t* parameter,
                                              dsp_error* error) {
    return With<EffectStream>(effect, error, [&](EffectStream& stream) -> dsp_status {
        if (!name || !parameter) return DSP_NULL;
        auto& fx = *stream.effect;
        const auto found = Corvo::DSP::FindParameters(fx, name);
        if (!found.empty()) return Give(found.front(), parameter);
        std::string labels;
        for (int i = 0; i < fx.GetParamCount(); ++i) labels += (i ? ", " : "") + fx.Describe(i).label;
        throw Refusal{DSP_UNKNOWN, fx.GetName() + " has no parameter \"" + name + "\"; it has " + labels};
    });
}

dsp_status DSP_CALL dsp_effect_choice(dsp_effect* effect, int32_t parameter, int32_t choice, float* value,
                                      char* buffer, size_t size, size_t* needed) {
    return WithParameter(effect, parameter, nullptr, [&](CorvoEffectBase& fx) -> dsp_status {
        const auto choices = fx.Describe(parameter).choices;
        if (!Within(choice, 0, static_cast<int64_t>(choices.size()) - 1)) return DSP_OUT_OF_RANGE;
        const auto& found = choices[static_cast<std::size_t>(choice)];
        if (value) *value = found.normalised;
        return GiveText(found.text, buffer, size, needed);
    });
}

dsp_status DSP_CALL dsp_effect_get(dsp_effect* effect, int32_t parameter, float* value) {
    return WithParameter(effect, parameter, nullptr,
                         [&](CorvoEffectBase& fx) { return Give(fx.GetParam(parameter), value); });
}

dsp_status DSP_CALL dsp_effect_set(dsp_effect* effect, int32_t parameter, float value) {
    return WithParameter(effect, parameter, nullptr, [&](CorvoEffectBase& fx) -> dsp_status {
        if (!(value >= 0.0f && value <= 1.0f)) return DSP_OUT_OF_RANGE;
        fx.SetParam(parameter, value, false);
        return DSP_OK;
    });
}

dsp_status DSP_CALL dsp_effect_value_to_text(dsp_effect* effect, int32_t parameter, float value, char* buffer,
                                             size_t size, size_t* needed) {
    return WithParameter(effect, parameter, nullptr, [&](CorvoEffectBase& fx) -> dsp_status {
        if (!(value >= 0.0f && value <= 1.0f)) return DSP_OUT_OF_RANGE;
        return GiveText(TextAt(fx, parameter, value), buffer, size, needed);
    });
}

dsp_status DSP_CALL dsp_effect_text_to_value(dsp_effect* effect, int32_t parameter, const char* text,
                                             float* value, dsp_error* error) {
    return WithParameter(effect, parameter, error, [&](CorvoEffectBase& fx) -> dsp_status {
        if (!text || !value) return DSP_NULL;
        try {
            *value = Corvo::DSP::ReadParameter(fx, parameter, text).normalised;
        } catch (const std::invalid_argument& e) {
            throw Refusal{DSP_NOT_UNDERSTOOD, e.what()};
        }
        return DSP_OK;
    });
}

dsp_status DSP_CALL dsp_effect_automate(dsp_effect* effect, int32_t parameter, const dsp_point* points,
                                        size_t count) {
    return With<EffectStream>(effect, [&](EffectStream& stream) -> dsp_status {
        if (!Within(parameter, 0, stream.effect->GetParamCount() - 1) || count > 0x7FFFFFFF)
            return DSP_OUT_OF_RANGE;
        if (!points && count > 0) return DSP_NULL;
        if (!stream.effect->PlaysAutomation()) return DSP_UNSUPPORTED;
        for (std::size_t i = 0; i < count; ++i) {
            const bool ascends = i == 0 || points[i].frame >= points[i - 1].frame;
            if (!Within(points[i].frame, -EffectStream::kLastFrame, EffectStream::kLastFrame))
                return DSP_OUT_OF_RANGE;
            if (!ascends || !(points[i].value >= 0.0f && points[i].value <= 1.0f)) return DSP_OUT_OF_RANGE;
        }
        stream.Automate(parameter, {points, count});
        return DSP_OK;
    });
}

dsp_status DSP_CALL dsp_effect_presets(dsp_effect* effect, int32_t* count) {
    return With<EffectStream>(
        effect, [count](EffectStream& stream) { return Give(stream.effect->NumPresets(), count); });
}

dsp_status DSP_CALL dsp_effect_preset_name(dsp_effect* effect, int32_t preset, char* buffer, size_t size,
                                           size_t* needed) {
    return With<EffectStream>(effect, [&](EffectStream& stream) -> dsp_status {
        if (!Within(preset, 0, stream.effect->NumPresets() - 1)) return DSP_OUT_OF_RANGE;
        return GiveText(stream.effect->GetPresetName(preset), buffer, size, needed);
    });
}

dsp_status DSP_CALL dsp_effect_set_preset(dsp_effect* effect, int32_t preset) {
    return With<EffectStream>(effect, [preset](EffectStream& stream) -> dsp_status {
        if (!Within(preset, 0, stream.effect->NumPresets() - 1)) return DSP_OUT_OF_RANGE;
        stream.effect->SetPreset(preset);
        return DSP_OK;
    });
}

dsp_status DSP_CALL dsp_effect_default_preset(dsp_effect* effect, int32_t* preset) {
    return With<EffectStream>(effect, [preset](EffectStream& stream) {
        return Give(stream.effect->NumPresets() > 0 ? stream.effect->GetDefaultPreset() : -1, preset);
    });
}

dsp_status DSP_CALL dsp_effect_state(dsp_effect* effect, void* bytes, size_t size, size_t* needed) {
    return With<EffectStream>(effect, [&](EffectStream& stream) {
        const auto state = StateOf(*stream.effect);
        return GiveArray(state.size(), static_cast<std::uint8_t*>(bytes), size, needed,
                         [&](std::uint8_t* to) { std::ranges::copy(state, to); });
    });
}

dsp_status DSP_CALL dsp_effect_set_state(dsp_effect* effect, const void* bytes, size_t size,
                                         dsp_error* error) {
    return With<EffectStream>(effect, error, [&](EffectStream& stream) {
        constexpr std::size_t kMostBytes = 1 << 26;
        Require(bytes, "the state is null", DSP_NULL);
        Require(size <= kMostBytes, "the state is too large to be an effect's settings");
        const auto* const first = static_cast<const std::uint8_t*>(bytes);
        const std::vector<std::uint8_t> chunk(first, first + size);
        const auto* const kind = Corvo::DSP::FindEffectKind(stream.effect->GetName());
        Require(kind && Corvo::DSP::TakesSettings(*kind, chunk),
                std::to_string(size) + " bytes are not settings of " + stream.effect->GetName(),
                DSP_NOT_UNDERSTOOD);
        stream.effect->SetSettingsChunk(chunk);
    });
}
