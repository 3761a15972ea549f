# 32-bit Linux, for the fuzzers: Clang with Debian's i386 libraries, unpacked by Scripts/i386-root.sh.

set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR i686)

set(CMAKE_SYSROOT "${CMAKE_CURRENT_LIST_DIR}/../build/i386-root")
if(NOT EXISTS "${CMAKE_SYSROOT}")
    message(FATAL_ERROR "The libraries for this target are not there yet: run Scripts/i386-root.sh once.")
endif()
set(CMAKE_CXX_COMPILER clang++)
set(CMAKE_CXX_COMPILER_TARGET i686-linux-gnu)
# As the 32-bit DLL computes: not in the 80-bit registers.
set(CMAKE_CXX_FLAGS_INIT "-msse2 -mfpmath=sse")
# What is built runs with those libraries too; this system need not have any of 32 bits.
string(CONCAT CMAKE_EXE_LINKER_FLAGS_INIT "-Wl,--dynamic-linker=${CMAKE_SYSROOT}/lib/ld-linux.so.2,--disable-new-dtags"
    ",-rpath,${CMAKE_SYSROOT}/usr/lib/i386-linux-gnu:${CMAKE_SYSROOT}/lib/i386-linux-gnu")

set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)
set(ENV{PKG_CONFIG_LIBDIR} "${CMAKE_SYSROOT}/usr/lib/i386-linux-gnu/pkgconfig:${CMAKE_SYSROOT}/usr/share/pkgconfig")
set(ENV{PKG_CONFIG_SYSROOT_DIR} "${CMAKE_SYSROOT}")
