# Helpers of the tool tests: run_tool(OUT args...) runs the program, failing the test unless
# it exits with EXPECT (default 0), and leaves its standard output in OUT.
file(REMOVE_RECURSE ${WORK})
file(MAKE_DIRECTORY ${WORK})

function(run_tool out)
  cmake_parse_arguments(PARSE_ARGV 1 arg "" "EXPECT" "")
  if(NOT DEFINED arg_EXPECT)
    set(arg_EXPECT 0)
  endif()
  execute_process(COMMAND ${EMULATOR} ${TOOL} ${arg_UNPARSED_ARGUMENTS}
    WORKING_DIRECTORY ${WORK} RESULT_VARIABLE rc OUTPUT_VARIABLE stdout ERROR_VARIABLE stderr)
  if(NOT rc STREQUAL arg_EXPECT)
    message(FATAL_ERROR "brannoc ${arg_UNPARSED_ARGUMENTS}: exit ${rc}, wanted ${arg_EXPECT}\n"
                        "${stdout}\n${stderr}")
  endif()
  set(${out} "${stdout}${stderr}" PARENT_SCOPE)
endfunction()

function(expect_in text pattern)
  if(NOT text MATCHES "${pattern}")
    message(FATAL_ERROR "wanted '${pattern}' in:\n${text}")
  endif()
endfunction()
