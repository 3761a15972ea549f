#pragma once

#include <bit>
#include <cstddef>

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

}  // namespace TestSupport
