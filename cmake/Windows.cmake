# What only the Windows builds have: a version resource, the compiler's runtime beside the programs, what other
# compilers' linkers take, and the package as a zip.

enable_language(RC)
configure_file(${CMAKE_CURRENT_LIST_DIR}/Version.rc.in ${CMAKE_BINARY_DIR}/Version.rc @ONLY)
target_sources(DSPDll PRIVATE ${CMAKE_BINARY_DIR}/Version.rc)

if(CMAKE_SIZEOF_VOID_P EQUAL 8)
    set(dsp_windows win64)
    set(dsp_machine i386:x86-64)
    set(dsp_libgcc libgcc_s_seh-1)
else()
    set(dsp_windows win32)
    set(dsp_machine i386)
    set(dsp_libgcc libgcc_s_dw2-1)
    # The system's memory comes aligned to 8 where the compiler counts on 16; a host that makes objects of the
    # library with `new` has to know it too.
    target_compile_options(DSPDll INTERFACE $<$<COMPILE_LANGUAGE:CXX>:-faligned-new=8>)
endif()

# An exception thrown in the DLL is caught in the host, so both must use one runtime: as DLLs, never linked in.
file(MAKE_DIRECTORY ${CMAKE_RUNTIME_OUTPUT_DIRECTORY})  # a fresh tree has none yet
foreach(name ${dsp_libgcc} libstdc++-6 libwinpthread-1)
    execute_process(COMMAND ${CMAKE_CXX_COMPILER} -print-file-name=${name}.dll
        OUTPUT_VARIABLE dll OUTPUT_STRIP_TRAILING_WHITESPACE)
    if(NOT IS_ABSOLUTE "${dll}")
        message(FATAL_ERROR "The compiler does not know where its ${name}.dll is.")
    endif()
    file(COPY_FILE ${dll} ${CMAKE_RUNTIME_OUTPUT_DIRECTORY}/${name}.dll ONLY_IF_DIFFERENT)
    install(FILES ${dll} DESTINATION ${CMAKE_INSTALL_BINDIR})
endforeach()

# For hosts of the other compiler family: the names of the C interface, and an import library made of them.
find_program(DSP_DLLTOOL NAMES llvm-dlltool llvm-dlltool-14 REQUIRED)
list(JOIN DSP_C_FUNCTIONS "\n    " names)
file(CONFIGURE OUTPUT ${CMAKE_BINARY_DIR}/DSPDll.def CONTENT "LIBRARY DSPDll.dll\nEXPORTS\n    ${names}\n")
add_custom_command(OUTPUT DSPDll.lib DEPENDS DSPDll.def VERBATIM
    COMMAND ${DSP_DLLTOOL} -m ${dsp_machine} -d DSPDll.def -l DSPDll.lib)
add_custom_target(import_library DEPENDS DSPDll.lib)
add_dependencies(DSPDll import_library)
install(FILES ${CMAKE_BINARY_DIR}/DSPDll.def ${CMAKE_BINARY_DIR}/DSPDll.lib DESTINATION ${CMAKE_INSTALL_LIBDIR})

# The package needs the library and the host, not the tests.
set(CMAKE_SKIP_INSTALL_ALL_DEPENDENCY ON)
set(CPACK_GENERATOR ZIP)
set(CPACK_PACKAGE_FILE_NAME DSPDll-${PROJECT_VERSION}-${dsp_windows})
include(CPack)
