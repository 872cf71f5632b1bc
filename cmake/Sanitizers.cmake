# SSOCLIENT_SANITIZER applies to every target: a sanitizer sees only what is built with it.
set(SSOCLIENT_SANITIZER "" CACHE STRING "Sanitizers to build with: address,undefined or thread")

if(SSOCLIENT_SANITIZER)
  add_compile_options(-fsanitize=${SSOCLIENT_SANITIZER} -fno-omit-frame-pointer -O1 -g1)
  # Instrumented code makes GCC's flow analysis report what cannot happen.
  add_compile_options($<$<CXX_COMPILER_ID:GNU>:-Wno-maybe-uninitialized>)
  if(SSOCLIENT_SANITIZER MATCHES "thread")
    # Asio has fences, which GCC cannot instrument; all that is shared through them is locked besides.
    add_compile_options($<$<CXX_COMPILER_ID:GNU>:-Wno-tsan>)
  endif()
  add_link_options(-fsanitize=${SSOCLIENT_SANITIZER})
  if(SSOCLIENT_SANITIZER MATCHES "undefined")
    add_compile_options(-fno-sanitize-recover=undefined)
  endif()
endif()
