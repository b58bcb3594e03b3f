# Runs a fuzz target once over every file of the given directories, without fuzzing:
#   cmake -DTARGET=<executable> -DINPUTS=<dir;dir...> -P Replay.cmake
# Fails when the target reports a finding for any of them.
set(files)
foreach(dir IN LISTS INPUTS)
  file(GLOB found LIST_DIRECTORIES false ${dir}/*)
  list(APPEND files ${found})
endforeach()
if(NOT files)
  message(FATAL_ERROR "no inputs in ${INPUTS}")
endif()
list(SORT files)
execute_process(COMMAND ${TARGET} ${files} RESULT_VARIABLE status)
if(NOT status EQUAL 0)
  message(FATAL_ERROR "${TARGET} failed (${status}) on one of its inputs")
endif()
list(LENGTH files count)
message(STATUS "${count} inputs replayed")
