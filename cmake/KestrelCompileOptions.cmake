# Language level, warnings and sanitizers, the same for product, tests and tools.
function(kestrel_compile_options target)
  target_compile_features(${target} PRIVATE cxx_std_17)
  set_target_properties(${target} PROPERTIES CXX_EXTENSIONS OFF C_STANDARD 11 C_EXTENSIONS OFF)
  target_compile_options(${target} PRIVATE -Wall -Wextra -Wshadow -Wconversion -Wno-sign-conversion
    -Wno-psabi)
  if(KESTREL_WARNINGS_AS_ERRORS)
    target_compile_options(${target} PRIVATE -Werror)
  endif()
  if(KESTREL_SANITIZE)
    target_compile_options(${target} PRIVATE -fsanitize=${KESTREL_SANITIZE}
      -fno-sanitize-recover=all -fno-omit-frame-pointer -g1)
    target_link_options(${target} PUBLIC -fsanitize=${KESTREL_SANITIZE})
    if(CMAKE_CXX_COMPILER_ID MATCHES "Clang") # its checks of C++ code, in programs linked as C too
      target_link_options(${target} PUBLIC -fsanitize-link-c++-runtime -lstdc++)
    endif()
  endif()
endfunction()

# The product itself: hidden names, no exceptions, nothing of the C++ runtime.
function(kestrel_product_options target)
  target_compile_options(${target} PRIVATE -fvisibility=hidden
    $<$<COMPILE_LANGUAGE:CXX>:-fvisibility-inlines-hidden -fno-exceptions -fno-rtti
      -fno-threadsafe-statics>)
endfunction()

# CMake adds these where C++ objects are linked as C, as ours are on purpose.
set(CMAKE_CXX_IMPLICIT_LINK_LIBRARIES)

# A shared library of ours. It is linked as C, so a need of the C++ runtime fails the link; it finds
# its neighbours in its own folder; its name carries no version, as Android knows no other.
function(kestrel_library_options target)
  set_target_properties(${target} PROPERTIES
    LINKER_LANGUAGE C
    LIBRARY_OUTPUT_DIRECTORY "${PROJECT_BINARY_DIR}")
  target_link_options(${target} PRIVATE -Wl,-z,relro,-z,now -Wl,-z,noexecstack -Wl,-z,text
    -Wl,--build-id=sha1 -Wl,--as-needed)
  if(NOT KESTREL_SANITIZE)
    target_link_options(${target} PRIVATE -Wl,--no-undefined)
  endif()
  if(NOT ANDROID)
    set_target_properties(${target} PROPERTIES INSTALL_RPATH "$ORIGIN" BUILD_WITH_INSTALL_RPATH ON)
  endif()
endfunction()
