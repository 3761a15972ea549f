#pragma once

#include <memory>
#include <span>
#include <string>
#include <string_view>

#include "DSP/Effects/Framework/CorvoEffectBase.h"
#include "Results.h"

namespace Corvo::Plugins {

enum Trait : unsigned {
    kMayWait = 1,      // its engine may allocate or wait while it processes
    kShortPieces = 2,  // its lag grows with the length of what it gets at a time
    kTempo = 4,        // follows the host's tempo
    kRings = 8,        // sounds on when its input has ended
    kSmooth = 16,      // the effect itself moves smoothly to what it is set to, or is too slow to
    kOnlyClears = 32,  // its Cleanup frees nothing, and nothing else clears it
};

// What distinguishes one plug-in from another. Everything else comes from its effect.
struct PluginRow {
    const char* name;          // what GetName() of an effect says
    const char* id;            // part of the identifiers and file names; never changes
    const char* code;          // four letters, its identity as VST3; never changes
    int minorVersion;          // odd while it grows; raised when ports are added
    const char* lv2Class;      // of the LV2 specification
    const char* clapFeature;   // of CLAP's list
    const char* vst3Category;  // after "Fx|"
    unsigned traits;           // what is so of it
    const char* about;
    const ResultKind* results = nullptr;  // null: it tells hosts nothing

    bool Is(Trait trait) const { return (traits & trait) != 0; }

    std::unique_ptr<DSP::CorvoEffectBase> Make() const;  // of an effect; throws std::bad_alloc
};

// Every plug-in of the file, in the order in which hosts list them. Any thread.
std::span<const PluginRow> PluginRows();
const PluginRow* FindPluginRow(std::string_view id);  // null where there is none

// A plug-in comes for one channel and for two.
std::string PluginUri(const PluginRow& row, int channels);
std::string PluginName(const PluginRow& row, int channels);

// A name for a narrow strip: whole words, at most 16 characters where there are several; the side stays.
std::string ShortNameOf(const std::string& name);
// A name as an identifier: letters, digits and "_".
std::string SymbolOf(const std::string& name);

}  // namespace Corvo::Plugins
