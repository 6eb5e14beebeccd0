# qlx_add_messages(TARGET LOCALE...): the target makes, by ICU's genrb, a resource bundle named
# `messages` in the current build folder from messages/LOCALE.txt of the current source folder.
find_program(QLX_GENRB genrb REQUIRED)

function(qlx_add_messages target)
  set(bundle ${CMAKE_CURRENT_BINARY_DIR}/messages)
  set(outputs)
  foreach(locale IN LISTS ARGN)
    add_custom_command(
      OUTPUT ${bundle}/${locale}.res
      COMMAND ${CMAKE_COMMAND} -E make_directory ${bundle}
      COMMAND ${QLX_GENRB} --quiet --encoding UTF-8 --destdir ${bundle}
              ${CMAKE_CURRENT_SOURCE_DIR}/messages/${locale}.txt
      DEPENDS messages/${locale}.txt
      VERBATIM)
    list(APPEND outputs ${bundle}/${locale}.res)
  endforeach()
  add_custom_target(${target} ALL DEPENDS ${outputs})
endfunction()
