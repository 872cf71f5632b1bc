# ssoclient_install_package(NAME ... TARGET ... HEADERS ... DESCRIPTION ... [REQUIRES ...] [DEPENDENCIES ...]): installs
# a shared library with its headers, a CMake package and a pkg-config file, as a component with the package's name.
# HEADERS are folders, REQUIRES names pkg-config packages; each entry of DEPENDENCIES names a CMake package and its version.
function(ssoclient_install_package)
  cmake_parse_arguments(PARSE_ARGV 0 PACKAGE "" "NAME;TARGET;DESCRIPTION" "HEADERS;REQUIRES;DEPENDENCIES")
  if(NOT SSOCLIENT_INSTALL)
    return()
  endif()
  include(CMakePackageConfigHelpers)
  set(cmake_dir "${CMAKE_INSTALL_LIBDIR}/cmake/${PACKAGE_NAME}")

  install(TARGETS ${PACKAGE_TARGET} EXPORT ${PACKAGE_NAME}Targets
    LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT ${PACKAGE_NAME})
  install(DIRECTORY ${PACKAGE_HEADERS} DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}
    COMPONENT ${PACKAGE_NAME} FILES_MATCHING PATTERN "*.h")
  install(EXPORT ${PACKAGE_NAME}Targets NAMESPACE ${PACKAGE_NAME}:: DESTINATION ${cmake_dir}
    COMPONENT ${PACKAGE_NAME})

  set(PACKAGE_FIND_DEPENDENCIES "")
  foreach(dependency IN LISTS PACKAGE_DEPENDENCIES)
    string(APPEND PACKAGE_FIND_DEPENDENCIES "find_dependency(${dependency})\n")
  endforeach()
  configure_package_config_file("${PROJECT_SOURCE_DIR}/cmake/PackageConfig.cmake.in"
    "${CMAKE_CURRENT_BINARY_DIR}/${PACKAGE_NAME}Config.cmake" INSTALL_DESTINATION ${cmake_dir})
  write_basic_package_version_file(
    "${CMAKE_CURRENT_BINARY_DIR}/${PACKAGE_NAME}ConfigVersion.cmake"
    VERSION ${PROJECT_VERSION} COMPATIBILITY SameMajorVersion)
  install(FILES
    "${CMAKE_CURRENT_BINARY_DIR}/${PACKAGE_NAME}Config.cmake"
    "${CMAKE_CURRENT_BINARY_DIR}/${PACKAGE_NAME}ConfigVersion.cmake"
    DESTINATION ${cmake_dir} COMPONENT ${PACKAGE_NAME})

  # Relative to the pkg-config file, since the prefix may be chosen at installation. Not for /usr, whose folders
  # pkg-config leaves out of the flags only if it recognises them.
  file(RELATIVE_PATH up "/${CMAKE_INSTALL_LIBDIR}/pkgconfig" "/")
  string(REGEX REPLACE "/$" "" up "${up}")
  list(JOIN PACKAGE_REQUIRES " " PACKAGE_REQUIRES)
  set(PACKAGE_PC_PREFIX "\${pcfiledir}/${up}")
  if(CMAKE_INSTALL_PREFIX STREQUAL "/usr")
    set(PACKAGE_PC_PREFIX "/usr")
  endif()
  configure_file("${PROJECT_SOURCE_DIR}/cmake/package.pc.in"
    "${CMAKE_CURRENT_BINARY_DIR}/${PACKAGE_TARGET}.pc" @ONLY)
  install(FILES "${CMAKE_CURRENT_BINARY_DIR}/${PACKAGE_TARGET}.pc"
    DESTINATION "${CMAKE_INSTALL_LIBDIR}/pkgconfig" COMPONENT ${PACKAGE_NAME})
endfunction()
