# The 32-bit Windows target.

set(DSP_WINDOWS_TARGET win32)
set(CMAKE_SYSTEM_PROCESSOR i686)

# Without SSE2 arithmetic a 32-bit build computes with the 80-bit registers and its results differ from
# every other build. Callers align the stack to 4 bytes only and the system's memory comes aligned to 8, which
# the compiler does not expect; vectors need 16.
set(CMAKE_C_FLAGS_INIT "-msse2 -mfpmath=sse -mstackrealign")
set(CMAKE_CXX_FLAGS_INIT "${CMAKE_C_FLAGS_INIT} -faligned-new=8")

include("${CMAKE_CURRENT_LIST_DIR}/windows-toolchain.cmake")
