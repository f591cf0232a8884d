# One seed gives the same CSV on one thread and on two, with an error target that stops
# points in the middle of the sweep and retransmissions that combine.
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
