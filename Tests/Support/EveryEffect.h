#pragma once

#include <gtest/gtest.h>

#include "Support/EffectCases.h"
#include "Support/EffectRun.h"

// The fixture of every suite that runs over all effects.
class EveryEffect : public testing::TestWithParam<TestSupport::EffectCase> {
protected:
    // A new instance in the state a host starts from.
    static std::unique_ptr<TestSupport::CorvoEffectBase> Make() {
        return Corvo::DSP::FindEffectKind(GetParam().kind)->MakeReady();
    }
};

inline std::string EffectTestName(const testing::TestParamInfo<TestSupport::EffectCase>& info) {
    std::string name;
    for (const char c : std::string(info.param.name))
        if (std::isalnum(static_cast<unsigned char>(c))) name += c;
    return name;
}
