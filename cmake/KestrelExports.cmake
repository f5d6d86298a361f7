# Version script and export list, generated from the lines KESTREL_EXPORT(name) of the exports.def
# file in each room and the lines KERNEL(name, ...) of the kernel tables. A name that is listed must
# exist, a name that is not listed stays local.
set(KESTREL_EXPORT_FILES
  engine/exports.def
  colour/exports.def
  kernels/exports.def
  kernels/grey/kernels.def
  kernels/neon/exports.def
  kernels/neon/kernels.def
  kernels/planar_yuv/kernels.def
  kernels/rgb24/kernels.def
  kernels/rgb32/kernels.def
  kernels/rgb565/kernels.def
  kernels/yuyv/kernels.def
  jni/exports.def)

function(kestrel_read_exports out)
  set(names)
  foreach(file IN LISTS KESTREL_EXPORT_FILES)
    set(path "${PROJECT_SOURCE_DIR}/${file}")
    set_property(DIRECTORY "${PROJECT_SOURCE_DIR}" APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS "${path}")
    file(STRINGS "${path}" lines REGEX "^(KESTREL_EXPORT|KERNEL)\\([A-Za-z0-9_]+[,)]")
    foreach(line IN LISTS lines)
      string(REGEX REPLACE "^[A-Z_]+\\(([A-Za-z0-9_]+).*" "\\1" name "${line}")
      list(APPEND names ${name})
    endforeach()
  endforeach()
  list(SORT names)
  set(${out} ${names} PARENT_SCOPE)
endfunction()

function(kestrel_limit_exports target)
  kestrel_read_exports(names)
  list(JOIN names ";\n    " body)
  set(script "${PROJECT_BINARY_DIR}/libkestrel_postprocess.map")
  file(CONFIGURE OUTPUT "${script}" CONTENT "{\n  global:\n    ${body};\n  local:\n    *;\n};\n" @ONLY)
  list(JOIN names "\n" lines)
  file(CONFIGURE OUTPUT "${PROJECT_BINARY_DIR}/exports.txt" CONTENT "${lines}\n" @ONLY)
  target_link_options(${target} PRIVATE "-Wl,--version-script=${script}")
  set_target_properties(${target} PROPERTIES LINK_DEPENDS "${script}")
endfunction()
