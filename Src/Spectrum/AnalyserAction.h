#pragma once

#include "Spectrum/Analyser.h"
#include "Spectrum/AnalyserMenu.h"

// What a menu entry does to an analyser and the settings of all, and whether that is the case already.
struct Corvo::AnalyserMenuEntry::Action {
    void (*apply)(Analyser&, SpectrumSettings&, int value);
    bool (*chosen)(const Analyser&, const SpectrumSettings&, int value);
};
