# Debian packages through CPack: libtessaline0 (the shared object),
# libtessaline-dev (headers, link, CMake package, pkg-config file) and
# tessaline-tools (tessaline-config). They pass lintian without errors.
set(CPACK_PACKAGE_NAME tessaline)
set(CPACK_PACKAGE_VENDOR "Tessaline developers")
set(CPACK_PACKAGE_CONTACT "Tessaline developers <tessaline@users.noreply.example>")
set(CPACK_PACKAGE_VERSION ${PROJECT_VERSION})
set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_COMPONENTS_ALL runtime development)
if(TESSALINE_BUILD_TOOLS)
  list(APPEND CPACK_COMPONENTS_ALL tools)
endif()
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_STRIP_FILES ON)

# Each description's first line is the package's synopsis. No common
# CPACK_PACKAGE_DESCRIPTION_SUMMARY: CPack would put it in front of all three.
set(CPACK_DEBIAN_RUNTIME_PACKAGE_NAME libtessaline0)
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SECTION libs)
set(CPACK_DEBIAN_RUNTIME_DESCRIPTION "foundation library for configuration, files, encryption and threads
Tessaline is a C++ library that host programs link and call directly. It
reads and rewrites sectioned configuration files with their comments and
layout intact, takes paths and URLs apart, walks, copies and removes file
trees, encrypts values to printable text with Twofish, and offers thread,
mutex, condition variable and semaphore classes over POSIX threads.

This package holds the shared library.")
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SHLIBDEPS ON)
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS ON)
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS_POLICY ">=")

set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_NAME libtessaline-dev)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SECTION libdevel)
set(CPACK_DEBIAN_DEVELOPMENT_DESCRIPTION "development files of the Tessaline foundation library
Tessaline is a C++ library for configuration files, paths and file trees,
text encryption, threads and small string and time helpers.

This package holds the headers, the link to the shared library, the CMake
package (find_package(Tessaline)) and the pkg-config file.")
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_DEPENDS "libtessaline0 (= ${PROJECT_VERSION})")

set(CPACK_DEBIAN_TOOLS_PACKAGE_NAME tessaline-tools)
set(CPACK_DEBIAN_TOOLS_PACKAGE_SECTION admin)
set(CPACK_DEBIAN_TOOLS_DESCRIPTION "command-line tool for Tessaline configuration files
tessaline-config reads and changes the configuration files of programs built
on the Tessaline library exactly as they do: the same lookups, the same
merging writer that keeps comments and layout and replaces the file safely,
and the same encrypted value form. It gets, sets and deletes keys, sections
and list items, lists and dumps files as INI, JSON, shell or grep-able lines,
merges files, and encrypts and decrypts values.")
set(CPACK_DEBIAN_TOOLS_PACKAGE_SHLIBDEPS ON)
# dpkg-shlibdeps finds the library in the build tree, where no package
# declares it; the dependency on it is stated here instead.
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS_PRIVATE_DIRS ${PROJECT_BINARY_DIR}/src)
set(CPACK_DEBIAN_TOOLS_PACKAGE_DEPENDS "libtessaline0 (= ${PROJECT_VERSION})")

# Every package carries its copyright file and changelog, as Debian wants.
string(TIMESTAMP TESSALINE_CHANGELOG_DATE "%a, %d %b %Y 00:00:00 +0000" UTC)
configure_file(${PROJECT_SOURCE_DIR}/cmake/debian/changelog.in ${PROJECT_BINARY_DIR}/debian/changelog @ONLY)
set(TESSALINE_CHANGELOG ${PROJECT_BINARY_DIR}/debian/changelog.gz)
add_custom_command(OUTPUT ${TESSALINE_CHANGELOG}
  COMMAND gzip -9n -c ${PROJECT_BINARY_DIR}/debian/changelog > ${TESSALINE_CHANGELOG}
  DEPENDS ${PROJECT_BINARY_DIR}/debian/changelog
  VERBATIM)
foreach(component IN LISTS CPACK_COMPONENTS_ALL)
  string(TOUPPER ${component} upper)
  install(FILES ${PROJECT_SOURCE_DIR}/cmake/debian/copyright ${TESSALINE_CHANGELOG}
    DESTINATION ${CMAKE_INSTALL_DATAROOTDIR}/doc/${CPACK_DEBIAN_${upper}_PACKAGE_NAME}
    COMPONENT ${component})
endforeach()

# The symbols file comes from the ABI lists that the abi_exports test holds
# the library to, so the package and the test can never disagree.
file(GLOB TESSALINE_ABI_LISTS ${PROJECT_SOURCE_DIR}/tests/abi/*.symbols)
set(TESSALINE_SYMBOLS_FILE ${PROJECT_BINARY_DIR}/debian/symbols)
add_custom_command(OUTPUT ${TESSALINE_SYMBOLS_FILE}
  COMMAND ${PROJECT_SOURCE_DIR}/cmake/debian_symbols.sh $<TARGET_FILE:tessaline> ${PROJECT_VERSION}
          ${TESSALINE_SYMBOLS_FILE} ${TESSALINE_ABI_LISTS}
  DEPENDS tessaline ${PROJECT_SOURCE_DIR}/cmake/debian_symbols.sh ${TESSALINE_ABI_LISTS}
  VERBATIM)
add_custom_target(tessaline_debian_files ALL DEPENDS ${TESSALINE_SYMBOLS_FILE} ${TESSALINE_CHANGELOG})
set(CPACK_DEBIAN_RUNTIME_PACKAGE_CONTROL_EXTRA
  ${TESSALINE_SYMBOLS_FILE} ${PROJECT_SOURCE_DIR}/cmake/debian/triggers)

include(CPack)
