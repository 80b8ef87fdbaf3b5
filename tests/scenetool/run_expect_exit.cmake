# Runs PROGRAM with ARGS (a ;-list) and fails unless it exits with EXPECTED_EXIT.
execute_process(COMMAND ${PROGRAM} ${ARGS} RESULT_VARIABLE code OUTPUT_VARIABLE out ERROR_VARIABLE err)
message("${out}${err}")
if(NOT code EQUAL EXPECTED_EXIT)
  message(FATAL_ERROR "exit status ${code}, expected ${EXPECTED_EXIT}")
endif()
