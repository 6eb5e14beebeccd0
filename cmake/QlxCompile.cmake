# How everything here is compiled: warnings for all targets that ask for them, sanitizers for all.

add_library(qlxwarnings INTERFACE)
# A class record leaves out what it does not have: null is the default.
target_compile_options(qlxwarnings INTERFACE
  -Wall -Wextra -Wno-missing-field-initializers $<$<BOOL:${QLX_WERROR}>:-Werror>)

set(QLX_INSTRUMENTED OFF)
if(QLX_SANITIZE OR QLX_FUZZ)
  # Programs in C too are linked as C++: the library's C++ asks for that part of the runtime.
  set(CMAKE_C_LINK_EXECUTABLE "${CMAKE_CXX_LINK_EXECUTABLE}")
endif()
if(QLX_SANITIZE)
  set(QLX_INSTRUMENTED ON)
  add_compile_options(-fsanitize=${QLX_SANITIZE} -fno-sanitize-recover=all -fno-omit-frame-pointer)
  add_link_options(-fsanitize=${QLX_SANITIZE})
endif()
if(QLX_FUZZ)
  if(NOT CMAKE_CXX_COMPILER_ID MATCHES Clang OR QLX_SANITIZE)
    message(FATAL_ERROR "QLX_FUZZ needs clang, and brings its own sanitizers")
  endif()
  set(QLX_INSTRUMENTED ON)
  add_compile_options(-fsanitize=fuzzer-no-link,address,undefined -fno-sanitize-recover=all
                      -fno-omit-frame-pointer)
  add_link_options(-fsanitize=address,undefined)
endif()
