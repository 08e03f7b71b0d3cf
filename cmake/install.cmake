# Installs headers, libraries, the CMake package jsonvalue (target jsonvalue::jsonvalue), the
# pkg-config file jsonvalue.pc and the licence.
include(CMakePackageConfigHelpers)

set(JSONVALUE_CMAKE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/jsonvalue)

install(DIRECTORY include/json TYPE INCLUDE)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/include/json/version.hpp
  DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/json)
# Static or shared as built. A static libjsonvalue.a needs the companions' archives too: the
# exported target links them, and they are installed beside it.
install(TARGETS jsonvalue jsonvalue_number_text jsonvalue_text_encoding
  EXPORT jsonvalueTargets
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
  ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR}
  INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(EXPORT jsonvalueTargets NAMESPACE jsonvalue:: DESTINATION ${JSONVALUE_CMAKE_DIR})

configure_package_config_file(cmake/jsonvalueConfig.cmake.in
  ${CMAKE_CURRENT_BINARY_DIR}/jsonvalueConfig.cmake
  INSTALL_DESTINATION ${JSONVALUE_CMAKE_DIR})
# Before 1.0 a minor version may break compatibility.
write_basic_package_version_file(${CMAKE_CURRENT_BINARY_DIR}/jsonvalueConfigVersion.cmake
  COMPATIBILITY SameMinorVersion)
install(FILES
  ${CMAKE_CURRENT_BINARY_DIR}/jsonvalueConfig.cmake
  ${CMAKE_CURRENT_BINARY_DIR}/jsonvalueConfigVersion.cmake
  DESTINATION ${JSONVALUE_CMAKE_DIR})

# The way up from the .pc file to the prefix: lib/pkgconfig or lib/x86_64-linux-gnu/pkgconfig.
file(RELATIVE_PATH JSONVALUE_PC_TO_PREFIX /${CMAKE_INSTALL_LIBDIR}/pkgconfig /)
string(REGEX REPLACE "/$" "" JSONVALUE_PC_TO_PREFIX "${JSONVALUE_PC_TO_PREFIX}")
# Shared libraries are found at run time through the run path; a static program needs none.
if(BUILD_SHARED_LIBS)
  set(JSONVALUE_PC_RPATH " -Wl,-rpath,\${libdir}")
endif()
configure_file(cmake/jsonvalue.pc.in ${CMAKE_CURRENT_BINARY_DIR}/jsonvalue.pc @ONLY)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/jsonvalue.pc
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)

# Under Debian's name for it, share/doc/jsonvalue/copyright, which the Debian package needs.
install(FILES LICENSE DESTINATION ${CMAKE_INSTALL_DOCDIR} RENAME copyright)
