# The 32-bit Windows target: MinGW with POSIX threads, so that std::mutex and std::thread exist.

set(CMAKE_SYSTEM_NAME Windows)
set(CMAKE_SYSTEM_PROCESSOR i686)
set(CMAKE_C_COMPILER i686-w64-mingw32-gcc-posix)
set(CMAKE_CXX_COMPILER i686-w64-mingw32-g++-posix)
set(CMAKE_RC_COMPILER i686-w64-mingw32-windres)

# Without SSE2 arithmetic a 32-bit build computes with the 80-bit registers and its results differ from
# every other build. Callers align the stack to 4 bytes only and the system's memory comes aligned to 8, which
# the compiler does not expect; vectors need 16.
set(CMAKE_C_FLAGS_INIT "-msse2 -mfpmath=sse -mstackrealign")
set(CMAKE_CXX_FLAGS_INIT "${CMAKE_C_FLAGS_INIT} -faligned-new=8")

# The libraries built for this target by Scripts/win32-deps.sh; the folder is named after that script and this
# file.
set(dsp_win32_prefix "$ENV{XDG_CACHE_HOME}")
if(dsp_win32_prefix STREQUAL "")
    set(dsp_win32_prefix "$ENV{HOME}/.cache")
endif()
file(READ "${CMAKE_CURRENT_LIST_DIR}/../Scripts/win32-deps.sh" dsp_win32_recipe)
file(READ "${CMAKE_CURRENT_LIST_FILE}" dsp_win32_flags)
string(SHA256 dsp_win32_recipe "${dsp_win32_recipe}${dsp_win32_flags}")
string(SUBSTRING "${dsp_win32_recipe}" 0 12 dsp_win32_recipe)
set(dsp_win32_prefix "${dsp_win32_prefix}/dspdll/win32/prefix-${dsp_win32_recipe}")
if(NOT DSP_WIN32_MAKING_PREFIX AND NOT EXISTS "${dsp_win32_prefix}")
    message(FATAL_ERROR "The libraries for this target are not there yet: run Scripts/win32-deps.sh once.")
endif()

set(CMAKE_FIND_ROOT_PATH "${dsp_win32_prefix}" /usr/i686-w64-mingw32)
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)
set(ENV{PKG_CONFIG_LIBDIR} "${dsp_win32_prefix}/lib/pkgconfig")
set(CMAKE_TRY_COMPILE_PLATFORM_VARIABLES DSP_WIN32_MAKING_PREFIX)

if(NOT DSP_WIN32_MAKING_PREFIX)
    # ctest runs the Windows programs too.
    set(CMAKE_CROSSCOMPILING_EMULATOR "${CMAKE_CURRENT_LIST_DIR}/../Scripts/win32-wine.sh")
endif()
