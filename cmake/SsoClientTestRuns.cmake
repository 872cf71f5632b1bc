# Functions that add test programs and register them with CTest.
include("${CMAKE_CURRENT_LIST_DIR}/SsoClientTarget.cmake")

add_custom_target(ssoclient_test_programs)

# Compiled once, for every test program.
file(CONFIGURE OUTPUT "${PROJECT_BINARY_DIR}/ssoclient_test_pch.cpp" CONTENT "")
add_library(ssoclient_test_pch OBJECT "${PROJECT_BINARY_DIR}/ssoclient_test_pch.cpp")
target_link_libraries(ssoclient_test_pch PRIVATE GTest::gmock)
target_precompile_headers(ssoclient_test_pch PRIVATE
  <gmock/gmock.h> <gtest/gtest.h> <memory> <string> <vector>)

# ssoclient_configure_test_target(TARGET...): compiles test code, which is not optimised. Under sanitizers, which are there
# to check the libraries, the tests are not checked for undefined behaviour, since that takes too long.
function(ssoclient_configure_test_target)
  ssoclient_configure_target(${ARGN})
  ssoclient_target_unoptimized(${ARGN})
  ssoclient_target_address_only(${ARGN})
  foreach(target IN LISTS ARGN)
    # Programs and libraries are compiled with the same options, so that they can share the precompiled header.
    set_target_properties(${target} PROPERTIES POSITION_INDEPENDENT_CODE OFF)
    if(NOT target STREQUAL "ssoclient_test_pch")
      target_precompile_headers(${target} REUSE_FROM ssoclient_test_pch)
    endif()
  endforeach()
endfunction()
ssoclient_configure_test_target(ssoclient_test_pch)

# ssoclient_select_tests(VARIABLE): under ThreadSanitizer, removes the sources without threaded tests from a list of test
# sources.
function(ssoclient_select_tests variable)
  if(NOT SSOCLIENT_SANITIZER MATCHES "thread")
    return()
  endif()
  set(selected)
  foreach(source IN LISTS ${variable})
    file(STRINGS "${source}" found REGEX "^(TEST|INSTANTIATE).*(Thread|Concurren|Async|Pool)" LIMIT_COUNT 1)
    if(found)
      list(APPEND selected "${source}")
    endif()
  endforeach()
  set(${variable} ${selected} PARENT_SCOPE)
endfunction()

# ssoclient_glob_tests(TESTS SUPPORT FOLDER): sets TESTS to the test sources below FOLDER that ssoclient_select_tests
# keeps, and SUPPORT to the other sources below it, except those of probes, which are programs.
function(ssoclient_glob_tests tests support folder)
  file(GLOB_RECURSE sources CONFIGURE_DEPENDS "${folder}/*.cpp")
  set(helpers ${sources})
  list(FILTER sources INCLUDE REGEX "_test\\.cpp$")
  list(FILTER helpers EXCLUDE REGEX "_(test|probe)\\.cpp$")
  ssoclient_select_tests(sources)
  set(${tests} ${sources} PARENT_SCOPE)
  set(${support} ${helpers} PARENT_SCOPE)
endfunction()

# ssoclient_separate_tests(SOURCE...): compiles each of these test sources on its own, since names in it are also those of
# something else in a test of its folder.
function(ssoclient_separate_tests)
  set_source_files_properties(${ARGN} PROPERTIES SKIP_UNITY_BUILD_INCLUSION ON)
endfunction()

# ssoclient_merge_tests(TARGET): with SSOCLIENT_MERGE_PROGRAMS, compiles up to eight test sources of a folder as one
# translation unit, since most of the time goes into the headers and templates that they share.
function(ssoclient_merge_tests target)
  set_target_properties(${target} PROPERTIES UNITY_BUILD "${SSOCLIENT_MERGE_PROGRAMS}" UNITY_BUILD_MODE GROUP)
  get_target_property(sources ${target} SOURCES)
  list(FILTER sources INCLUDE REGEX "_test\\.cpp$")
  foreach(source IN LISTS sources)
    cmake_path(GET source PARENT_PATH folder)
    string(MAKE_C_IDENTIFIER "tests_${folder}" folder)
    list(APPEND merged_${folder} "${source}")
    list(LENGTH merged_${folder} count)
    math(EXPR group "(${count} - 1) / 8")
    set_source_files_properties("${source}" PROPERTIES UNITY_GROUP "${folder}_${group}")
  endforeach()
endfunction()

# ssoclient_add_test_program(TARGET SHARDS SOURCE...): builds a GoogleTest program, and runs it as SHARDS processes that
# CTest may run in parallel. With one process for each test, most of the time would be spent starting sanitizers.
function(ssoclient_add_test_program target shards)
  add_executable(${target} ${ARGN})
  ssoclient_configure_test_target(${target})
  ssoclient_merge_tests(${target})
  target_link_libraries(${target} PRIVATE GTest::gmock_main)
  add_dependencies(ssoclient_test_programs ${target})
  math(EXPR last "${shards} - 1")
  foreach(index RANGE ${last})
    set(name "${target}.${index}")
    add_test(NAME ${name} COMMAND ${target} --gtest_brief=1)
    set_tests_properties(${name} PROPERTIES
      ENVIRONMENT "GTEST_TOTAL_SHARDS=${shards};GTEST_SHARD_INDEX=${index}" TIMEOUT 600)
  endforeach()
endfunction()

# ssoclient_add_probe(PROBE SOURCE TESTS MACRO LIBRARY...): builds a program that the test program TESTS runs as a child
# process, by the path in MACRO.
function(ssoclient_add_probe probe source tests macro)
  add_executable(${probe} "${source}")
  target_link_libraries(${probe} PRIVATE ${ARGN})
  ssoclient_configure_target(${probe})
  add_dependencies(${tests} ${probe})
  target_compile_definitions(${tests} PRIVATE ${macro}="$<TARGET_FILE:${probe}>")
endfunction()
