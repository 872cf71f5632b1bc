# PkgConfig::GSSAPI: MIT's GSSAPI library with the Kerberos library below it.
include(KerberosLibrary)
ssoclient_find_kerberos(GSSAPI krb5-gssapi krb5)
if(NOT GSSAPI_FOUND)
  message(FATAL_ERROR "krb5-gssapi is missing, which libssoclient-gssapi.so needs (Debian: libkrb5-dev). Install it, "
    "or leave that library out with -DSSOCLIENT_BUILD_GSSAPI=OFF.")
endif()
