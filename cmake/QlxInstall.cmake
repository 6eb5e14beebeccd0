# What `cmake --install` lays down: the library with its headers, the command, a CMake package
# (find_package(qlx), qlx::qlx) and a pkg-config file. All of it can be moved to another prefix.
include(CMakePackageConfigHelpers)

set(QLX_CMAKE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/qlx)

install(TARGETS qlx EXPORT qlxTargets
        LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
        INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(DIRECTORY include/qlx DESTINATION ${CMAKE_INSTALL_INCLUDEDIR} FILES_MATCHING PATTERN "*.h")
install(EXPORT qlxTargets NAMESPACE qlx:: DESTINATION ${QLX_CMAKE_DIR})
if(TARGET qlx_command)
  install(TARGETS qlx_command RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
endif()

configure_package_config_file(cmake/qlxConfig.cmake.in ${CMAKE_CURRENT_BINARY_DIR}/qlxConfig.cmake
                              INSTALL_DESTINATION ${QLX_CMAKE_DIR})
write_basic_package_version_file(${CMAKE_CURRENT_BINARY_DIR}/qlxConfigVersion.cmake
                                 COMPATIBILITY SameMajorVersion)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/qlxConfig.cmake
              ${CMAKE_CURRENT_BINARY_DIR}/qlxConfigVersion.cmake
        DESTINATION ${QLX_CMAKE_DIR})

# The way from the pkg-config file up to the prefix, so that a moved tree still works.
cmake_path(RELATIVE_PATH CMAKE_INSTALL_PREFIX
           BASE_DIRECTORY ${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig OUTPUT_VARIABLE QLX_PC_UP)
configure_file(qlx.pc.in qlx.pc @ONLY)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/qlx.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
