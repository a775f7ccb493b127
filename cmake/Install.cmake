include(CMakePackageConfigHelpers)

# Components: `runtime` is what a program needs, `development` what a compiler needs, `python` the package.
install(TARGETS gridmill EXPORT gridmillTargets
        LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT runtime NAMELINK_COMPONENT development)

foreach(header IN LISTS GRIDMILL_HEADERS)
  cmake_path(GET header PARENT_PATH folder)
  install(FILES ${PROJECT_SOURCE_DIR}/${header} DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/gridmill/${folder}
          COMPONENT development)
endforeach()

# find_package(gridmill)
set(GRIDMILL_CMAKE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/gridmill)
configure_package_config_file(
  ${PROJECT_SOURCE_DIR}/cmake/gridmillConfig.cmake.in ${PROJECT_BINARY_DIR}/cmake/gridmillConfig.cmake
  INSTALL_DESTINATION ${GRIDMILL_CMAKE_DIR} NO_SET_AND_CHECK_MACRO)
write_basic_package_version_file(
  ${PROJECT_BINARY_DIR}/cmake/gridmillConfigVersion.cmake
  VERSION ${PROJECT_VERSION} COMPATIBILITY SameMinorVersion)
install(FILES ${PROJECT_BINARY_DIR}/cmake/gridmillConfig.cmake
              ${PROJECT_BINARY_DIR}/cmake/gridmillConfigVersion.cmake
        DESTINATION ${GRIDMILL_CMAKE_DIR} COMPONENT development)
install(EXPORT gridmillTargets NAMESPACE gridmill:: DESTINATION ${GRIDMILL_CMAKE_DIR} COMPONENT development)

# pkg-config. The prefix follows the file to where it is moved; an absolute library folder stays where it is.
if(IS_ABSOLUTE "${CMAKE_INSTALL_LIBDIR}")
  set(GRIDMILL_PC_PREFIX "${CMAKE_INSTALL_PREFIX}")
else()
  file(RELATIVE_PATH GRIDMILL_PC_PREFIX "/prefix/${CMAKE_INSTALL_LIBDIR}/pkgconfig" "/prefix")
  string(REGEX REPLACE "/$" "" GRIDMILL_PC_PREFIX "\${pcfiledir}/${GRIDMILL_PC_PREFIX}")
endif()
set(GRIDMILL_PC_LIBDIR "\${prefix}")
cmake_path(APPEND GRIDMILL_PC_LIBDIR "${CMAKE_INSTALL_LIBDIR}")
set(GRIDMILL_PC_INCLUDEDIR "\${prefix}")
cmake_path(APPEND GRIDMILL_PC_INCLUDEDIR "${CMAKE_INSTALL_INCLUDEDIR}")
configure_file(${PROJECT_SOURCE_DIR}/cmake/gridmill.pc.in ${PROJECT_BINARY_DIR}/cmake/gridmill.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/cmake/gridmill.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig
        COMPONENT development)
