# ssoclient_target_sanitizers(TARGET...): builds the targets with the sanitizers of this build. They apply to every
# target, since a sanitizer checks only the code that is built with it.
set(SSOCLIENT_SANITIZER "" CACHE STRING "Sanitizers to build with: address,undefined or thread")

function(ssoclient_target_sanitizers)
  if(NOT SSOCLIENT_SANITIZER)
    return()
  endif()
  set(options -fsanitize=${SSOCLIENT_SANITIZER} -fno-omit-frame-pointer -O1 -g1)
  # In instrumented code, GCC's flow analysis reports initialised values as uninitialised.
  list(APPEND options $<$<CXX_COMPILER_ID:GNU>:-Wno-maybe-uninitialized>)
  if(SSOCLIENT_SANITIZER MATCHES "thread")
    # Asio uses fences, which GCC cannot instrument. Everything shared through them is also protected by locks.
    list(APPEND options $<$<CXX_COMPILER_ID:GNU>:-Wno-tsan>)
  endif()
  if(SSOCLIENT_SANITIZER MATCHES "undefined")
    list(APPEND options -fno-sanitize-recover=undefined)
  endif()
  foreach(target IN LISTS ARGN)
    target_compile_options(${target} PRIVATE ${options})
    target_link_options(${target} PRIVATE -fsanitize=${SSOCLIENT_SANITIZER})
  endforeach()
endfunction()

# ssoclient_target_address_only(TARGET...): does not check the targets for undefined behaviour in a build with sanitizers,
# which are there to check the libraries and the program, since that takes too long.
function(ssoclient_target_address_only)
  if(NOT SSOCLIENT_SANITIZER)
    return()
  endif()
  foreach(target IN LISTS ARGN)
    target_compile_options(${target} PRIVATE -fno-sanitize=undefined)
  endforeach()
endfunction()

# ssoclient_target_unoptimized(TARGET...): does not optimise the targets in a build with tests. For code that only calls
# the libraries under test, since optimising it takes longer than it saves.
function(ssoclient_target_unoptimized)
  if(NOT SSOCLIENT_BUILD_TESTS)
    return()
  endif()
  foreach(target IN LISTS ARGN)
    target_compile_options(${target} PRIVATE -O0 -U_FORTIFY_SOURCE)
  endforeach()
endfunction()
