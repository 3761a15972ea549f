#pragma once

#include <bit>
#include <cstddef>
#include <vector>

namespace TestSupport {

// Place of a virtual operation in its table. In this ABI a pointer to a virtual member holds that place, in
// bytes and plus one; a destructor takes two places.
template <typename Member>
int Slot(Member member) {
    struct Pointer {
        std::ptrdiff_t offsetPlusOne, adjustment;
    };
    return static_cast<int>((std::bit_cast<Pointer>(member).offsetPlusOne - 1) /
                            static_cast<std::ptrdiff_t>(sizeof(void*)));
}

template <typename... Members>
std::vector<int> Slots(Members... members) {
    return {Slot(members)...};
}

// The places of `count` operations declared in order around a destructor, which is not counted.
inline std::vector<int> PlacesAround(int destructor, int count) {
    std::vector<int> places;
    for (int i = 0; i < count; ++i) places.push_back(i < destructor ? i : i + 2);
    return places;
}

}  // namespace TestSupport
