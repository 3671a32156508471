# SPDX-License-Identifier: MIT
# Two Debian packages from the install components: `cpack -G DEB` in a build
# configured with the "package" preset (scripts/build-packages does it all).
set(vorn_debian ${PROJECT_SOURCE_DIR}/dist/debian)

# Debian wants a copyright file and a compressed changelog in each package's
# documentation folder.
set(vorn_changelog ${PROJECT_BINARY_DIR}/dist/changelog.Debian.gz)
add_custom_command(OUTPUT ${vorn_changelog}
  COMMAND sh -ec "gzip -9n <\"$1\" >\"$2\"" sh ${vorn_debian}/changelog ${vorn_changelog}
  DEPENDS ${vorn_debian}/changelog
  VERBATIM)
add_custom_target(debian-changelog ALL DEPENDS ${vorn_changelog})
foreach(vorn_package vorntool:tool vorn-server:server)
  string(REPLACE ":" ";" vorn_package "${vorn_package}")
  list(GET vorn_package 0 vorn_name)
  list(GET vorn_package 1 vorn_component)
  install(FILES ${vorn_debian}/copyright ${vorn_changelog}
          DESTINATION ${CMAKE_INSTALL_DATADIR}/doc/${vorn_name} COMPONENT ${vorn_component})
endforeach()

set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_NAME vorntool)
set(CPACK_PACKAGE_VENDOR "The vorntool authors")
set(CPACK_PACKAGE_VERSION ${PROJECT_VERSION})
set(CPACK_PACKAGING_INSTALL_PREFIX ${CMAKE_INSTALL_PREFIX})
set(CPACK_STRIP_FILES ON)
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_COMPONENTS_ALL tool server)

set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_RELEASE 1)
set(CPACK_DEBIAN_PACKAGE_MAINTAINER "Vorn maintainers <maintainers@vorn.example.org>")
set(CPACK_DEBIAN_PACKAGE_PRIORITY optional)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)

set(CPACK_DEBIAN_TOOL_PACKAGE_NAME vorntool)
set(CPACK_DEBIAN_TOOL_PACKAGE_SECTION utils)
set(CPACK_DEBIAN_TOOL_PACKAGE_SUGGESTS vorn-server)
set(CPACK_COMPONENT_TOOL_DESCRIPTION "collect telephony and baseband logs through the Vorn server
vorntool asks the Vorn baseband manager server over the system bus to
collect telephony logs, telephony logs with a modem core dump, or baseband
logs, and prints where the collection lies. It also exports the systemd
journal of the telephony processes to a text file. Commands are given on
the command line or at an interactive prompt.")

set(CPACK_DEBIAN_SERVER_PACKAGE_NAME vorn-server)
set(CPACK_DEBIAN_SERVER_PACKAGE_SECTION admin)
# What the maintainer scripts call: systemd-sysusers, systemd-tmpfiles and
# dbus-send; the libraries are added from the binaries.
set(CPACK_DEBIAN_SERVER_PACKAGE_DEPENDS
    "dbus, systemd | systemd-standalone-sysusers | systemd-sysusers, systemd | systemd-standalone-tmpfiles | systemd-tmpfiles")
set(CPACK_DEBIAN_SERVER_PACKAGE_SUGGESTS vorntool)
set(CPACK_DEBIAN_SERVER_PACKAGE_CONTROL_EXTRA
    ${vorn_debian}/vorn-server/postinst ${vorn_debian}/vorn-server/prerm ${vorn_debian}/vorn-server/postrm)
set(CPACK_COMPONENT_SERVER_DESCRIPTION "reference Vorn baseband manager server and helper service
vornd owns org.vorn.Manager on the system bus and collects telephony and
baseband logs into the crash reporter's snapshot folder; vorn-helper owns
org.vorn.Helper and reports the newest baseband snapshot. The package
brings their bus policy (root and the group vorn may call them), the
helper's bus activation, hardened systemd units, and the group vorn.")

include(CPack)
