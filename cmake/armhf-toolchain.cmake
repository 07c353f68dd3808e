# Cross build for 32-bit ARM (Debian armhf) with Debian's multiarch packages:
# the compiler from g++-arm-linux-gnueabihf, the libraries from their :armhf
# packages in /usr/lib/arm-linux-gnueabihf. Test programs run under qemu's
# user-mode emulator, so ctest works without binfmt_misc.
#   cmake -S . -B build-armhf -DCMAKE_TOOLCHAIN_FILE=cmake/armhf-toolchain.cmake
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR arm)

set(triplet arm-linux-gnueabihf)
set(CMAKE_C_COMPILER ${triplet}-gcc)
set(CMAKE_CXX_COMPILER ${triplet}-g++)
set(CMAKE_LIBRARY_ARCHITECTURE ${triplet})
set(LSC_DEBIAN_ARCHITECTURE armhf)  # of the .deb that CPack builds
# The notes on parameter passing changed in GCC 7.1 and 10.1 concern linking
# with objects built by older compilers, which this build never does.
set(CMAKE_CXX_FLAGS_INIT -Wno-psabi)

# Libraries and packages only from the armhf side of the multiarch tree; the
# build's own helper programs still come from the host.
set(CMAKE_FIND_ROOT_PATH /usr/${triplet})
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY BOTH)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE BOTH)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE BOTH)
set(ENV{PKG_CONFIG_LIBDIR} /usr/lib/${triplet}/pkgconfig:/usr/share/pkgconfig)

# No -L /usr/arm-linux-gnueabihf: that would load the cross package's dynamic
# loader next to libc6:armhf's libc, and a mismatched pair crashes the first
# thread a program starts. Without it the emulated loader is libc6:armhf's own
# /lib/ld-linux-armhf.so.3, which finds the armhf libraries through ld.so.cache.
find_program(LSC_QEMU_ARM qemu-arm REQUIRED)
set(CMAKE_CROSSCOMPILING_EMULATOR ${LSC_QEMU_ARM})
