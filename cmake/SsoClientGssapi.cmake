# ssoclient_find_gssapi(FOUND): finds MIT's GSSAPI library with the Kerberos library below it, once for the whole tree, as
# PkgConfig::SSOCLIENT_GSSAPI, and sets FOUND to true if both are installed.
function(ssoclient_find_gssapi found)
  if(NOT TARGET PkgConfig::SSOCLIENT_GSSAPI)
    find_package(PkgConfig REQUIRED)
    pkg_check_modules(SSOCLIENT_GSSAPI QUIET IMPORTED_TARGET GLOBAL krb5-gssapi krb5)
    if(NOT SSOCLIENT_GSSAPI_FOUND)
      set(${found} FALSE PARENT_SCOPE)
      return()
    endif()
    # CMake does not treat "-isystem FOLDER" in its cache like the same flag in the first configuration. A second
    # configuration would change the commands, and everything would be compiled again.
    pkg_get_variable(folder krb5-gssapi includedir)
    set_target_properties(PkgConfig::SSOCLIENT_GSSAPI PROPERTIES
      INTERFACE_INCLUDE_DIRECTORIES "${folder}" INTERFACE_COMPILE_OPTIONS "")
  endif()
  set(${found} TRUE PARENT_SCOPE)
endfunction()

# ssoclient_kerberos_signs_mechanisms(SIGNS): sets SIGNS to 1 if the Kerberos library answers a service that signs the list
# of mechanisms (RFC 4178, section 5), otherwise to 0. MIT's 1.21 looks for the signature under another tag.
function(ssoclient_kerberos_signs_mechanisms signs)
  set(${signs} 1 PARENT_SCOPE)
  if(SSOCLIENT_GSSAPI_krb5-gssapi_VERSION MATCHES "^1\\.21")
    set(${signs} 0 PARENT_SCOPE)
  endif()
endfunction()
