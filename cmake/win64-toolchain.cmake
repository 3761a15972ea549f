# The 64-bit Windows target.

set(DSP_WINDOWS_TARGET win64)
set(CMAKE_SYSTEM_PROCESSOR x86_64)

# The compiler writes moves of 32 bytes that need an aligned address, to a stack that this target aligns to 16
# only. The assembler makes them moves that do not.
set(CMAKE_C_FLAGS_INIT "-Wa,-muse-unaligned-vector-move")
set(CMAKE_CXX_FLAGS_INIT "${CMAKE_C_FLAGS_INIT}")

include("${CMAKE_CURRENT_LIST_DIR}/windows-toolchain.cmake")
