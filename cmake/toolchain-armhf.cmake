# Cross-compiles for ARMv7 hard-float Linux (the controller's platform) with Debian's cross
# toolchain (crossbuild-essential-armhf); the built programs and tests run under qemu-arm.
#
# KEST_ARMHF_SYSROOT (environment, or the default below) is a folder that holds the ARM Boost
# and inih libraries and the CLI11 and nlohmann-json headers unpacked from Debian's packages,
# an ARM build of GoogleTest and a link to the host's architecture-independent Boost headers.
# scripts/test-armhf prepares it.
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR arm)
set(CMAKE_LIBRARY_ARCHITECTURE arm-linux-gnueabihf)

set(CMAKE_C_COMPILER arm-linux-gnueabihf-gcc)
set(CMAKE_CXX_COMPILER arm-linux-gnueabihf-g++)

if(DEFINED ENV{KEST_ARMHF_SYSROOT})
  set(KEST_ARMHF_SYSROOT "$ENV{KEST_ARMHF_SYSROOT}")
else()
  get_filename_component(KEST_ARMHF_SYSROOT "${CMAKE_CURRENT_LIST_DIR}/../build/armhf-sysroot"
                         ABSOLUTE)
endif()
set(KEST_ARMHF_LIBRARY_DIR "${KEST_ARMHF_SYSROOT}/usr/lib/arm-linux-gnueabihf")

# Libraries, headers and package files come from the ARM folders only; programs from the host.
set(CMAKE_FIND_ROOT_PATH "${KEST_ARMHF_SYSROOT}" /usr/arm-linux-gnueabihf)
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)

# Boost comes without its package configuration files: let FindBoost search by file names.
set(Boost_NO_BOOST_CMAKE ON)

# ctest and test discovery run every ARM program through qemu-arm, with the ARM loader and
# libraries. Tests that start a built program themselves use the same command (see
# KEST_TEST_EMULATOR in tests/kestcfg).
set(CMAKE_CROSSCOMPILING_EMULATOR
    /usr/bin/env QEMU_LD_PREFIX=/usr/arm-linux-gnueabihf
    QEMU_SET_ENV=LD_LIBRARY_PATH=${KEST_ARMHF_LIBRARY_DIR} /usr/bin/qemu-arm)

# GCC notes on every std::pair or iterator argument that its ABI changed in GCC 7.1: the whole
# program is built by one compiler, so the notes say nothing here.
set(CMAKE_CXX_FLAGS_INIT -Wno-psabi)

# pkg-config reads the ARM folder's package files only, and puts their paths under it.
set(ENV{PKG_CONFIG_LIBDIR} "${KEST_ARMHF_LIBRARY_DIR}/pkgconfig:${KEST_ARMHF_SYSROOT}/usr/share/pkgconfig")
set(ENV{PKG_CONFIG_SYSROOT_DIR} "${KEST_ARMHF_SYSROOT}")
