#pragma once

#include <memory>
#include <span>

namespace Corvo::DSP {
class CorvoEffectBase;
}

namespace Corvo::Plugins {

// A value that a plug-in tells of what it hears: a port that hosts only read.
struct ResultPort {
    const char *name, *unit, *comment;
    float silent, least, most;  // silent: while nothing is heard
    bool whole;
    std::span<const char* const> texts = {};  // of the whole numbers from `least`
};

// Where an effect's results come from.
class Results {
public:
    virtual ~Results() = default;
    // Writes the newest value of every port; leaves them as they are without news. The thread that processes.
    virtual void Read(std::span<float> values) = 0;
};

// Of a plug-in's row. Either part may be empty for an effect that tells nothing.
struct ResultKind {
    std::span<const ResultPort> ports;
    std::unique_ptr<Results> (*make)(DSP::CorvoEffectBase& effect) = nullptr;
};

}  // namespace Corvo::Plugins
