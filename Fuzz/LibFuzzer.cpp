// The entry that libFuzzer calls, linked with one target.
#include <span>

#include "Target.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t count) {
    Fuzz::Input input(std::span(bytes, count));
    Fuzz::Target::All().front()->run(input);
    return 0;
}
