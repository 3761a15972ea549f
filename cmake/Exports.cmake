# Only the contract leaves the library. Hidden visibility and the export declarations see to the library's own
# names; what remains are instances of standard templates, which the standard headers declare visible.
if(NOT WIN32 AND NOT APPLE)
    target_link_options(DSPDll PRIVATE LINKER:--version-script=${CMAKE_CURRENT_LIST_DIR}/Exports.map)
    set_property(TARGET DSPDll APPEND PROPERTY LINK_DEPENDS ${CMAKE_CURRENT_LIST_DIR}/Exports.map)
endif()
