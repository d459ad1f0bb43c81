# The toolchain file of the NDK in ANDROID_NDK_HOME.
if(NOT EXISTS "$ENV{ANDROID_NDK_HOME}/build/cmake/android.toolchain.cmake")
    message(FATAL_ERROR "No Android NDK in ANDROID_NDK_HOME (\"$ENV{ANDROID_NDK_HOME}\"). Set it to the "
                        "directory of an unpacked NDK; docs/porting.md says which.")
endif()
include("$ENV{ANDROID_NDK_HOME}/build/cmake/android.toolchain.cmake")
