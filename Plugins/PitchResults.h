#pragma once

#include "Results.h"

namespace Corvo::Plugins {

// What the pitch correction hears and does.
extern const ResultKind kPitchResults;

}  // namespace Corvo::Plugins
