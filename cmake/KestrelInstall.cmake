# Headers, libraries, a CMake package (kestrel::postprocess) and a pkg-config file. The installed
# tree may be moved as a whole.
include(CMakePackageConfigHelpers)

set(KESTREL_PUBLIC_HEADERS
  colour/vector_clamps.h
  engine/api.h
  engine/context.h
  engine/format_codes.h
  engine/postprocess.h
  engine/records.h
  jni/bitmap_buffers.h
  kernels/all_kernels.def
  kernels/grey/kernels.def
  kernels/kernels.h
  kernels/neon/kernels.def
  kernels/planar_yuv/kernels.def
  kernels/rgb24/kernels.def
  kernels/rgb32/kernels.def
  kernels/rgb565/kernels.def
  kernels/yuyv/kernels.def)

foreach(header IN LISTS KESTREL_PUBLIC_HEADERS)
  get_filename_component(room "${header}" DIRECTORY)
  install(FILES "${header}" DESTINATION "${CMAKE_INSTALL_INCLUDEDIR}/kestrel/${room}")
endforeach()

# The desktop's stand-ins are installed beside the product; a device has its own libraries.
set(kestrel_installed kestrel_postprocess)
if(NOT ANDROID)
  list(APPEND kestrel_installed tessel)
  if(KESTREL_WITH_JAVA)
    list(APPEND kestrel_installed jnigraphics)
  endif()
endif()
install(TARGETS ${kestrel_installed} EXPORT kestrel_postprocess
  LIBRARY DESTINATION "${CMAKE_INSTALL_LIBDIR}")

set(kestrel_package_dir "${CMAKE_INSTALL_LIBDIR}/cmake/kestrel_postprocess")
install(EXPORT kestrel_postprocess NAMESPACE kestrel:: DESTINATION "${kestrel_package_dir}"
  FILE kestrel_postprocess-targets.cmake)
configure_package_config_file(cmake/kestrel_postprocess-config.cmake.in
  "${PROJECT_BINARY_DIR}/kestrel_postprocess-config.cmake"
  INSTALL_DESTINATION "${kestrel_package_dir}")
write_basic_package_version_file("${PROJECT_BINARY_DIR}/kestrel_postprocess-config-version.cmake"
  COMPATIBILITY SameMajorVersion)
install(FILES
  "${PROJECT_BINARY_DIR}/kestrel_postprocess-config.cmake"
  "${PROJECT_BINARY_DIR}/kestrel_postprocess-config-version.cmake"
  DESTINATION "${kestrel_package_dir}")

# pkg-config paths start at the folder of the .pc file, unless the user asked for absolute folders.
set(kestrel_pc_dir "${CMAKE_INSTALL_LIBDIR}/pkgconfig")
if(IS_ABSOLUTE "${CMAKE_INSTALL_LIBDIR}")
  set(kestrel_pc_prefix "${CMAKE_INSTALL_PREFIX}")
else()
  file(RELATIVE_PATH kestrel_pc_up "/${kestrel_pc_dir}" "/")
  set(kestrel_pc_prefix "\${pcfiledir}/${kestrel_pc_up}")
  string(REGEX REPLACE "/$" "" kestrel_pc_prefix "${kestrel_pc_prefix}")
endif()
foreach(kind LIB INCLUDE)
  if(IS_ABSOLUTE "${CMAKE_INSTALL_${kind}DIR}")
    set(kestrel_pc_${kind} "${CMAKE_INSTALL_${kind}DIR}")
  else()
    set(kestrel_pc_${kind} "\${prefix}/${CMAKE_INSTALL_${kind}DIR}")
  endif()
endforeach()
list(REMOVE_ITEM kestrel_installed kestrel_postprocess)
list(TRANSFORM kestrel_installed PREPEND "-l")
list(JOIN kestrel_installed " " kestrel_pc_private)
configure_file(cmake/kestrel_postprocess.pc.in "${PROJECT_BINARY_DIR}/kestrel_postprocess.pc" @ONLY)
install(FILES "${PROJECT_BINARY_DIR}/kestrel_postprocess.pc" DESTINATION "${kestrel_pc_dir}")
