# ssoclient_find_kerberos(PREFIX MODULE...): PkgConfig::PREFIX, the Kerberos libraries with these pkg-config names;
# PREFIX_FOUND tells whether they are there.
function(ssoclient_find_kerberos prefix)
  find_package(PkgConfig REQUIRED)
  pkg_check_modules(${prefix} QUIET IMPORTED_TARGET ${ARGN})
  set(${prefix}_FOUND "${${prefix}_FOUND}" PARENT_SCOPE)
  if(NOT ${prefix}_FOUND)
    return()
  endif()
  # From its cache CMake takes their "-isystem FOLDER" for another kind of flag than at first: the second run would
  # change the commands, and everything be compiled again.
  pkg_get_variable(folder krb5-gssapi includedir)
  set_target_properties(PkgConfig::${prefix} PROPERTIES
    INTERFACE_INCLUDE_DIRECTORIES "${folder}" INTERFACE_COMPILE_OPTIONS "")
endfunction()
