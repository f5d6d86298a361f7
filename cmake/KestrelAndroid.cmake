# What Android asks of libkestrel_postprocess.so beyond kestrel_library_options. Works with the
# NDK's toolchain file (any ANDROID_STL, also none) and with cmake/toolchains/android-clang.cmake.
set(KESTREL_TESSEL_LIBRARY "" CACHE FILEPATH
    "The device's libtessel.so to link; empty links a stub of the same name and symbols")

if(ANDROID_ABI STREQUAL "armeabi-v7a")
  include(CheckCXXSourceCompiles)
  set(saved "${CMAKE_TRY_COMPILE_TARGET_TYPE}")
  set(CMAKE_TRY_COMPILE_TARGET_TYPE STATIC_LIBRARY)
  check_cxx_source_compiles("#ifndef __ARM_NEON\n#error\n#endif\nint present;" KESTREL_ARM_NEON)
  set(CMAKE_TRY_COMPILE_TARGET_TYPE "${saved}")
  if(NOT KESTREL_ARM_NEON)
    message(FATAL_ERROR
      "armeabi-v7a needs NEON, but the compiler does not define __ARM_NEON: drop -mfpu=... and "
      "ANDROID_ARM_NEON=OFF from the flags")
  endif()
endif()

add_subdirectory(platform/android-stubs)

function(kestrel_android_options target)
  if(KESTREL_TESSEL_LIBRARY)
    get_filename_component(directory "${KESTREL_TESSEL_LIBRARY}" DIRECTORY)
    target_link_directories(${target} PRIVATE "${directory}")
  else()
    target_link_directories(${target} PRIVATE "$<TARGET_FILE_DIR:tessel_stub>")
    add_dependencies(${target} tessel_stub)
  endif()
  if(KESTREL_ANDROID_WITHOUT_NDK)
    target_link_libraries(${target} PRIVATE "$<TARGET_FILE:c_stub>" ${KESTREL_ANDROID_BUILTINS})
    add_dependencies(${target} c_stub)
    if(KESTREL_WITH_JAVA)
      target_link_directories(${target} PRIVATE "$<TARGET_FILE_DIR:jnigraphics_stub>")
      add_dependencies(${target} jnigraphics_stub)
    endif()
  endif()
  # The same sources give the same file wherever they are built.
  target_compile_options(kestrel_core PRIVATE "-ffile-prefix-map=${PROJECT_BINARY_DIR}=build"
    "-ffile-prefix-map=${PROJECT_SOURCE_DIR}=.")
  # Devices with 16 KB pages load only files aligned for them; older NDKs align to 4 KB.
  if(CMAKE_SIZEOF_VOID_P EQUAL 8)
    target_link_options(${target} PRIVATE "-Wl,-z,max-page-size=16384")
  endif()
endfunction()
