# The kernels are written in the vector registers of x86 processors, with SSE2 as the least.
if(NOT CMAKE_SYSTEM_PROCESSOR MATCHES "x86|AMD64|i.86")
    message(FATAL_ERROR "DSPDll needs an x86 processor: its kernels are written for SSE2 and AVX2.")
endif()

# Adds kernels compiled for processors with AVX2. Code beside them takes them where HasAvx2() allows; results are
# those of the baseline. A 32-bit program never does, and an optimised one does not even refer to them.
function(dsp_add_wide_kernels kernels)
    if(CMAKE_SIZEOF_VOID_P EQUAL 4 AND CMAKE_BUILD_TYPE MATCHES "Rel")
        return()
    endif()
    target_sources(dsp_objects PRIVATE ${kernels})
    set_source_files_properties(${kernels} TARGET_DIRECTORY dsp_objects PROPERTIES COMPILE_OPTIONS -mavx2)
endfunction()
