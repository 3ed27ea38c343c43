# Cross build for 64-bit Arm Linux with Debian's cross compiler (g++-aarch64-linux-gnu) against
# the arm64 multiarch packages of the dependencies (dpkg --add-architecture arm64; headers shared
# under /usr/include, libraries under /usr/lib/aarch64-linux-gnu). scripts/test-aarch64 installs
# all of it and runs the tests under qemu-aarch64.
#
#   cmake -S . -B build/aarch64 \
#         -DCMAKE_TOOLCHAIN_FILE=cmake/toolchains/aarch64-linux-gnu.cmake
#
# Optional cache variables:
#   VELMORA_AARCH64_EXTRA_LIBDIRS  directories of arm64 libraries that are not installed as
#                                  packages (the arm64 7z.so that the arm64 libbacktrace needs);
#                                  used for linking and put on the emulated loader's path.
#   VELMORA_AARCH64_EMULATOR       program that runs arm64 executables (default: qemu-aarch64,
#                                  when it is installed); tests and test discovery go through it.
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR aarch64)

set(VELMORA_CROSS_TRIPLE aarch64-linux-gnu)
set(CMAKE_C_COMPILER ${VELMORA_CROSS_TRIPLE}-gcc)
set(CMAKE_CXX_COMPILER ${VELMORA_CROSS_TRIPLE}-g++)
set(CMAKE_LIBRARY_ARCHITECTURE ${VELMORA_CROSS_TRIPLE})

# The cross toolchain's own C library lives in /usr/aarch64-linux-gnu; the dependencies are
# multiarch packages in the host root. Programs (python3, the host tools) always come from the
# build machine; libraries and packages are found by their multiarch directory.
set(CMAKE_FIND_ROOT_PATH /usr/${VELMORA_CROSS_TRIPLE})
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY BOTH)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE BOTH)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE BOTH)

set(VELMORA_AARCH64_EXTRA_LIBDIRS "" CACHE STRING
    "Directories of arm64 libraries outside the package database (for linking and running)")
# Debian's arm64 libbacktrace (pulled in by libutils) needs 7z.so from /usr/lib/p7zip; on a
# build machine that directory holds the host's copy, so the linker is pointed at the arm64 one.
foreach(dir IN LISTS VELMORA_AARCH64_EXTRA_LIBDIRS)
    string(APPEND CMAKE_EXE_LINKER_FLAGS_INIT " -Wl,-rpath-link,${dir}")
    string(APPEND CMAKE_SHARED_LINKER_FLAGS_INIT " -Wl,-rpath-link,${dir}")
endforeach()

# Running arm64 programs on the build machine (tests, gtest discovery). The emulated loader is
# the arm64 multiarch C library's own (/lib/ld-linux-aarch64.so.1, from libc6:arm64), so loader
# and C library always come from one package; the extra directories go on the guest's
# LD_LIBRARY_PATH only (-E), never on the emulator's own.
if(NOT DEFINED VELMORA_AARCH64_EMULATOR)
    find_program(VELMORA_QEMU_AARCH64 qemu-aarch64)
    if(VELMORA_QEMU_AARCH64)
        set(VELMORA_AARCH64_EMULATOR "${VELMORA_QEMU_AARCH64}")
    endif()
endif()
if(VELMORA_AARCH64_EMULATOR)
    set(emulator "${VELMORA_AARCH64_EMULATOR}")
    if(VELMORA_AARCH64_EXTRA_LIBDIRS)
        string(REPLACE ";" ":" guest_path "${VELMORA_AARCH64_EXTRA_LIBDIRS}")
        list(APPEND emulator -E "LD_LIBRARY_PATH=${guest_path}")
    endif()
    set(CMAKE_CROSSCOMPILING_EMULATOR "${emulator}" CACHE STRING
        "Runs arm64 executables on the build machine")
    unset(emulator)
    unset(guest_path)
endif()
