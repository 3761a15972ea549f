#pragma once

#include <string>
#include <vector>

#include "Curve.h"
#include "PluginTable.h"

namespace Corvo::Plugins {

// A control as a host sees it.
struct Port {
    struct Point {
        std::string text;
        float value;
    };

    int parameter = 0;    // external index of an effect
    int second = -1;      // of the other side, which a mono plug-in sets along; none: -1
    std::string symbol;   // unique within the plug-in; never changes
    std::string name;     // " L" and " R" where the effect has sides
    std::string unit;     // empty where numbers have none
    std::string comment;  // its range, in the effect's words
    int group = -1;       // of Layout::groups
    EffectParameterType type = EffectParameterType::Continuous;
    float least = 0.0f, most = 1.0f;
    float start = 0.0f;         // what a new instance has
    bool whole = false;         // a few whole numbers only
    bool glides = false;        // moves to its values in small steps
    bool isOutput = false;      // tells the host a value, and is none of its own
    bool momentary = false;     // a switch that does something, and is no setting: off after loading
    bool springsBack = false;   // a momentary one that is off again at once
    bool isIdle = false;        // has nothing to do on one channel: hosts need not show it
    bool isNumber = false;      // the effect shows numbers
    double resolution = 1.0;    // of the values that are told
    bool logarithmic = false;   // the knob has ratios, not differences
    std::vector<Point> points;  // values with a text: all of a list or switch, ends that show no number
    Curve curve;                // of a continuous one

    float Position(float value) const;  // 0..1, as the effect takes it
    float Value(float position) const;
    void SetOn(DSP::CorvoEffectBase& effect, float position, bool automated) const;
    // The value of the effect's parameter as it stands: the number that it shows.
    float ValueOf(DSP::CorvoEffectBase& effect) const;

private:
    friend struct LayoutMaker;
    std::vector<float> m_choices;  // positions of the points of a list or switch
};

struct Layout {
    std::vector<Port> ports;
    std::vector<std::string> groups;
};

// A port that hosts only read.
Port OutputPort(const ResultPort& result);

// The ports of a plug-in, outputs last. Made once each, on the first call; any thread, not the audio thread.
const Layout& LayoutOf(const PluginRow& row, int channels);

}  // namespace Corvo::Plugins
