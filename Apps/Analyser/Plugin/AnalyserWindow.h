#pragma once

#include <memory>

#include "Processor.h"
#include "Window.h"

namespace analyser {

// The view in a window of X11. Null without a display; the processor outlives it.
std::unique_ptr<Corvo::Plugins::Window> MakeAnalyserWindow(Processor& processor);

}  // namespace analyser
