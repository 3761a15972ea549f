#pragma once

#include <string>
#include <vector>

namespace Corvo {

// How the host automates a parameter.
enum class EffectParameterType : int { Continuous = 0, Switch = 1, List = 2 };

namespace DSP {

// What a host needs to show one external parameter and to set it by name; see CorvoEffectBase::Describe.
// Texts are UTF-8.
struct ParameterDescription {
    // One entry of a switch or list.
    struct Choice {
        std::string text;  // what is shown
        float normalised;  // setting it chooses this
    };

    int real = 0;       // index of the parameter, of the left one where it is a pair
    std::string label;  // with its side, " L" or " R", where it has one
    std::string name;   // without it
    std::string unit;   // empty where there is none
    // How a host shows and automates it.
    EffectParameterType type = EffectParameterType::Continuous;
    std::vector<Choice> choices;  // of a switch or list, in order
    float neutral = 0.5f;         // normalised: where a control rests
};

}  // namespace DSP
}  // namespace Corvo
