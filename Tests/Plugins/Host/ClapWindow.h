#pragma once

#include <clap/ext/gui.h>
#include <clap/ext/timer-support.h>

#include "Instance.h"

namespace PluginHost {

// The host's timers, which only windows use.
extern const clap_host_timer_support_t kClapTimers;

std::unique_ptr<Window> MakeClapWindow(const clap_plugin_t*);

template <typename Table>
const Table* ClapExtension(const clap_plugin_t* plugin, const char* id) {
    return static_cast<const Table*>(plugin->get_extension(plugin, id));
}

}  // namespace PluginHost
