# Adds to `target` the Fourier transforms for processors with AVX2. They are chosen when a plan is made and
# give the same results as the baseline.
function(dsp_add_wide_fft target)
    if(NOT CMAKE_SYSTEM_PROCESSOR MATCHES "x86|AMD64|i.86")
        return()
    endif()
    set(folder ${PROJECT_SOURCE_DIR}/Src/Spectrum)
    target_sources(${target} PRIVATE ${folder}/FftAvx2.cpp)
    set_source_files_properties(${folder}/FftAvx2.cpp
        TARGET_DIRECTORY ${target} PROPERTIES COMPILE_OPTIONS -mavx2)
    set_source_files_properties(${folder}/FftPlan.cpp
        TARGET_DIRECTORY ${target} PROPERTIES COMPILE_DEFINITIONS DSP_WIDE_KERNELS)
endfunction()
