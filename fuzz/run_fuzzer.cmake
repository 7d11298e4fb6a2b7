# Runs one libFuzzer harness for a test (see fuzz/CMakeLists.txt):
#   cmake -DFUZZER=BIN -DSEEDS=DIR -DDICT=FILE -DWORK=DIR -DRUNS=N -DTIMEOUT=S -P run_fuzzer.cmake
# New inputs go to a fresh directory under WORK, never into the committed seeds; crash
# reproducers land in WORK/artifacts/ and are named in the output.
foreach(required FUZZER WORK RUNS TIMEOUT)
  if(NOT DEFINED ${required})
    message(FATAL_ERROR "run_fuzzer.cmake: ${required} is not set")
  endif()
endforeach()

file(REMOVE_RECURSE ${WORK})
file(MAKE_DIRECTORY ${WORK}/new ${WORK}/artifacts)

# A fixed seed and run count make a run repeat; the time cap only guards CI against a
# harness that became slow, and such a run fails too.
set(args -seed=1 -runs=${RUNS} -timeout=${TIMEOUT} -max_total_time=600 -print_final_stats=1
  -artifact_prefix=${WORK}/artifacts/)
if(DEFINED DICT AND EXISTS ${DICT})
  list(APPEND args -dict=${DICT})
endif()
set(corpora ${WORK}/new)
if(DEFINED SEEDS AND IS_DIRECTORY ${SEEDS})
  list(APPEND corpora ${SEEDS})
else()
  message(WARNING "no seed corpus at ${SEEDS}: the run starts from nothing")
endif()

execute_process(COMMAND ${FUZZER} ${args} ${corpora}
  RESULT_VARIABLE result OUTPUT_VARIABLE output ERROR_VARIABLE output)
string(REGEX MATCH "stat::number_of_executed_units: *[0-9]+" executed "${output}")
string(REGEX REPLACE ".*: *" "" executed "${executed}")
if(NOT result EQUAL 0)
  file(GLOB crashes ${WORK}/artifacts/*)
  message("${output}")
  message(FATAL_ERROR "${FUZZER} failed (${result}); reproducers: ${crashes}")
endif()
if(executed LESS RUNS)
  message("${output}")
  message(FATAL_ERROR "${FUZZER} stopped after ${executed} of ${RUNS} runs")
endif()
message("${FUZZER}: ${executed} runs, no finding")
