# The library built by a profile of its own work, as scripts/buildProfiled does it in two passes over
# one build folder: with QLX_PROFILE=generate it records where it spends its time, with
# QLX_PROFILE=use it is compiled and linked as a whole by what was recorded.

set(QLX_PROFILE_FOLDER ${CMAKE_BINARY_DIR}/profile)

# qlx_add_profile(OBJECTS LIBRARY)
function(qlx_add_profile objects library)
  if(NOT QLX_PROFILE)
    return()
  endif()
  if(NOT CMAKE_CXX_COMPILER_ID STREQUAL GNU)
    message(FATAL_ERROR "QLX_PROFILE needs gcc")
  endif()
  if(QLX_PROFILE STREQUAL generate)
    target_compile_options(${objects} PRIVATE
      -fprofile-generate -fprofile-update=atomic -fprofile-dir=${QLX_PROFILE_FOLDER})
    target_link_options(${library} PRIVATE -fprofile-generate)
  elseif(QLX_PROFILE STREQUAL use)
    # What the profile does not reach is optimised as without one.
    target_compile_options(${objects} PRIVATE
      -fprofile-use=${QLX_PROFILE_FOLDER} -fprofile-partial-training -Wno-missing-profile)
    set_target_properties(${objects} ${library} PROPERTIES INTERPROCEDURAL_OPTIMIZATION ON)
  else()
    message(FATAL_ERROR "QLX_PROFILE is '${QLX_PROFILE}', which is neither generate nor use")
  endif()
endfunction()
