# The Java face: JNI_OnLoad, the two natives and the library of Bitmap functions that they call.
# Sets KESTREL_WITH_JAVA. On a desktop jni.h comes from a JDK (JAVA_HOME, or the one that javac
# belongs to) and platform/jnigraphics stands in for the device's libjnigraphics.so.
set(KESTREL_JAVA AUTO CACHE STRING "Java natives: ON, OFF, or AUTO (on where jni.h is found)")
set_property(CACHE KESTREL_JAVA PROPERTY STRINGS AUTO ON OFF)

# Folders to add for <jni.h>, and for <android/bitmap.h> on Android.
function(kestrel_find_jni out)
  if(KESTREL_ANDROID_WITHOUT_NDK)
    find_path(KESTREL_ANDROID_JNI_DIR jni.h PATHS /usr/include/android/nativehelper
      NO_DEFAULT_PATH NO_CMAKE_FIND_ROOT_PATH)
    find_path(KESTREL_ANDROID_BITMAP_DIR android/bitmap.h PATHS /usr/include/android
      NO_DEFAULT_PATH NO_CMAKE_FIND_ROOT_PATH)
    mark_as_advanced(KESTREL_ANDROID_JNI_DIR KESTREL_ANDROID_BITMAP_DIR)
    set(${out} "${KESTREL_ANDROID_JNI_DIR}" "${KESTREL_ANDROID_BITMAP_DIR}" PARENT_SCOPE)
    return()
  endif()
  set(home "$ENV{JAVA_HOME}")
  if(NOT home)
    find_program(KESTREL_JAVAC javac NO_CMAKE_FIND_ROOT_PATH)
    mark_as_advanced(KESTREL_JAVAC)
    if(KESTREL_JAVAC)
      get_filename_component(javac "${KESTREL_JAVAC}" REALPATH)
      get_filename_component(home "${javac}/../.." ABSOLUTE)
    endif()
  endif()
  # The JDK of the build machine serves other targets too: the files differ by system only.
  find_path(KESTREL_JNI_DIR jni.h PATHS "${home}/include" NO_DEFAULT_PATH NO_CMAKE_FIND_ROOT_PATH)
  find_path(KESTREL_JNI_MD_DIR jni_md.h PATHS "${home}/include/linux" "${home}/include"
    NO_DEFAULT_PATH NO_CMAKE_FIND_ROOT_PATH)
  mark_as_advanced(KESTREL_JNI_DIR KESTREL_JNI_MD_DIR)
  set(${out} "${KESTREL_JNI_DIR}" "${KESTREL_JNI_MD_DIR}" PARENT_SCOPE)
endfunction()

set(KESTREL_WITH_JAVA ON)
set(KESTREL_JNI_DIRS)
if(KESTREL_JAVA STREQUAL "AUTO" OR KESTREL_JAVA)
  if(NOT ANDROID OR KESTREL_ANDROID_WITHOUT_NDK) # the NDK has both headers in its own folders
    kestrel_find_jni(KESTREL_JNI_DIRS)
  endif()
  if(KESTREL_JNI_DIRS MATCHES "NOTFOUND")
    set(KESTREL_WITH_JAVA OFF)
    if(NOT KESTREL_JAVA STREQUAL "AUTO")
      message(FATAL_ERROR "KESTREL_JAVA is ON, but there is no jni.h: set JAVA_HOME to a JDK, or "
        "install android-libnativehelper-dev and android-platform-frameworks-native-headers")
    endif()
  endif()
else()
  set(KESTREL_WITH_JAVA OFF)
endif()
message(STATUS "Java natives: ${KESTREL_WITH_JAVA}")

if(KESTREL_WITH_JAVA)
  list(APPEND KESTREL_EXPORT_FILES jni/exports-java.def)

  # What sees jni.h and links the Bitmap functions.
  add_library(kestrel_jni INTERFACE)
  target_include_directories(kestrel_jni SYSTEM INTERFACE ${KESTREL_JNI_DIRS})
  target_link_libraries(kestrel_jni INTERFACE jnigraphics)
endif()
