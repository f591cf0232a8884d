# Install rules: public headers, the shared libraries, a CMake package configuration
# (find_package(brannoc)) and pkg-config files. The 32-bit preset installs its libraries and
# pkg-config file under lib32, beside the 64-bit ones under lib. Its CMake package goes to
# lib/cmake/brannoc-i386, which find_package searches on every distribution (Debian's CMake
# does not look into lib32); the version file of each package refuses a consumer of the
# other pointer size, so each consumer picks its own.
include(CMakePackageConfigHelpers)

if(BRANNOC_ARCH_BITS EQUAL 32)
  set(BRANNOC_CMAKE_DIR lib/cmake/brannoc-i386)
else()
  set(BRANNOC_CMAKE_DIR lib/cmake/brannoc)
endif()
install(TARGETS Ip_brannoc_bitacc_cmodel Ip_corvane_bitacc_cmodel EXPORT brannocTargets
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR})
install(DIRECTORY ${PROJECT_SOURCE_DIR}/include/ DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}
  FILES_MATCHING PATTERN "*.h")
install(EXPORT brannocTargets NAMESPACE brannoc:: DESTINATION ${BRANNOC_CMAKE_DIR})

configure_package_config_file(${PROJECT_SOURCE_DIR}/cmake/templates/brannocConfig.cmake.in
  ${PROJECT_BINARY_DIR}/brannocConfig.cmake INSTALL_DESTINATION ${BRANNOC_CMAKE_DIR})
write_basic_package_version_file(${PROJECT_BINARY_DIR}/brannocConfigVersion.cmake
  COMPATIBILITY SameMajorVersion)
install(FILES ${PROJECT_BINARY_DIR}/brannocConfig.cmake ${PROJECT_BINARY_DIR}/brannocConfigVersion.cmake
  DESTINATION ${BRANNOC_CMAKE_DIR})

configure_file(${PROJECT_SOURCE_DIR}/cmake/templates/brannoc.pc.in ${PROJECT_BINARY_DIR}/brannoc.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/brannoc.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
