#pragma once

#include "PluginTable.h"

namespace Corvo::Plugins {

// The order of a plug-in's LV2 ports, which saved sessions know: audio in, audio out, side-chain, time where
// the plug-in follows it, latency, enabled, and then those of its layout.
struct Lv2Ports {
    int channels, sideChannels;
    bool tempo;

    int FirstOut() const { return channels; }
    int FirstSide() const { return 2 * channels; }
    int Time() const { return tempo ? FirstSide() + sideChannels : -1; }
    int Latency() const { return FirstSide() + sideChannels + (tempo ? 1 : 0); }
    int Enabled() const { return Latency() + 1; }
    int FirstControl() const { return Latency() + 2; }
};

// What the settings are stored under.
inline constexpr char kLv2SettingsKey[] = "urn:dspdll:settings";
// The window of all plug-ins of a file that have one.
inline constexpr char kLv2WindowUri[] = "urn:dspdll:window";

}  // namespace Corvo::Plugins
