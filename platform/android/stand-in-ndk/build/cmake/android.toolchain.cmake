# Replaces a missing NDK: clang for Android's ARM target, with the headers of Debian's cross C library and with import
# libraries that have only the symbols that the library may use on the device (../../make builds them). It tests the
# Android part of the build, but not bionic's headers.
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR armv7-a)
set(ANDROID TRUE)
foreach(expected IN ITEMS ANDROID_ABI=armeabi-v7a ANDROID_PLATFORM=android-21 ANDROID_STL=c\\+\\+_static)
    string(REGEX MATCH "^([A-Z_]+)=(.*)$" ignored ${expected})
    list(APPEND CMAKE_TRY_COMPILE_PLATFORM_VARIABLES ${CMAKE_MATCH_1})
    if(NOT "${${CMAKE_MATCH_1}}" MATCHES "^${CMAKE_MATCH_2}$")
        message(FATAL_ERROR "${CMAKE_MATCH_1} is \"${${CMAKE_MATCH_1}}\"")
    endif()
endforeach()

set(CMAKE_C_COMPILER clang)
set(CMAKE_CXX_COMPILER clang++)
set(CMAKE_C_COMPILER_TARGET armv7a-linux-androideabi21)
set(CMAKE_CXX_COMPILER_TARGET armv7a-linux-androideabi21)
set(CMAKE_TRY_COMPILE_TARGET_TYPE STATIC_LIBRARY)
set(headers /usr/arm-linux-gnueabihf/include)
file(GLOB cxx_headers ${headers}/c++/*)
list(GET cxx_headers -1 cxx_headers)
# The headers support only hard float. The macro satisfies them without changing the code.
set(CMAKE_C_FLAGS_INIT "-mthumb -nostdlibinc -D__ARM_PCS_VFP -isystem ${headers}")
set(CMAKE_CXX_FLAGS_INIT "-mthumb -nostdlibinc -D__ARM_PCS_VFP -isystem ${cxx_headers} \
-isystem ${cxx_headers}/arm-linux-gnueabihf -isystem ${headers}")
set(CMAKE_SHARED_LINKER_FLAGS_INIT
    "-nostdlib -Wno-unused-command-line-argument -fuse-ld=/usr/bin/arm-linux-gnueabihf-ld -L${CMAKE_CURRENT_LIST_DIR}/../../../../../build/ndk")
set(CMAKE_C_STANDARD_LIBRARIES -lc)
set(CMAKE_CXX_STANDARD_LIBRARIES -lc)
