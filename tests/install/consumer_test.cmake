# Installs the build into a scratch prefix, then configures, builds and runs the consumer
# project against it. Arguments: BUILD_DIR, SOURCE_DIR, WORK_DIR, LIBDIR, FLAGS (compiler
# flags) and EMULATOR (what runs the build's programs, may be empty).
file(REMOVE_RECURSE ${WORK_DIR})
execute_process(COMMAND ${CMAKE_COMMAND} --install ${BUILD_DIR} --prefix ${WORK_DIR}/prefix
  RESULT_VARIABLE rc OUTPUT_QUIET)
if(NOT rc EQUAL 0)
  message(FATAL_ERROR "install failed")
endif()
# pkg-config files carry the configured prefix; point pkg-config at the scratch prefix.
file(GLOB pc_dirs ${WORK_DIR}/prefix/lib*/pkgconfig)
foreach(dir IN LISTS pc_dirs)
  file(READ ${dir}/brannoc.pc pc)
  string(REGEX REPLACE "prefix=[^\n]*" "prefix=${WORK_DIR}/prefix" pc "${pc}")
  file(WRITE ${dir}/brannoc.pc "${pc}")
endforeach()
set(ENV{PKG_CONFIG_PATH} "")
foreach(dir IN LISTS pc_dirs)
  if(dir MATCHES "${LIBDIR}/pkgconfig$")
    set(ENV{PKG_CONFIG_PATH} ${dir})
  endif()
endforeach()
execute_process(COMMAND ${CMAKE_COMMAND} -S ${SOURCE_DIR} -B ${WORK_DIR}/build
  -DCMAKE_PREFIX_PATH=${WORK_DIR}/prefix "-DCMAKE_C_FLAGS=${FLAGS}"
  "-DCMAKE_EXE_LINKER_FLAGS=${FLAGS}" RESULT_VARIABLE rc)
if(NOT rc EQUAL 0)
  message(FATAL_ERROR "consumer configure failed")
endif()
execute_process(COMMAND ${CMAKE_COMMAND} --build ${WORK_DIR}/build RESULT_VARIABLE rc)
if(NOT rc EQUAL 0)
  message(FATAL_ERROR "consumer build failed")
endif()
foreach(program consumer consumer_pkgconfig)
  execute_process(COMMAND ${EMULATOR} ${WORK_DIR}/build/${program} RESULT_VARIABLE rc)
  if(NOT rc EQUAL 0)
    message(FATAL_ERROR "${program} failed")
  endif()
endforeach()
