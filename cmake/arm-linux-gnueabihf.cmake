# Cross build for 32-bit little-endian ARM (hard float) with Debian's
# g++-arm-linux-gnueabihf. The test programs run under qemu-user: CTest and
# gtest_discover_tests prefix every run with the emulator below. Needs
# dpkg --add-architecture armhf; apt-get install libc6:armhf libstdc++6:armhf.
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR arm)

set(TEXTCONV_TARGET_TRIPLE arm-linux-gnueabihf)
set(CMAKE_C_COMPILER ${TEXTCONV_TARGET_TRIPLE}-gcc)
set(CMAKE_CXX_COMPILER ${TEXTCONV_TARGET_TRIPLE}-g++)
set(CMAKE_AR ${TEXTCONV_TARGET_TRIPLE}-ar CACHE FILEPATH "")
set(CMAKE_RANLIB ${TEXTCONV_TARGET_TRIPLE}-ranlib CACHE FILEPATH "")
set(CMAKE_NM ${TEXTCONV_TARGET_TRIPLE}-nm CACHE FILEPATH "")
set(CMAKE_READELF ${TEXTCONV_TARGET_TRIPLE}-readelf CACHE FILEPATH "")
set(CMAKE_STRIP ${TEXTCONV_TARGET_TRIPLE}-strip CACHE FILEPATH "")

set(TEXTCONV_TARGET_SYSROOT /usr/${TEXTCONV_TARGET_TRIPLE})
set(CMAKE_FIND_ROOT_PATH ${TEXTCONV_TARGET_SYSROOT})
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)

# The programs run against Debian's armhf run time (libc6:armhf,
# libstdc++6:armhf from multiarch), found under / by the loader
# /lib/ld-linux-armhf.so.3; that C library also finds its own gconv modules in
# /usr/lib/arm-linux-gnueabihf/gconv. Not -L /usr/arm-linux-gnueabihf: the
# cross packages' C library there (2.36-8cross1) crashes every fork() child
# under qemu-user, which breaks the death tests.
set(CMAKE_CROSSCOMPILING_EMULATOR qemu-arm;-L;/)
