# Adds to `target` the source `kernels`, compiled for processors with AVX2, and tells the source `chooser` that
# it is there. The chooser takes it where the processor allows; results are those of the baseline.
function(dsp_add_wide_kernels target chooser kernels)
    if(NOT CMAKE_SYSTEM_PROCESSOR MATCHES "x86|AMD64|i.86")
        return()
    endif()
    target_sources(${target} PRIVATE ${kernels})
    set_source_files_properties(${kernels}
        TARGET_DIRECTORY ${target} PROPERTIES COMPILE_OPTIONS -mavx2)
    set_source_files_properties(${chooser}
        TARGET_DIRECTORY ${target} PROPERTIES COMPILE_DEFINITIONS DSP_WIDE_KERNELS)
endfunction()
