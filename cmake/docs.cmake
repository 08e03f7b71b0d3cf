# `cmake --build BUILD --target docs` builds the API reference (HTML) from the comments in
# include/json/ and the generated json/version.hpp, with README.md as its main page and the
# guides in docs/ as its pages; any Doxygen warning fails the build.
find_package(Doxygen)
if(DOXYGEN_FOUND)
  set(DOXYGEN_PROJECT_NAME jsonvalue)
  set(DOXYGEN_PROJECT_NUMBER ${PROJECT_VERSION})
  set(DOXYGEN_PROJECT_BRIEF "${PROJECT_DESCRIPTION}")
  set(DOXYGEN_OUTPUT_DIRECTORY ${CMAKE_CURRENT_BINARY_DIR}/docs)
  set(DOXYGEN_USE_MDFILE_AS_MAINPAGE ${CMAKE_CURRENT_SOURCE_DIR}/README.md)
  set(DOXYGEN_EXCLUDE_SYMBOLS "json::detail::*" detail)
  set(DOXYGEN_EXCLUDE ${CMAKE_CURRENT_SOURCE_DIR}/include/json/detail)
  set(DOXYGEN_WARN_IF_UNDOCUMENTED YES)
  set(DOXYGEN_WARN_NO_PARAMDOC NO)
  set(DOXYGEN_WARN_AS_ERROR FAIL_ON_WARNINGS)
  set(DOXYGEN_GENERATE_LATEX NO)
  set(DOXYGEN_QUIET YES)
  set(DOXYGEN_MACRO_EXPANSION YES)
  set(DOXYGEN_PREDEFINED "JSONVALUE_API=")
  set(DOXYGEN_STRIP_FROM_PATH ${CMAKE_CURRENT_SOURCE_DIR} ${CMAKE_CURRENT_BINARY_DIR})
  # The guides, listed so that the target is rebuilt when one changes or is added.
  file(GLOB guides CONFIGURE_DEPENDS ${CMAKE_CURRENT_SOURCE_DIR}/docs/*.md)
  # Doxygen looks for the target of a Markdown link in its working directory before the linking
  # file's own: run in docs/, so that a guide's link to README.md is docs/README.md, not the
  # front page (the front page's links into docs/ are found beside it).
  doxygen_add_docs(docs ${CMAKE_CURRENT_SOURCE_DIR}/README.md ${guides}
                   ${CMAKE_CURRENT_SOURCE_DIR}/include/json
                   ${CMAKE_CURRENT_BINARY_DIR}/include/json/version.hpp
                   WORKING_DIRECTORY ${CMAKE_CURRENT_SOURCE_DIR}/docs
                   COMMENT "API reference in ${CMAKE_CURRENT_BINARY_DIR}/docs/html")
  # The reference goes with the package, under share/doc/jsonvalue/html, when the docs target
  # was built before the install (scripts/test.sh builds it before the Debian package). It is
  # not part of `all`, which stays quick, so an install without it leaves it out: OPTIONAL.
  if(JSONVALUE_INSTALL)
    install(DIRECTORY ${CMAKE_CURRENT_BINARY_DIR}/docs/html/ DESTINATION ${CMAKE_INSTALL_DOCDIR}/html
            OPTIONAL)
  endif()
endif()
