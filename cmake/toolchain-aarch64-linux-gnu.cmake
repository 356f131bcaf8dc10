# Cross build for 64-bit ARM Linux with Debian's aarch64-linux-gnu compiler.
# Test executables run under qemu user emulation against the arm64 sysroot,
# and libraries such as GTest come from the arm64 multiarch directories.
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR aarch64)

set(CLIPWEAVER_TARGET_TRIPLE aarch64-linux-gnu)
set(CMAKE_C_COMPILER ${CLIPWEAVER_TARGET_TRIPLE}-gcc)
set(CMAKE_CXX_COMPILER ${CLIPWEAVER_TARGET_TRIPLE}-g++)

set(CMAKE_CROSSCOMPILING_EMULATOR
  qemu-aarch64 -L /usr/${CLIPWEAVER_TARGET_TRIPLE})

# Debian is multiarch: the cross compiler's own sysroot holds the C library,
# and packages installed for arm64 (libgtest-dev:arm64) live beside the host's
# in /usr/lib/aarch64-linux-gnu, so / is searched as well. The library
# architecture keeps lookups in the arm64 directories, never the x86-64 ones.
set(CMAKE_FIND_ROOT_PATH /usr/${CLIPWEAVER_TARGET_TRIPLE} /)
set(CMAKE_LIBRARY_ARCHITECTURE ${CLIPWEAVER_TARGET_TRIPLE})

# Programs (javac, readelf) run on the host; libraries, headers and packages
# are searched under the roots above only.
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)
