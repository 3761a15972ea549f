# What makes a fault harder to exploit, in release builds; Tests/Package/hardening.sh reads it back from the binaries.
set(dsp_hardening -U_FORTIFY_SOURCE -D_FORTIFY_SOURCE=2 -fstack-protector-strong)
if(WIN32)
    # The guard itself linked in, so that the package needs no further DLL. Images that may be moved and data that
    # is not executable are what this linker makes anyway.
    enable_language(C)
    foreach(language C CXX)
        string(APPEND CMAKE_${language}_STANDARD_LIBRARIES " -l:libssp.a")
    endforeach()
else()
    list(APPEND dsp_hardening -fcf-protection)
    add_link_options($<$<CONFIG:Release>:LINKER:-z,relro,-z,now>)
endif()
add_compile_options("$<$<CONFIG:Release>:${dsp_hardening}>")
