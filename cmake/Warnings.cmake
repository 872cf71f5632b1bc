# ssoclient_target_warnings(target...): the warnings that every target of this tree is built with.
option(SSOCLIENT_WARNINGS_AS_ERRORS "Treat compiler warnings as errors" OFF)

# GCC 12 sees overlaps in std::string's operator+ that are not there, with optimisation on.
set(ssoclient_false_warnings $<$<CXX_COMPILER_ID:GNU>:-Wno-restrict>)

function(ssoclient_target_warnings)
  foreach(target IN LISTS ARGN)
    target_compile_options(${target} PRIVATE
      -Wall -Wextra -Wpedantic -Wshadow -Wold-style-cast -Wcast-qual -Wundef
      ${ssoclient_false_warnings}
      $<$<BOOL:${SSOCLIENT_WARNINGS_AS_ERRORS}>:-Werror>)
  endforeach()
endfunction()
