# ssoclient_target_hardening(TARGET...): builds the targets of an optimised build with the protections of Debian's
# packages, and keeps the folders of the build out of them, also out of the source locations of exceptions. Builds for
# debugging are left as they are, since some protections need optimisation and debuggers need the folders. Sanitizers
# replace the same functions.
function(ssoclient_target_hardening)
  if(SSOCLIENT_SANITIZER OR SSOCLIENT_BUILD_FUZZERS)
    return()
  endif()
  set(compile_options -fstack-protector-strong -fstack-clash-protection -Wformat -Werror=format-security
    # Where both match, compilers use the last.
    "-ffile-prefix-map=${PROJECT_SOURCE_DIR}/=" "-ffile-prefix-map=${PROJECT_BINARY_DIR}/=build/")
  if(CMAKE_SYSTEM_PROCESSOR MATCHES "^(x86_64|AMD64)$")
    list(APPEND compile_options -fcf-protection)
  elseif(CMAKE_SYSTEM_PROCESSOR MATCHES "^(aarch64|arm64)$")
    list(APPEND compile_options -mbranch-protection=standard)
  endif()
  if(NOT CMAKE_CXX_FLAGS MATCHES "_FORTIFY_SOURCE")
    list(APPEND compile_options -U_FORTIFY_SOURCE -D_FORTIFY_SOURCE=2)
  endif()
  set(is_optimized "$<CONFIG:Release,RelWithDebInfo,MinSizeRel>")
  foreach(target IN LISTS ARGN)
    target_compile_options(${target} PRIVATE "$<${is_optimized}:${compile_options}>")
    target_link_options(${target} PRIVATE "$<${is_optimized}:-Wl,-z,relro;-Wl,-z,now>")
    get_target_property(type ${target} TYPE)
    if(type STREQUAL "EXECUTABLE")
      target_link_options(${target} PRIVATE
        "$<$<AND:${is_optimized},$<BOOL:$<TARGET_PROPERTY:POSITION_INDEPENDENT_CODE>>>:-pie>")
    endif()
  endforeach()
endfunction()
