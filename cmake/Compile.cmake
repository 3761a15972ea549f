# Compiler settings shared by the library, the programs and the tests.

add_library(dsp_compile INTERFACE)
# The Windows headers declare names such as `byte` globally; hiding those is not our doing.
target_compile_options(dsp_compile INTERFACE -Wall -Wextra -Wconversion -Wshadow$<$<BOOL:${WIN32}>:=local>)
if(DSP_WARNINGS_AS_ERRORS)
    target_compile_options(dsp_compile INTERFACE -Werror)
endif()

# Results must not depend on whether the compiler fused a multiplication with an addition.
add_compile_options(-ffp-contract=off)

if(DSP_SANITIZE)
    add_compile_options(-fsanitize=${DSP_SANITIZE} -fno-omit-frame-pointer -fno-sanitize-recover=all)
    add_link_options(-fsanitize=${DSP_SANITIZE})
endif()
if(DSP_FUZZ)
    add_compile_options(-fsanitize=fuzzer-no-link)
endif()

# Clang asks a library for the atomic access to a pair of words that GCC writes inline.
include(CheckCXXSourceCompiles)
set(dsp_atomic_pair "#include <atomic>
    struct Pair { int a, b; };
    std::atomic<Pair> pair;
    int main() { return pair.load().a; }")
check_cxx_source_compiles("${dsp_atomic_pair}" DSP_ATOMICS_ARE_INLINE)
if(NOT DSP_ATOMICS_ARE_INLINE)
    target_link_libraries(dsp_compile INTERFACE atomic)
endif()
