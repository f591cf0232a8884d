# Turns the standard tables kept as CSV in tables/ into C array initialiser rows, one
# "{a, b, c}," line per data row, written to <build>/generated/tables/<name>.inc. Every
# component that needs a table defines its own constant array and includes the rows:
# the numbers have one source, and no component shares another's code.
#
# The Reed-Muller basis rows become {i, {M(i,0), M(i,1), ...}}, an index and an array.
#
# beta_offsets.csv holds decimals that are exact multiples of 1/8 and the word
# "reserved": its rows become {"ACK", index, 8 * beta}, with 0 for a reserved entry.

set(BRANNOC_TABLE_DIR ${PROJECT_SOURCE_DIR}/tables)
set(BRANNOC_GENERATED_DIR ${PROJECT_BINARY_DIR}/generated)

function(brannoc_eighths decimal out)
  if(decimal STREQUAL "reserved")
    set(${out} 0 PARENT_SCOPE)
    return()
  endif()
  string(REGEX MATCH "^([0-9]+)\\.([0-9][0-9][0-9])$" ok "${decimal}")
  if(NOT ok)
    message(FATAL_ERROR "beta_offsets.csv: unreadable value '${decimal}'")
  endif()
  math(EXPR thousandths "${CMAKE_MATCH_1} * 1000 + ${CMAKE_MATCH_2}")
  math(EXPR eighths "${thousandths} * 8 / 1000")
  math(EXPR check "${eighths} * 1000 - ${thousandths} * 8")
  if(NOT check EQUAL 0)
    message(FATAL_ERROR "beta_offsets.csv: ${decimal} is not a multiple of 1/8")
  endif()
  set(${out} ${eighths} PARENT_SCOPE)
endfunction()

function(brannoc_generate_table name)
  set(csv ${BRANNOC_TABLE_DIR}/${name}.csv)
  set(inc ${BRANNOC_GENERATED_DIR}/tables/${name}.inc)
  set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS ${csv})
  file(STRINGS ${csv} lines)
  list(POP_FRONT lines header)
  set(body "// Generated from tables/${name}.csv (columns: ${header}); do not edit.\n")
  foreach(line IN LISTS lines)
    if(line STREQUAL "")
      continue()
    endif()
    string(REPLACE "," ";" cells "${line}")
    if(name STREQUAL "beta_offsets")
      list(GET cells 0 table)
      list(GET cells 1 index)
      list(GET cells 2 beta)
      brannoc_eighths(${beta} eighths)
      string(APPEND body "{\"${table}\", ${index}, ${eighths}},\n")
    else()
      foreach(cell IN LISTS cells)
        if(NOT cell MATCHES "^-?[0-9]+$")
          message(FATAL_ERROR "${name}.csv: '${cell}' is not an integer")
        endif()
      endforeach()
      if(name MATCHES "^rm_")
        # Reed-Muller basis rows: the row index, then the basis bits as one array.
        list(POP_FRONT cells index)
        string(REPLACE ";" ", " row "${cells}")
        string(APPEND body "{${index}, {${row}}},\n")
      else()
        string(REPLACE ";" ", " row "${cells}")
        string(APPEND body "{${row}},\n")
      endif()
    endif()
  endforeach()
  file(CONFIGURE OUTPUT ${inc} CONTENT "${body}")
endfunction()

foreach(table qpp_interleaver rm_20_a_basis rm_32_o_basis tbs_table ul_mcs beta_offsets)
  brannoc_generate_table(${table})
endforeach()
