#pragma once

#include <string>

#include <CLI/CLI.hpp>

#include "OutputFile.h"

namespace dsphost {

// Each command lives in a file of its own, adds itself to the command line, and runs from CLI11's callback;
// main.cpp lists them. A command throws UserError, IoError or Interrupted.
void AddConvertCommand(CLI::App& app);
void AddEffectsCommand(CLI::App& app);
void AddPitchCommand(CLI::App& app);
void AddEqCurveCommand(CLI::App& app);
void AddRenderCommand(CLI::App& app);
void AddSonogramCommand(CLI::App& app);
void AddSpectrumCommand(CLI::App& app);
void AddTunerCommand(CLI::App& app);

// What every command that writes takes.
struct WritingOptions {
    OutputRules rules;
    bool quiet = false;

    void AddTo(CLI::App& command);
};

}  // namespace dsphost
