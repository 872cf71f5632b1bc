# ssoclient_add_test_runs(TARGET SHARDS): runs a GoogleTest program as SHARDS processes, which CTest may run side by
# side. A process a test would spend most of its time on starting sanitizers.
function(ssoclient_add_test_runs target shards)
  math(EXPR last "${shards} - 1")
  foreach(index RANGE ${last})
    set(name "${target}.${index}")
    add_test(NAME ${name} COMMAND ${target} --gtest_brief=1)
    set_tests_properties(${name} PROPERTIES
      ENVIRONMENT "GTEST_TOTAL_SHARDS=${shards};GTEST_SHARD_INDEX=${index}" TIMEOUT 600)
  endforeach()
endfunction()
