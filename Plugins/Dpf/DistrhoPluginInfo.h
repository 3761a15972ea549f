#pragma once

// What DPF asks at compile time.
#define DISTRHO_PLUGIN_BRAND "DSPDll"
#define DISTRHO_PLUGIN_NAME "Gain"
#define DISTRHO_PLUGIN_URI "urn:dspdll:gain"
#define DISTRHO_PLUGIN_CLAP_ID "urn:dspdll:gain"
#define DISTRHO_PLUGIN_CLAP_FEATURES "audio-effect", "stereo"
#define DISTRHO_PLUGIN_VST3_CATEGORIES "Fx|Stereo"
#define DISTRHO_PLUGIN_NUM_INPUTS 2
#define DISTRHO_PLUGIN_NUM_OUTPUTS 2
#define DISTRHO_PLUGIN_WANT_LATENCY 1
