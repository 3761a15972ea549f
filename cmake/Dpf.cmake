# Plug-ins on DPF, which is taken from the system: one LV2 bundle, one CLAP and one VST3 file in the build folder,
# below lv2, clap and vst3.

find_path(DSP_DPF_DIR distrho/DistrhoPluginMain.cpp
    PATHS /usr/share/dpf /usr/local/share/dpf
    NO_CMAKE_FIND_ROOT_PATH
    DOC "The folder of DPF's sources")
if(NOT DSP_DPF_DIR)
    message(FATAL_ERROR "DSP_BUILD_PLUGINS needs the sources of DPF (Debian: apt-get install dpf-source). "
        "Elsewhere than in /usr/share/dpf they are found with -DDSP_DPF_DIR=FOLDER.")
endif()
enable_language(C)  # of its generator
if(WIN32)
    # One file is one plug-in: nothing after the hardening's library is linked as a DLL again.
    foreach(language C CXX)
        string(REPLACE " -Wl,-Bdynamic" "" CMAKE_${language}_STANDARD_LIBRARIES "${CMAKE_${language}_STANDARD_LIBRARIES}")
    endforeach()
endif()
set(DPF_ROOT_DIR ${DSP_DPF_DIR})
include(${DSP_DPF_DIR}/cmake/DPF-plugin.cmake)

# dsp_add_plugin(NAME FORMATS lv2 clap vst3 INFO FOLDER SOURCES ... [UI ...] [LIBRARIES ...])
#
# NAME      of the files, and of the target that makes all formats
# INFO      the folder of DistrhoPluginInfo.h
# SOURCES   compiled once for all formats
# UI        the window's sources, drawn through Cairo; the processor and its window share one binary
# LIBRARIES what both are linked with
function(dsp_add_plugin NAME)
    cmake_parse_arguments(PARSE_ARGV 1 PLUGIN "" "INFO" "FORMATS;SOURCES;UI;LIBRARIES")
    add_library(${NAME}-parts OBJECT ${PLUGIN_SOURCES} ${PLUGIN_UI})
    target_include_directories(${NAME}-parts SYSTEM PUBLIC ${DSP_DPF_DIR}/distrho)
    target_include_directories(${NAME}-parts PUBLIC ${PLUGIN_INFO})
    target_link_libraries(${NAME}-parts PUBLIC ${PLUGIN_LIBRARIES} PRIVATE dsp_compile)
    if(PLUGIN_UI)
        dpf__add_dgl_cairo()
        target_compile_definitions(${NAME}-parts PUBLIC DGL_CAIRO HAVE_CAIRO HAVE_DGL)
        target_link_libraries(${NAME}-parts PUBLIC dgl-cairo)
        # Their headers are not ours to warn about.
        target_include_directories(${NAME}-parts SYSTEM PUBLIC ${DSP_DPF_DIR}/dgl
            $<TARGET_PROPERTY:dgl-cairo,INTERFACE_INCLUDE_DIRECTORIES>)
    endif()

    add_custom_target(${NAME} ALL)
    foreach(format ${PLUGIN_FORMATS})
        string(TOUPPER ${format} macro)
        set(module ${NAME}-${format})
        set(file ${CMAKE_BINARY_DIR}/${format})
        add_library(${module} MODULE ${DSP_DPF_DIR}/distrho/DistrhoPluginMain.cpp)
        if(PLUGIN_UI)
            target_sources(${module} PRIVATE ${DSP_DPF_DIR}/distrho/DistrhoUIMain.cpp)
        endif()
        target_compile_definitions(${module} PRIVATE DISTRHO_PLUGIN_TARGET_${macro})
        # DPF's own sources, not ours to warn about.
        target_compile_options(${module} PRIVATE -w)
        target_link_libraries(${module} PRIVATE ${NAME}-parts)
        dsp_finish_plugin(${module})
        set(symbols ${format})
        if(format STREQUAL lv2)
            set(symbols lv2-dsp)
            if(PLUGIN_UI)
                set(symbols lv2)
            endif()
            string(APPEND file /${NAME}.lv2)
            set_target_properties(${module} PROPERTIES OUTPUT_NAME ${NAME})
            dpf__add_lv2_ttl_generator()
            add_custom_command(TARGET ${module} POST_BUILD
                COMMAND lv2_ttl_generator $<TARGET_FILE:${module}> > /dev/null
                COMMAND sed -i "/ mod:/d" ${NAME}.ttl  # a vocabulary that no package describes
                WORKING_DIRECTORY ${file}
                VERBATIM)
            add_dependencies(${module} lv2_ttl_generator)
        elseif(format STREQUAL clap)
            set_target_properties(${module} PROPERTIES OUTPUT_NAME ${NAME} SUFFIX .clap)
        endif()
        if(format STREQUAL vst3)
            dsp_place_vst3(${module} ${NAME})
        else()
            dsp_export_only(${module} ${DSP_DPF_DIR}/utils/symbols/${symbols})
            set_target_properties(${module} PROPERTIES LIBRARY_OUTPUT_DIRECTORY ${file})
        endif()
        add_dependencies(${NAME} ${module})
    endforeach()
endfunction()

# A plug-in stands alone: everything of ours is in it, and on Windows the compiler's libraries too.
function(dsp_finish_plugin MODULE)
    set_target_properties(${MODULE} PROPERTIES PREFIX "" CXX_VISIBILITY_PRESET hidden VISIBILITY_INLINES_HIDDEN ON)
    if(WIN32)
        target_link_options(${MODULE} PRIVATE -static)
    else()
        target_link_options(${MODULE} PRIVATE LINKER:--no-undefined $<$<CONFIG:Release>:LINKER:--strip-all>)
        target_link_libraries(${MODULE} PRIVATE ${CMAKE_DL_LIBS})
    endif()
endfunction()

# Hides all but the format's entry points. LIST: the path of a .def and a .version file without its ending.
function(dsp_export_only MODULE LIST)
    if(WIN32)
        target_sources(${MODULE} PRIVATE ${LIST}.def)
    else()
        target_link_options(${MODULE} PRIVATE LINKER:--version-script=${LIST}.version)
    endif()
endfunction()

# A VST3 bundle: on Windows and elsewhere a folder with the file deep inside.
function(dsp_place_vst3 MODULE NAME)
    set(folder ${CMAKE_BINARY_DIR}/vst3/${NAME}.vst3/Contents)
    if(WIN32)
        set_target_properties(${MODULE} PROPERTIES
            OUTPUT_NAME ${NAME} SUFFIX .vst3 LIBRARY_OUTPUT_DIRECTORY ${folder}/x86_64-win)
    else()
        set_target_properties(${MODULE} PROPERTIES
            OUTPUT_NAME ${NAME} LIBRARY_OUTPUT_DIRECTORY ${folder}/x86_64-linux)
    endif()
    dsp_export_only(${MODULE} ${DSP_DPF_DIR}/utils/symbols/vst3)
endfunction()
