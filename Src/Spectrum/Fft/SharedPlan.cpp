#include "Spectrum/Fft/SharedPlan.h"

#include <array>
#include <mutex>

#include "Platform/AlignedMemory.h"

namespace Corvo::Fft {
namespace {

constexpr std::size_t kOrders = 20, kKinds = 2;

std::mutex mutex;
template <typename T>
std::array<std::array<SharedPlan<T>, kOrders>, kKinds> plans;

}  // namespace

template <typename T>
SharedPlan<T>* TakePlan(int order, Kind kind) {
    const std::lock_guard lock(mutex);
    auto& shared = plans<T>[static_cast<std::size_t>(kind)][static_cast<std::size_t>(order)];
    if (!shared.plan)
        if (void* const memory = AlignedAllocate(PlanBytes<T>(order, kind)))
            shared.plan = BuildPlan<T>(memory, order, kind);
    if (!shared.plan) return nullptr;
    ++shared.users;
    return &shared;
}

template <typename T>
void GiveBack(SharedPlan<T>* shared) {
    if (!shared) return;
    const std::lock_guard lock(mutex);
    if (--shared->users > 0) return;
    AlignedFree(const_cast<Plan<T>*>(shared->plan));  // the beginning of its memory
    shared->plan = nullptr;
}

template SharedPlan<float>* TakePlan(int, Kind);
template SharedPlan<double>* TakePlan(int, Kind);
template void GiveBack(SharedPlan<float>*);
template void GiveBack(SharedPlan<double>*);

}  // namespace Corvo::Fft
