# How everything here is compiled: warnings for all targets that ask for them, sanitizers for all.

add_library(qlxwarnings INTERFACE)
# A class record leaves out what it does not have: null is the default.
target_compile_options(qlxwarnings INTERFACE
  -Wall -Wextra -Wno-missing-field-initializers $<$<BOOL:${QLX_WERROR}>:-Werror>)

set(QLX_INSTRUMENTED OFF)
# A program in C needs the part of clang's runtime that the library's C++ asks for.
if(CMAKE_CXX_COMPILER_ID MATCHES Clang AND (QLX_SANITIZE OR QLX_FUZZ))
  add_link_options(-fsanitize-link-c++-runtime)
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
