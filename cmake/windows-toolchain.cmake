# What the Windows targets share: MinGW with POSIX threads, so that std::mutex and std::thread exist.

set(CMAKE_SYSTEM_NAME Windows)
set(dsp_compiler ${CMAKE_SYSTEM_PROCESSOR}-w64-mingw32)
set(CMAKE_C_COMPILER ${dsp_compiler}-gcc-posix)
set(CMAKE_CXX_COMPILER ${dsp_compiler}-g++-posix)
set(CMAKE_RC_COMPILER ${dsp_compiler}-windres)

# The libraries built for this target by Scripts/windows-deps.sh; the folder is named after that script and the
# toolchain files.
set(dsp_prefix "$ENV{XDG_CACHE_HOME}")
if(dsp_prefix STREQUAL "")
    set(dsp_prefix "$ENV{HOME}/.cache")
endif()
set(dsp_recipe)
foreach(file ../Scripts/windows-deps.sh windows-toolchain.cmake ${DSP_WINDOWS_TARGET}-toolchain.cmake)
    file(READ "${CMAKE_CURRENT_LIST_DIR}/${file}" dsp_content)
    string(APPEND dsp_recipe "${dsp_content}")
endforeach()
string(SHA256 dsp_recipe "${dsp_recipe}")
string(SUBSTRING "${dsp_recipe}" 0 12 dsp_recipe)
set(dsp_prefix "${dsp_prefix}/dspdll/${DSP_WINDOWS_TARGET}/prefix-${dsp_recipe}")
if(NOT DSP_MAKING_PREFIX AND NOT EXISTS "${dsp_prefix}")
    message(FATAL_ERROR "The libraries for this target are not there yet: "
        "run Scripts/windows-deps.sh ${DSP_WINDOWS_TARGET} once.")
endif()

set(CMAKE_FIND_ROOT_PATH "${dsp_prefix}" /usr/${dsp_compiler})
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)
set(ENV{PKG_CONFIG_LIBDIR} "${dsp_prefix}/lib/pkgconfig")
set(CMAKE_TRY_COMPILE_PLATFORM_VARIABLES DSP_MAKING_PREFIX)

if(NOT DSP_MAKING_PREFIX)
    # ctest runs the Windows programs too.
    set(CMAKE_CROSSCOMPILING_EMULATOR
        "${CMAKE_CURRENT_LIST_DIR}/../Scripts/windows-wine.sh" ${DSP_WINDOWS_TARGET})
endif()
