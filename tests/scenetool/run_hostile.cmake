# Runs `PROGRAM COMMAND FILE` on every file of FOLDER with extension EXTENSION and fails
# unless each run ends with exit status 0 (the data that could be read is kept; warnings say
# what was lost) or 1 with exactly one error line that names the file. A signal or any other
# status fails. EMULATOR runs a program of another system (Wine for the Windows build).
file(GLOB files "${FOLDER}/*${EXTENSION}")
list(LENGTH files count)
if(count EQUAL 0)
  message(FATAL_ERROR "no ${EXTENSION} files in ${FOLDER}")
endif()
set(failures "")
foreach(path IN LISTS files)
  execute_process(COMMAND ${EMULATOR} ${PROGRAM} ${COMMAND} ${path}
                  RESULT_VARIABLE code OUTPUT_QUIET ERROR_VARIABLE err)
  string(REPLACE "\r\n" "\n" err "${err}")
  get_filename_component(name "${path}" NAME)
  # Counted by their start alone: a message may hold a ';', which would split a CMake list.
  string(REGEX MATCHALL "scenetool: error: " starts "${err}")
  list(LENGTH starts errorLines)
  string(REGEX MATCH "scenetool: error: [^\n]*" error "${err}")
  if(code EQUAL 0)
    message("${name}: exit 0")
  elseif(code EQUAL 1 AND errorLines EQUAL 1 AND error MATCHES "^scenetool: error: [^\n]*${name}: .")
    message("${name}: exit 1: ${error}")
  else()
    string(APPEND failures "${name}: exit status '${code}', ${errorLines} error lines:\n${err}\n")
  endif()
endforeach()
if(failures)
  message(FATAL_ERROR "${failures}")
endif()
