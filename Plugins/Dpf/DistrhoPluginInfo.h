#pragma once

#include "PluginChoice.h"

// What DPF asks at compile time. The plug-in's own names are asked of the program, so that one compilation
// does for all; DSP_PLUGIN_CHANNELS comes from the build.
#define DISTRHO_PLUGIN_BRAND "DSPDll"
#define DISTRHO_PLUGIN_NAME Corvo::Plugins::ChosenName()
#define DISTRHO_PLUGIN_URI Corvo::Plugins::ChosenUri()
#define DISTRHO_UI_URI Corvo::Plugins::ChosenUri()
#define DISTRHO_PLUGIN_VST3_CATEGORIES Corvo::Plugins::ChosenVst3Category()
#define DISTRHO_PLUGIN_NUM_INPUTS DSP_PLUGIN_CHANNELS
#define DISTRHO_PLUGIN_NUM_OUTPUTS DSP_PLUGIN_CHANNELS
#define DISTRHO_PLUGIN_IS_RT_SAFE 1
#define DISTRHO_PLUGIN_WANT_LATENCY 1
#define DISTRHO_PLUGIN_WANT_PROGRAMS 1
#define DISTRHO_PLUGIN_WANT_STATE 1
#define DISTRHO_PLUGIN_WANT_FULL_STATE 1
#define DISTRHO_PLUGIN_WANT_TIMEPOS 1
