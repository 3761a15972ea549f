# What only the Windows build has: a version resource, the compiler's runtime beside the programs, and the
# package as a zip.

enable_language(RC)
configure_file(${CMAKE_CURRENT_LIST_DIR}/Version.rc.in ${CMAKE_BINARY_DIR}/Version.rc @ONLY)
target_sources(DSPDll PRIVATE ${CMAKE_BINARY_DIR}/Version.rc)

# An exception thrown in the DLL is caught in the host, so both must use one runtime: as DLLs, never linked in.
file(MAKE_DIRECTORY ${CMAKE_RUNTIME_OUTPUT_DIRECTORY})  # a fresh tree has none yet
foreach(name libgcc_s_dw2-1 libstdc++-6 libwinpthread-1)
    execute_process(COMMAND ${CMAKE_CXX_COMPILER} -print-file-name=${name}.dll
        OUTPUT_VARIABLE dll OUTPUT_STRIP_TRAILING_WHITESPACE)
    if(NOT IS_ABSOLUTE "${dll}")
        message(FATAL_ERROR "The compiler does not know where its ${name}.dll is.")
    endif()
    file(COPY_FILE ${dll} ${CMAKE_RUNTIME_OUTPUT_DIRECTORY}/${name}.dll ONLY_IF_DIFFERENT)
    install(FILES ${dll} DESTINATION ${CMAKE_INSTALL_BINDIR})
endforeach()

# The system's memory comes aligned to 8 where the compiler counts on 16; a host that makes objects of the
# library with `new` has to know it too.
target_compile_options(DSPDll INTERFACE -faligned-new=8)

# The package needs the library and the host, not the tests.
set(CMAKE_SKIP_INSTALL_ALL_DEPENDENCY ON)
set(CPACK_GENERATOR ZIP)
set(CPACK_PACKAGE_FILE_NAME DSPDll-${PROJECT_VERSION}-win32)
include(CPack)
