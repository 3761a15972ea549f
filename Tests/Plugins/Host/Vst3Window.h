#pragma once

#include <travesty/edit_controller.h>

#include "Instance.h"
#include "Vst3Object.h"

namespace PluginHost {

std::unique_ptr<Window> MakeVst3Window(const Held<v3_edit_controller>&);

}  // namespace PluginHost
