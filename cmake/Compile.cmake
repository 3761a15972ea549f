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
