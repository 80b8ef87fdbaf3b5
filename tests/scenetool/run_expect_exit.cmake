# Runs PROGRAM with ARGS (a ;-list) and fails unless it exits with EXPECTED_EXIT.
# EMULATOR runs a program of another system (Wine for the Windows build); its line ends are
# made LF so that the expected texts hold on both.
execute_process(COMMAND ${EMULATOR} ${PROGRAM} ${ARGS} RESULT_VARIABLE code OUTPUT_VARIABLE out ERROR_VARIABLE err)
string(REPLACE "\r\n" "\n" out "${out}")
string(REPLACE "\r\n" "\n" err "${err}")
message("${out}${err}")
if(NOT code EQUAL EXPECTED_EXIT)
  message(FATAL_ERROR "exit status ${code}, expected ${EXPECTED_EXIT}")
endif()
