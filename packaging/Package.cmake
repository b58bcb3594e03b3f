# The Debian package, built by scripts/package with CPack from the build tree that
# scripts/ensure-built keeps: what `cmake --install` puts in place, under /usr, stripped,
# with the debug information in a -dbgsym package, Depends computed by dpkg-shlibdeps.

# The copyright file and the changelog that every Debian package carries. The changelog's
# newest entry must name the version that CMake builds.
file(STRINGS ${CMAKE_CURRENT_LIST_DIR}/changelog mesk_changelog_head LIMIT_COUNT 1)
if(NOT mesk_changelog_head MATCHES "^mesk \\(${PROJECT_VERSION}\\) ")
  message(FATAL_ERROR "packaging/changelog has no entry for version ${PROJECT_VERSION} at its top")
endif()
set(mesk_changelog_gz ${CMAKE_BINARY_DIR}/packaging/changelog.gz)
add_custom_command(
  OUTPUT ${mesk_changelog_gz}
  COMMAND ${CMAKE_COMMAND} -E make_directory ${CMAKE_BINARY_DIR}/packaging
  COMMAND sh -c "gzip -9nc \"$1\" > \"$2\"" sh ${CMAKE_CURRENT_LIST_DIR}/changelog
          ${mesk_changelog_gz}
  DEPENDS ${CMAKE_CURRENT_LIST_DIR}/changelog
  VERBATIM)
add_custom_target(mesk_changelog ALL DEPENDS ${mesk_changelog_gz})
add_dependencies(installables mesk_changelog)
mesk_installable(FILES ${mesk_changelog_gz})
install(FILES ${CMAKE_CURRENT_LIST_DIR}/copyright ${mesk_changelog_gz}
        DESTINATION ${CMAKE_INSTALL_DOCDIR})

# The manual pages, compressed as Debian installs them.
foreach(page autocli hostsim autocli-mesk)
  set(gz ${CMAKE_BINARY_DIR}/man/${page}.1.gz)
  add_custom_command(
    OUTPUT ${gz}
    COMMAND ${CMAKE_COMMAND} -E make_directory ${CMAKE_BINARY_DIR}/man
    COMMAND sh -c "gzip -9nc \"$1\" > \"$2\"" sh ${CMAKE_SOURCE_DIR}/docs/man/${page}.1 ${gz}
    DEPENDS ${CMAKE_SOURCE_DIR}/docs/man/${page}.1
    VERBATIM)
  list(APPEND mesk_man_pages ${gz})
endforeach()
add_custom_target(mesk_man_pages ALL DEPENDS ${mesk_man_pages})
add_dependencies(installables mesk_man_pages)
mesk_installable(FILES ${mesk_man_pages})
install(FILES ${mesk_man_pages} DESTINATION ${CMAKE_INSTALL_MANDIR}/man1)

set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_NAME mesk)
set(CPACK_PACKAGE_VERSION ${PROJECT_VERSION})
set(CPACK_PACKAGE_VENDOR "Mesk Team")
set(CPACK_PACKAGE_CONTACT "Mesk Team <team@mesk.example.org>")
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY
    "storage cluster commands for the host's command-line management tool")
set(CPACK_PACKAGE_DESCRIPTION "The mesk plug-in of autocli, with which an administrator inspects and
configures the host's part in a Mesk storage cluster, together with autocli,
the library of a simulated host and hostsim, the simulated host's own tool.
.
The simulated host lives in /var/lib/hostsim; purging the package removes it.")
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_SECTION admin)
set(CPACK_DEBIAN_PACKAGE_PRIORITY optional)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
# autocli and hostsim name their platform library as $ORIGIN/../lib/<triplet>/mesk/lib....so.0
# (see mesk_link_by_path), which dpkg-shlibdeps takes literally, as a path below each directory
# it searches. Below this one, "$ORIGIN" leads to the programs' directory of the build tree,
# which is laid out as the installed tree, so that it finds the libraries there.
set(mesk_shlibdeps_dir ${CMAKE_BINARY_DIR}/packaging/shlibdeps)
file(MAKE_DIRECTORY ${mesk_shlibdeps_dir})
file(CREATE_LINK ${CMAKE_BINARY_DIR}/platform/autocli "${mesk_shlibdeps_dir}/$ORIGIN" SYMBOLIC)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS_PRIVATE_DIRS ${mesk_shlibdeps_dir})
set(CPACK_DEBIAN_PACKAGE_RECOMMENDS bash-completion)
set(CPACK_DEBIAN_DEBUGINFO_PACKAGE ON)
set(CPACK_DEBIAN_PACKAGE_CONTROL_EXTRA ${CMAKE_CURRENT_LIST_DIR}/postrm)
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)
set(CPACK_THREADS 0)
include(CPack)
