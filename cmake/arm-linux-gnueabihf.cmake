# Cross build for 32-bit ARM, hard float, with Debian's cross compiler. The C
# library comes with the compiler; everything else (SQLite, Boost, libedit,
# GoogleTest) is looked up only in KORRIN_ARM_SYSROOT, a build-local tree of
# Debian's own armhf packages (see `scripts/dev.sh arm`). Tests and tools run
# under qemu-user.
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR arm)
set(CMAKE_LIBRARY_ARCHITECTURE arm-linux-gnueabihf)
set(CMAKE_C_COMPILER arm-linux-gnueabihf-gcc)
set(CMAKE_CXX_COMPILER arm-linux-gnueabihf-g++)

if(NOT KORRIN_ARM_SYSROOT)
  set(KORRIN_ARM_SYSROOT ${CMAKE_CURRENT_LIST_DIR}/../build-arm/sysroot)
endif()
get_filename_component(KORRIN_ARM_SYSROOT ${KORRIN_ARM_SYSROOT} ABSOLUTE)
list(APPEND CMAKE_TRY_COMPILE_PLATFORM_VARIABLES KORRIN_ARM_SYSROOT)
set(KORRIN_ARM_LIBDIRS
  ${KORRIN_ARM_SYSROOT}/usr/lib/arm-linux-gnueabihf ${KORRIN_ARM_SYSROOT}/lib/arm-linux-gnueabihf)
string(REPLACE ";" ":" KORRIN_ARM_LIBPATH "${KORRIN_ARM_LIBDIRS}")

set(CMAKE_FIND_ROOT_PATH ${KORRIN_ARM_SYSROOT})
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)

# pkg-config reads only the sysroot's .pc files and prefixes their paths with
# it (PKG_CONFIG_PATH would be searched first: the host's stays out).
set(ENV{PKG_CONFIG_LIBDIR} ${KORRIN_ARM_SYSROOT}/usr/lib/arm-linux-gnueabihf/pkgconfig)
set(ENV{PKG_CONFIG_LIBDIR} $ENV{PKG_CONFIG_LIBDIR}:${KORRIN_ARM_SYSROOT}/usr/share/pkgconfig)
set(ENV{PKG_CONFIG_SYSROOT_DIR} ${KORRIN_ARM_SYSROOT})
set(ENV{PKG_CONFIG_PATH} "")

# time_t is 32 bits on armhf unless asked for 64, and a 32-bit clock stops in
# January 2038. Everything compiled here (GoogleTest and the tests' example
# too) agrees on the width; Debian's armhf libraries keep 32 bits, but none of
# their interfaces used here carries a time.
set(KORRIN_ARM_TIME_FLAGS -D_FILE_OFFSET_BITS=64 -D_TIME_BITS=64)
string(REPLACE ";" " " CMAKE_C_FLAGS_INIT "${KORRIN_ARM_TIME_FLAGS}")
# GCC notes that passing some structures changed ABI in GCC 7.1; everything
# here is built by one compiler, so the note says nothing about this build.
set(CMAKE_CXX_FLAGS_INIT "${CMAKE_C_FLAGS_INIT} -Wno-psabi")

# The sysroot's libraries need each other (libedit needs libbsd) at link time.
set(CMAKE_EXE_LINKER_FLAGS_INIT "-Wl,-rpath-link,${KORRIN_ARM_LIBPATH}")
set(CMAKE_SHARED_LINKER_FLAGS_INIT "-Wl,-rpath-link,${KORRIN_ARM_LIBPATH}")

# qemu-user finds the program's dynamic loader and every library under the
# sysroot, where the compiler's own C and C++ libraries are linked in too.
set(CMAKE_CROSSCOMPILING_EMULATOR qemu-arm -L ${KORRIN_ARM_SYSROOT})

# For the tests that build or inspect a program outside CMake: the flags that
# find the sysroot's headers and libraries, its pkg-config files, and `ldd`.
set(KORRIN_CROSS_FLAGS ${KORRIN_ARM_TIME_FLAGS} -isystem ${KORRIN_ARM_SYSROOT}/usr/include
  -L${KORRIN_ARM_SYSROOT}/usr/lib/arm-linux-gnueabihf -Wl,-rpath-link,${KORRIN_ARM_LIBPATH})
set(KORRIN_CROSS_PKG_CONFIG_LIBDIR $ENV{PKG_CONFIG_LIBDIR})
set(KORRIN_CROSS_LDD
  ${CMAKE_CROSSCOMPILING_EMULATOR} ${KORRIN_ARM_SYSROOT}/lib/ld-linux-armhf.so.3 --list)
