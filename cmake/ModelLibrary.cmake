# A model library: the sources of the calling folder compiled once into an object library
# (which the tests link) and a shared library that exports exactly the C functions listed in
# the folder's exports.map. The installed library finds its sibling libraries beside it.
option(BRANNOC_LINK_NO_UNDEFINED "Refuse undefined symbols in the model libraries" ON)

function(brannoc_model_library name core)
  file(GLOB sources CONFIGURE_DEPENDS ${CMAKE_CURRENT_SOURCE_DIR}/*.cpp)
  add_library(${core} OBJECT ${sources})
  target_include_directories(${core}
    PUBLIC ${PROJECT_SOURCE_DIR}/include ${CMAKE_CURRENT_SOURCE_DIR}
    PRIVATE ${BRANNOC_GENERATED_DIR})
  brannoc_warnings(${core})

  set(exports ${CMAKE_CURRENT_SOURCE_DIR}/exports.map)
  add_library(${name} SHARED)
  target_link_libraries(${name} PRIVATE ${core})
  target_include_directories(${name} PUBLIC
    $<BUILD_INTERFACE:${PROJECT_SOURCE_DIR}/include> $<INSTALL_INTERFACE:${CMAKE_INSTALL_INCLUDEDIR}>)
  target_link_options(${name} PRIVATE -Wl,--version-script=${exports})
  # Every symbol resolved inside the library, except where the sanitizer runtime comes with
  # the program (clang links it into executables only).
  if(BRANNOC_LINK_NO_UNDEFINED)
    target_link_options(${name} PRIVATE -Wl,--no-undefined)
  endif()
  set_target_properties(${name} PROPERTIES LINK_DEPENDS ${exports} INSTALL_RPATH "$ORIGIN")
endfunction()
