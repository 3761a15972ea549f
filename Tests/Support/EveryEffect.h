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
    std::string name = info.param.name;
    std::erase(name, ' ');
    return name;
}
