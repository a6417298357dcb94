# SPDX-License-Identifier: MIT
# Cross-compiles 32-bit Windows programs on Debian: clang for the mingw-w64 target, lld for linking
# and Wine for running. Targets in the Microsoft C++ ABI override the compile target
# (MicrosoftAbi.cmake); their link stays in mingw mode.
set(CMAKE_SYSTEM_NAME Windows)
set(CMAKE_SYSTEM_PROCESSOR x86)

set(CLANG_VERSION 19)
set(MINGW_TRIPLE i686-w64-mingw32)
set(CMAKE_C_COMPILER clang-${CLANG_VERSION})
set(CMAKE_CXX_COMPILER clang++-${CLANG_VERSION})
set(CMAKE_C_COMPILER_TARGET ${MINGW_TRIPLE})
set(CMAKE_CXX_COMPILER_TARGET ${MINGW_TRIPLE})
set(CMAKE_AR llvm-ar-${CLANG_VERSION})
set(CMAKE_RANLIB llvm-ranlib-${CLANG_VERSION})
set(CMAKE_RC_COMPILER ${MINGW_TRIPLE}-windres)

set(link_flags "-fuse-ld=lld -static")
set(CMAKE_EXE_LINKER_FLAGS_INIT "${link_flags}")
set(CMAKE_SHARED_LINKER_FLAGS_INIT "${link_flags}")

set(CMAKE_CROSSCOMPILING_EMULATOR wine)

set(CMAKE_FIND_ROOT_PATH /usr/${MINGW_TRIPLE})
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
