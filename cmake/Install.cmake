# Headers, library, CMake package and pkg-config file, so that hosts find the library either way.

if(TARGET DSPDrawing)
    set(dsp_drawing DSPDrawing)
endif()
install(TARGETS DSPDll ${dsp_drawing} EXPORT DSPDllTargets
    LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
    ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR}
    RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR}
    FILE_SET HEADERS DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/DSPDll)

set(DSP_PACKAGE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/DSPDll)
install(EXPORT DSPDllTargets NAMESPACE DSPDll:: DESTINATION ${DSP_PACKAGE_DIR})
configure_package_config_file(cmake/DSPDllConfig.cmake.in DSPDllConfig.cmake
    INSTALL_DESTINATION ${DSP_PACKAGE_DIR}
    PATH_VARS CMAKE_INSTALL_BINDIR CMAKE_INSTALL_LIBDIR CMAKE_INSTALL_INCLUDEDIR)
write_basic_package_version_file(DSPDllConfigVersion.cmake COMPATIBILITY SameMajorVersion)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/DSPDllConfig.cmake ${CMAKE_CURRENT_BINARY_DIR}/DSPDllConfigVersion.cmake
    DESTINATION ${DSP_PACKAGE_DIR})

# The file finds its prefix from its own place, so an installed tree may be moved.
file(RELATIVE_PATH DSP_PC_PREFIX /prefix/${CMAKE_INSTALL_LIBDIR}/pkgconfig /prefix)
foreach(library dspdll dspdrawing)
    if(library STREQUAL dspdll OR TARGET DSPDrawing)
        configure_file(cmake/${library}.pc.in ${library}.pc @ONLY)
        install(FILES ${CMAKE_CURRENT_BINARY_DIR}/${library}.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
    endif()
endforeach()
