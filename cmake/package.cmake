# `cpack -G DEB` in a build tree makes jsonvalue_<version>_<arch>.deb, installing into /usr.
# Run-time dependencies come from dpkg-shlibdeps; the public headers need Boost's headers.
set(CPACK_PACKAGE_NAME jsonvalue)
set(CPACK_PACKAGE_VERSION ${PROJECT_VERSION})
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY "${PROJECT_DESCRIPTION}")
set(CPACK_PACKAGE_DESCRIPTION "A C++17 JSON value model on Boost.Variant, builders, a writer,
a strict RFC 8259 parser and the jsonfmt formatter.

Licence: Boost Software License 1.0.")
set(CPACK_RESOURCE_FILE_LICENSE ${PROJECT_SOURCE_DIR}/LICENSE)
set(CPACK_PACKAGE_CONTACT "jsonvalue maintainers <maintainers@jsonvalue.invalid>")
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_SECTION libdevel)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
set(CPACK_DEBIAN_PACKAGE_DEPENDS "libboost1.81-dev")
include(CPack)
