# Run by cpack (CPACK_INSTALL_SCRIPTS) in place of its own staging step, which would first
# build every target of the tree: installs the tree as built, with its install rules, under
# the package's prefix. cpack sets DESTDIR to its staging directory.
set(CMAKE_INSTALL_PREFIX "${CPACK_PACKAGING_INSTALL_PREFIX}")
include("${MESK_PACKAGE_BUILD_DIR}/cmake_install.cmake")
