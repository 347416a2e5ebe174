# Runs PROGRAM with TMPDIR set to an empty SCRATCH directory and checks that
# it exits with 0, writes exactly EXPECTED to stdout, and leaves SCRATCH empty.
file(REMOVE_RECURSE "${SCRATCH}")
file(MAKE_DIRECTORY "${SCRATCH}")
set(ENV{TMPDIR} "${SCRATCH}")
execute_process(COMMAND "${PROGRAM}"
  OUTPUT_VARIABLE actual
  ERROR_VARIABLE errors
  RESULT_VARIABLE status)

if(NOT status STREQUAL "0")
  message(FATAL_ERROR "${PROGRAM} exited with ${status}\n${errors}")
endif()

file(READ "${EXPECTED}" expected)
if(NOT actual STREQUAL expected)
  file(WRITE "${SCRATCH}.actual.txt" "${actual}")
  execute_process(COMMAND diff -u "${EXPECTED}" "${SCRATCH}.actual.txt")
  message(FATAL_ERROR "the output of ${PROGRAM} differs from ${EXPECTED}\n${errors}")
endif()

file(GLOB_RECURSE left LIST_DIRECTORIES true "${SCRATCH}/*")
if(left)
  message(FATAL_ERROR "${PROGRAM} left files behind: ${left}")
endif()
file(REMOVE "${SCRATCH}.actual.txt")
