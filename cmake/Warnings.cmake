# ssoclient_target_warnings(target...): the warnings that every target of this tree is built with.
option(SSOCLIENT_WARNINGS_AS_ERRORS "Treat compiler warnings as errors" OFF)

function(ssoclient_target_warnings)
  foreach(target IN LISTS ARGN)
    target_compile_options(${target} PRIVATE
      -Wall -Wextra -Wpedantic -Wshadow -Wold-style-cast -Wcast-qual -Wundef
      $<$<BOOL:${SSOCLIENT_WARNINGS_AS_ERRORS}>:-Werror>)
  endforeach()
endfunction()
