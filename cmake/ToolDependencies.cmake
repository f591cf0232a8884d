# The header-only libraries of the simulation engine and the brannoc tool: CLI11 (command
# line), fmt (text) and nlohmann_json (JSON), from Debian's libcli11-dev, libfmt-dev and
# nlohmann-json3-dev. fmt is used header-only, so that the 32-bit build needs no 32-bit fmt
# library. BRANNOC_TOOL_DEPENDENCIES_FOUND says whether all three were found; without them
# the engine, the tool and their tests are left out and the libraries still build.
find_package(CLI11 QUIET CONFIG)
find_package(nlohmann_json 3 QUIET CONFIG)
find_path(BRANNOC_FMT_INCLUDE_DIR fmt/format.h)

set(BRANNOC_TOOL_DEPENDENCIES_FOUND OFF)
if(CLI11_FOUND AND nlohmann_json_FOUND AND BRANNOC_FMT_INCLUDE_DIR)
  set(BRANNOC_TOOL_DEPENDENCIES_FOUND ON)
  add_library(brannoc_fmt INTERFACE)
  target_include_directories(brannoc_fmt SYSTEM INTERFACE ${BRANNOC_FMT_INCLUDE_DIR})
  target_compile_definitions(brannoc_fmt INTERFACE FMT_HEADER_ONLY=1)
else()
  message(STATUS "brannoc tool and simulation engine left out: CLI11 (${CLI11_FOUND}), "
                 "nlohmann_json (${nlohmann_json_FOUND}), fmt (${BRANNOC_FMT_INCLUDE_DIR})")
endif()
