#include "C/Handles.h"

#include <array>
#include <atomic>
#include <deque>
#include <mutex>
#include <utility>

namespace Corvo::C {
namespace {

struct Place {
    std::atomic<std::uintptr_t> handle{0};  // 0 while the place is free
    std::atomic<Object*> object{nullptr};
    std::uintptr_t uses = 0;
};

constexpr std::uintptr_t kPageBits = 8, kIndexBits = 16;
// So many free places rest before one is used again, which keeps the numbers of 32-bit handles from coming
// back soon.
constexpr std::size_t kRested = 4096;
constexpr std::uintptr_t kPageSize = 1u << kPageBits, kPages = 1u << (kIndexBits - kPageBits);
using Page = std::array<Place, kPageSize>;

// From the low end: 1, as no pointer to an object ends in; the place; how often it was used.
constexpr std::uintptr_t HandleOf(std::uintptr_t index, std::uintptr_t uses) {
    return 1 | index << 1 | uses << (kIndexBits + 1);
}
constexpr std::uintptr_t IndexOf(std::uintptr_t handle) { return handle >> 1 & ((1u << kIndexBits) - 1); }

// The table lives as long as the process: a host may close handles while the library is unloaded.
struct Table {
    std::mutex lock;
    std::array<std::atomic<Page*>, kPages> pages{};
    std::uintptr_t made = 0;          // places in use or in `free`
    std::deque<std::uintptr_t> free;  // the one that was freed first is used first

    Place* At(std::uintptr_t index) {
        Page* const page = pages[index >> kPageBits].load(std::memory_order_acquire);
        return page ? &(*page)[index & (kPageSize - 1)] : nullptr;
    }
    // Makes a place that is not there yet; null when all are taken.
    Place* Add() {
        if (made == kPages * kPageSize) return nullptr;
        if (made % kPageSize == 0) pages[made >> kPageBits].store(new Page, std::memory_order_release);
        return At(made++);
    }
};

Table& TheTable() {
    static auto& table = *new Table;
    return table;
}

std::uintptr_t Number(const void* handle) { return reinterpret_cast<std::uintptr_t>(handle); }

// The place that the handle names, if it still does.
Place* PlaceOf(const void* handle) {
    if ((Number(handle) & 1) == 0) return nullptr;
    Place* const place = TheTable().At(IndexOf(Number(handle)));
    return place && place->handle.load(std::memory_order_acquire) == Number(handle) ? place : nullptr;
}

}  // namespace

void* OpenHandle(std::unique_ptr<Object> object) {
    Table& table = TheTable();
    const std::lock_guard guard(table.lock);
    std::uintptr_t index = table.made;
    Place* place = nullptr;
    if (table.free.size() > kRested || (table.made == kPages * kPageSize && !table.free.empty())) {
        index = table.free.front();
        table.free.pop_front();
        place = table.At(index);
    } else {
        place = table.Add();
    }
    if (!place) return nullptr;
    const std::uintptr_t handle = HandleOf(index, ++place->uses);
    place->object.store(object.release(), std::memory_order_relaxed);
    place->handle.store(handle, std::memory_order_release);
    return reinterpret_cast<void*>(handle);
}

std::unique_ptr<Object> CloseHandle(const void* handle) {
    Table& table = TheTable();
    const std::lock_guard guard(table.lock);
    Place* const place = PlaceOf(handle);
    if (!place) return nullptr;
    table.free.push_back(IndexOf(Number(handle)));
    place->handle.store(0, std::memory_order_release);
    return std::unique_ptr<Object>(place->object.exchange(nullptr, std::memory_order_relaxed));
}

Object* FindObject(const void* handle) {
    const Place* const place = PlaceOf(handle);
    return place ? place->object.load(std::memory_order_relaxed) : nullptr;
}

}  // namespace Corvo::C
