# ssoclient_configure_target(TARGET...): compiles targets with the options of this tree, without changing the settings
# of a project that contains it.
include("${CMAKE_CURRENT_LIST_DIR}/SsoClientWarnings.cmake")
include("${CMAKE_CURRENT_LIST_DIR}/SsoClientSanitizers.cmake")
include("${CMAKE_CURRENT_LIST_DIR}/SsoClientHardening.cmake")

function(ssoclient_configure_target)
  foreach(target IN LISTS ARGN)
    target_compile_features(${target} PRIVATE cxx_std_20)
    set_target_properties(${target} PROPERTIES
      CXX_EXTENSIONS OFF
      CXX_VISIBILITY_PRESET hidden
      VISIBILITY_INLINES_HIDDEN ON
      POSITION_INDEPENDENT_CODE ON
      UNITY_BUILD OFF)
    if(SSOCLIENT_BUILD_FUZZERS)
      # libFuzzer is guided by the coverage of the code that a fuzzer calls.
      target_compile_options(${target} PRIVATE -fsanitize=fuzzer-no-link)
    endif()
  endforeach()
  ssoclient_target_warnings(${ARGN})
  ssoclient_target_sanitizers(${ARGN})
  ssoclient_target_hardening(${ARGN})
endfunction()
