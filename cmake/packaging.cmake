# Debian packages through CPack: libtessaline0 (the shared object) and
# libtessaline-dev (headers, link, CMake package, pkg-config file).
set(CPACK_PACKAGE_NAME tessaline)
set(CPACK_PACKAGE_VENDOR "Tessaline developers")
set(CPACK_PACKAGE_CONTACT "Tessaline developers <tessaline@users.noreply.example>")
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY
  "Foundation library: configuration files, paths and files, text encryption, threads")
set(CPACK_PACKAGE_VERSION ${PROJECT_VERSION})
set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_COMPONENTS_ALL runtime development)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)

set(CPACK_DEBIAN_RUNTIME_PACKAGE_NAME libtessaline0)
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SECTION libs)
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SHLIBDEPS ON)
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS ON)
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS_POLICY ">=")

set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_NAME libtessaline-dev)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SECTION libdevel)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_DEPENDS "libtessaline0 (= ${PROJECT_VERSION})")

# The symbols file comes from the ABI lists that the abi_exports test holds
# the library to, so the package and the test can never disagree.
file(GLOB TESSALINE_ABI_LISTS ${PROJECT_SOURCE_DIR}/tests/abi/*.symbols)
set(TESSALINE_SYMBOLS_FILE ${PROJECT_BINARY_DIR}/debian/symbols)
set(symbols "libtessaline.so.0 libtessaline0 #MINVER#\n")
foreach(list ${TESSALINE_ABI_LISTS})
  file(STRINGS ${list} names REGEX "^[^#]")
  foreach(name IN LISTS names)
    string(APPEND symbols " (c++)\"${name}@TESSALINE_0\" ${PROJECT_VERSION}\n")
  endforeach()
endforeach()
file(WRITE ${TESSALINE_SYMBOLS_FILE} "${symbols}")
set(CPACK_DEBIAN_RUNTIME_PACKAGE_CONTROL_EXTRA ${TESSALINE_SYMBOLS_FILE})

include(CPack)
