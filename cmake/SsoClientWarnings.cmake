# ssoclient_target_warnings(TARGET...): enables the warnings that every target of this tree is built with.
option(SSOCLIENT_WARNINGS_AS_ERRORS "Treat compiler warnings as errors" OFF)

function(ssoclient_target_warnings)
  foreach(target IN LISTS ARGN)
    # With optimisation on, GCC 12 reports overlaps in std::string's operator+ that cannot happen.
    target_compile_options(${target} PRIVATE
      -Wall -Wextra -Wpedantic -Wshadow -Wold-style-cast -Wcast-qual -Wundef
      $<$<CXX_COMPILER_ID:GNU>:-Wno-restrict>
      $<$<BOOL:${SSOCLIENT_WARNINGS_AS_ERRORS}>:-Werror>)
  endforeach()
endfunction()
