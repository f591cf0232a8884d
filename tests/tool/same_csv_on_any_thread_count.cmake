# One seed gives the same CSV on one thread, on two, and (with MPI) on two processes of one
# thread each, with an error target that stops points in the middle of the sweep and
# retransmissions that combine.
include(${CMAKE_CURRENT_LIST_DIR}/ToolTest.cmake)
set(sweep sim --prb 2 --mcs 6,12 --snr -2:4:2 --blocks 60 --errors 10 --batch 8 --max-tx 3
    --iterations 4 --cqi 12 --ack 2 --ri 1 --seed 5 --quiet)
run_tool(one ${sweep} --threads 1 --csv one.csv)
run_tool(two ${sweep} --threads 2 --csv two.csv)
file(READ ${WORK}/one.csv a)
file(READ ${WORK}/two.csv b)
if(NOT a STREQUAL b)
  message(FATAL_ERROR "1 thread:\n${a}\n2 threads:\n${b}")
endif()
# The sweep spans decoded and failed blocks: neither all zero nor all one.
expect_in("${a}" ",0\\.[0-9]+,")

if(MPIEXEC)
  # Open MPI runs as root and on more ranks than cores only when told so.
  set(mpirun ${MPIEXEC} --allow-run-as-root --oversubscribe -np 2)
  execute_process(COMMAND ${mpirun} ${TOOL} ${sweep} --threads 1 --csv mpi.csv
    WORKING_DIRECTORY ${WORK} RESULT_VARIABLE rc OUTPUT_VARIABLE out ERROR_VARIABLE err)
  file(READ ${WORK}/mpi.csv c)
  if(NOT rc EQUAL 0 OR NOT a STREQUAL c)
    message(FATAL_ERROR "2 processes (exit ${rc}):\n${c}\n${out}${err}")
  endif()
  # Ranks started with different options stop at once, rank 0 saying so.
  execute_process(COMMAND ${MPIEXEC} --allow-run-as-root --oversubscribe -np 1 ${TOOL} ${sweep}
                          --blocks 1 : -np 1 ${TOOL} ${sweep}
    WORKING_DIRECTORY ${WORK} RESULT_VARIABLE rc OUTPUT_VARIABLE out ERROR_VARIABLE err
    TIMEOUT 60)
  if(rc EQUAL 0)
    message(FATAL_ERROR "ranks of different options ran:\n${out}${err}")
  endif()
  expect_in("${out}${err}" "brannoc: rank 1: started with other options than rank 0")
endif()
