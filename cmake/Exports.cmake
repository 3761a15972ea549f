# Only the contract leaves the libraries. Hidden visibility and the export declarations see to their own names;
# what remains are instances of standard templates, which the standard headers declare visible.
if(NOT WIN32 AND NOT APPLE)
    set(dsp_exports ${CMAKE_CURRENT_LIST_DIR}/Exports.map)
    foreach(library DSPDll DSPDrawing)
        if(TARGET ${library})
            target_link_options(${library} PRIVATE LINKER:--version-script=${dsp_exports})
            set_property(TARGET ${library} APPEND PROPERTY LINK_DEPENDS ${dsp_exports})
        endif()
    endforeach()
endif()
