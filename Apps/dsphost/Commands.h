#pragma once

#include <CLI/CLI.hpp>

namespace dsphost {

void AddEffectsCommand(CLI::App& app);

}  // namespace dsphost
