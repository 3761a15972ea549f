#pragma once

#include <clap/ext/gui.h>
#include <clap/ext/timer-support.h>

#include "Instance.h"

namespace PluginHost {

// The host's timers, which only windows use.
extern const clap_host_timer_support_t kClapTimers;

std::unique_ptr<Window> OpenClapWindow(const clap_plugin_t*, std::uintptr_t parent);

}  // namespace PluginHost
