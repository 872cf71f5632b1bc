# ssoclient_select_tests(VARIABLE): under ThreadSanitizer, keeps of a list of test sources those that have threaded tests.
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

# ssoclient_add_test_runs(TARGET SHARDS): runs a GoogleTest program as SHARDS processes, which CTest may run side by
# side. A process a test would spend most of its time on starting sanitizers.
function(ssoclient_add_test_runs target shards)
  # Sanitizers look into the libraries; optimising the tests as well costs more time than it saves, and so does looking
  # for undefined behaviour in them.
  if(SSOCLIENT_SANITIZER)
    target_compile_options(${target} PRIVATE -O0 -fno-sanitize=undefined)
  endif()
  math(EXPR last "${shards} - 1")
  foreach(index RANGE ${last})
    set(name "${target}.${index}")
    add_test(NAME ${name} COMMAND ${target} --gtest_brief=1)
    set_tests_properties(${name} PROPERTIES
      ENVIRONMENT "GTEST_TOTAL_SHARDS=${shards};GTEST_SHARD_INDEX=${index}" TIMEOUT 600)
  endforeach()
endfunction()
