# Android without the NDK: the distribution's clang and lld, the C headers of platform/android-stubs
# and link stubs for the few libc functions that the library may use. ANDROID_ABI is armeabi-v7a
# (the default), arm64-v8a or x86_64. The compiler and linker options are those of the NDK.
set(CMAKE_SYSTEM_NAME Android)
set(CMAKE_SYSTEM_VERSION 1) # any other version makes CMake look for an NDK
set(CMAKE_TRY_COMPILE_TARGET_TYPE STATIC_LIBRARY)
set(CMAKE_TRY_COMPILE_PLATFORM_VARIABLES ANDROID_ABI)
set(KESTREL_ANDROID_WITHOUT_NDK ON)

if(NOT ANDROID_ABI)
  set(ANDROID_ABI armeabi-v7a)
endif()
set(ANDROID_ABI ${ANDROID_ABI} CACHE STRING "armeabi-v7a, arm64-v8a or x86_64")

set(abi_flags)
if(ANDROID_ABI STREQUAL "armeabi-v7a")
  set(CMAKE_SYSTEM_PROCESSOR armv7-a)
  set(target armv7a-linux-androideabi21)
  set(abi_flags "-mthumb")
  # Debian's clang has no run-time functions for ARM (64-bit division and the like); gcc's fit.
  execute_process(COMMAND arm-linux-gnueabi-gcc -print-libgcc-file-name
                  OUTPUT_VARIABLE KESTREL_ANDROID_BUILTINS OUTPUT_STRIP_TRAILING_WHITESPACE
                  RESULT_VARIABLE result)
  if(NOT result EQUAL 0)
    message(FATAL_ERROR "arm-linux-gnueabi-gcc is needed for the compiler's run-time functions")
  endif()
elseif(ANDROID_ABI STREQUAL "arm64-v8a")
  set(CMAKE_SYSTEM_PROCESSOR aarch64)
  set(target aarch64-linux-android21)
elseif(ANDROID_ABI STREQUAL "x86_64")
  set(CMAKE_SYSTEM_PROCESSOR x86_64)
  set(target x86_64-linux-android21)
else()
  message(FATAL_ERROR "ANDROID_ABI is '${ANDROID_ABI}', not armeabi-v7a, arm64-v8a or x86_64")
endif()

get_filename_component(headers "${CMAKE_CURRENT_LIST_DIR}/../../platform/android-stubs/include"
                       ABSOLUTE)
string(CONCAT flags "-nostdlibinc -isystem \"${headers}\" ${abi_flags} -g -DANDROID -fPIC"
  " -fdata-sections -ffunction-sections -funwind-tables -fstack-protector-strong"
  " -D_FORTIFY_SOURCE=2 -Wformat -Werror=format-security")
foreach(language C CXX)
  set(CMAKE_${language}_COMPILER_TARGET ${target})
  set(CMAKE_${language}_FLAGS_INIT "${flags}")
endforeach()
set(CMAKE_C_COMPILER clang)
set(CMAKE_CXX_COMPILER clang++)
string(APPEND CMAKE_CXX_FLAGS_INIT " -fno-exceptions -fno-rtti")
set(CMAKE_SHARED_LINKER_FLAGS_INIT
  "-fuse-ld=lld -nostdlib -Wl,--fatal-warnings,--gc-sections -Wno-unused-command-line-argument")

set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)
