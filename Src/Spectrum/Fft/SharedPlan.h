#pragma once

#include "Spectrum/Fft/FftPlan.h"

namespace Corvo::Fft {

// A plan that all transforms of its kind and length in the process have in common.
template <typename T>
struct SharedPlan {
    const Plan<T>* plan = nullptr;
    int users = 0;
};

// The plan for 2^order points (or real values), order 0..19. Built for the first who asks, while others that
// ask or give back wait. Null without memory.
template <typename T>
SharedPlan<T>* TakePlan(int order, Kind kind);
// The last who gives a plan back frees it. Null is nothing.
template <typename T>
void GiveBack(SharedPlan<T>* shared);

}  // namespace Corvo::Fft
