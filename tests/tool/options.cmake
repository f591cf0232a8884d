# --version, --help of the tool and of every subcommand, the curves that lists of values make,
# and option values that are refused with the option named.
include(${CMAKE_CURRENT_LIST_DIR}/ToolTest.cmake)
run_tool(out --version)
expect_in("${out}" "^brannoc [0-9]+\\.[0-9]+\\.[0-9]+")
run_tool(out --help)
expect_in("${out}" "sim.*gen.*decode")
foreach(command sim gen decode)
  run_tool(out ${command} --help)
  expect_in("${out}" "Usage: .*${command}")
endforeach()

# Two MCS on 6 PRBs (TBS 1032 QPSK, 1032 16QAM), two SNR points from a range, no blocks.
run_tool(out sim --mcs 10,11 --snr 1:1.5:0.5 --blocks 0 --quiet --csv lists.csv)
file(READ ${WORK}/lists.csv csv)
expect_in("${csv}" "\nmcs=10,1,0,.*\nmcs=10,1.5,0,.*\nmcs=11,1,0,.*\nmcs=11,1.5,0,")
run_tool(out sim --tbs 500 --modulation 64qam --snr 1 --blocks 0 --quiet)
expect_in("${out}" "pusch prb=6 qm=6 tbs=500")

# Exit status | arguments | message.
foreach(refused "2|--rv;0241|--rv: '0241' is not a value it takes"
                "2|--mcs;29|--mcs: '29' is not a value it takes"
                "2|--prb;0|--prb: '0' is not a value it takes"
                "2|--snr;3:1:1|--snr takes values and ranges"
                "1|--channel;pucch;--cqi;14|the transmitter refused the PUCCH payload")
  string(REPLACE "|" ";" parts "${refused}")
  list(POP_FRONT parts status)
  list(POP_BACK parts message)
  run_tool(out sim ${parts} --blocks 0 --quiet EXPECT ${status})
  expect_in("${out}" "${message}")
endforeach()
run_tool(out sim --tbs 100 --mcs 3 EXPECT 108)
run_tool(out gen --mcs 3,4 --out x EXPECT 2)
expect_in("${out}" "every link option takes one value here")
