# `cmake --build BUILD --target docs` builds the API reference (HTML) from the comments in
# include/json/ and the generated json/version.hpp; any Doxygen warning fails the build.
find_package(Doxygen)
if(DOXYGEN_FOUND)
  set(DOXYGEN_PROJECT_NAME jsonvalue)
  set(DOXYGEN_PROJECT_BRIEF "${PROJECT_DESCRIPTION}")
  set(DOXYGEN_OUTPUT_DIRECTORY ${CMAKE_CURRENT_BINARY_DIR}/docs)
  set(DOXYGEN_EXCLUDE_SYMBOLS "json::detail::*" detail)
  set(DOXYGEN_EXCLUDE ${CMAKE_CURRENT_SOURCE_DIR}/include/json/detail)
  set(DOXYGEN_WARN_IF_UNDOCUMENTED YES)
  set(DOXYGEN_WARN_NO_PARAMDOC NO)
  set(DOXYGEN_WARN_AS_ERROR FAIL_ON_WARNINGS)
  set(DOXYGEN_GENERATE_LATEX NO)
  set(DOXYGEN_QUIET YES)
  set(DOXYGEN_MACRO_EXPANSION YES)
  set(DOXYGEN_PREDEFINED "JSONVALUE_API=")
  doxygen_add_docs(docs ${CMAKE_CURRENT_SOURCE_DIR}/include/json
                   ${CMAKE_CURRENT_BINARY_DIR}/include/json/version.hpp
                   COMMENT "API reference in ${CMAKE_CURRENT_BINARY_DIR}/docs/html")
endif()
