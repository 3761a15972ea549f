// Any text after --scale of the command-line host.
#include "DSP/Effects/EffectKinds.h"
#include "Errors.h"
#include "Scale.h"
#include "Target.h"

namespace {

const Fuzz::Target target("ScaleText", [](Fuzz::Input& input) {
    const auto bytes = input.Rest();
    const std::string text(bytes.begin(), bytes.end());
    static const auto effect = Corvo::DSP::FindEffectKind("Cantrix")->MakeReady();
    try {
        const auto scale = dsphost::ParseScale(text, *effect);
        Fuzz::Require(effect->GetParamValueNormalizedFromText(0, scale.root) >= 0.0f,
                      "the effect has the root");
        Fuzz::Require(effect->GetParamValueNormalizedFromText(1, scale.mode) >= 0.0f,
                      "the effect has the mode");
    } catch (const dsphost::UserError& error) {
        Fuzz::Require(std::string_view(error.what()).size() < 2000, "a message is a line that one can read");
    }
});

}  // namespace
