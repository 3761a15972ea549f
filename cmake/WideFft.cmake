# Adds to `target` the Fourier transforms for processors with AVX2.
function(dsp_add_wide_fft target)
    set(folder ${PROJECT_SOURCE_DIR}/Src/Spectrum)
    dsp_add_wide_kernels(${target} ${folder}/FftPlan.cpp ${folder}/FftAvx2.cpp)
endfunction()
