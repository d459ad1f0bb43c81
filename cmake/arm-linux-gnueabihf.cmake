# 32-bit ARM Linux (armv7, hard float) under qemu-user, built by Debian's cross compiler or the one that a preset names.
# Pointer size, time_t, alignment and plain char are the device's.
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR arm)
if(NOT CMAKE_CXX_COMPILER)
    set(CMAKE_C_COMPILER arm-linux-gnueabihf-gcc)
    set(CMAKE_CXX_COMPILER arm-linux-gnueabihf-g++)
endif()
# Times have 32 bits, as on the device, although Debian 13 has 64 by default. -Wno-psabi suppresses notes that an old
# g++ passed some C++ containers differently.
set(CMAKE_C_FLAGS_INIT "-U_TIME_BITS -U_FILE_OFFSET_BITS")
set(CMAKE_CXX_FLAGS_INIT "-Wno-psabi -U_TIME_BITS -U_FILE_OFFSET_BITS")
set(CMAKE_CROSSCOMPILING_EMULATOR qemu-arm -L /usr/arm-linux-gnueabihf)

set(CMAKE_FIND_ROOT_PATH /usr/arm-linux-gnueabihf)
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)
