# SPDX-License-Identifier: MIT
# What `cmake --install` puts where, in two components that become the two
# packages: "tool" (vorntool, its manual pages, completions and example) and
# "server" (the daemons and what the bus and systemd need to run them).
# Only the shipped daemons are installed, never builds made for the tests.

# The systemd folders are not multiarch: lib/, not CMAKE_INSTALL_LIBDIR.
set(VORN_SYSTEMD_UNITDIR "lib/systemd/system" CACHE STRING "systemd units, relative to the prefix")
set(VORN_SYSUSERSDIR "lib/sysusers.d" CACHE STRING "sysusers.d entries, relative to the prefix")
set(VORN_TMPFILESDIR "lib/tmpfiles.d" CACHE STRING "tmpfiles.d entries, relative to the prefix")
set(VORN_LIBEXECDIR "${CMAKE_INSTALL_FULL_LIBEXECDIR}/vorn")
set(CMAKE_INSTALL_DEFAULT_DIRECTORY_PERMISSIONS
    OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)

set(vorn_dist ${PROJECT_SOURCE_DIR}/dist)
set(vorn_staged ${PROJECT_BINARY_DIR}/dist)

install(TARGETS vorntool RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT tool)
install(TARGETS vornd vorn-helper RUNTIME DESTINATION ${CMAKE_INSTALL_LIBEXECDIR}/vorn COMPONENT server)

# Bus policy and activation: the helper is started on demand; vornd is not,
# because a server that is down is a state the tool reports.
install(FILES ${PROJECT_SOURCE_DIR}/server/dbus/org.vorn.Manager.conf
              ${PROJECT_SOURCE_DIR}/server/dbus/org.vorn.Helper.conf
        DESTINATION ${CMAKE_INSTALL_DATADIR}/dbus-1/system.d COMPONENT server)
configure_file(${vorn_dist}/dbus/org.vorn.Helper.service.in ${vorn_staged}/org.vorn.Helper.service @ONLY)
install(FILES ${vorn_staged}/org.vorn.Helper.service
        DESTINATION ${CMAKE_INSTALL_DATADIR}/dbus-1/system-services COMPONENT server)

# Both units share one set of sandboxing settings.
file(READ ${vorn_dist}/systemd/sandboxing.conf VORN_UNIT_SANDBOXING)
string(STRIP "${VORN_UNIT_SANDBOXING}" VORN_UNIT_SANDBOXING)
foreach(unit vornd vorn-helper)
  configure_file(${vorn_dist}/systemd/${unit}.service.in ${vorn_staged}/${unit}.service @ONLY)
  install(FILES ${vorn_staged}/${unit}.service DESTINATION ${VORN_SYSTEMD_UNITDIR} COMPONENT server)
endforeach()
install(FILES ${vorn_dist}/sysusers/vorn.conf DESTINATION ${VORN_SYSUSERSDIR} COMPONENT server)
install(FILES ${vorn_dist}/tmpfiles/vorn.conf DESTINATION ${VORN_TMPFILESDIR} COMPONENT server)

install(FILES ${vorn_dist}/completion/vorntool.bash DESTINATION ${CMAKE_INSTALL_DATADIR}/bash-completion/completions
        RENAME vorntool COMPONENT tool)
install(FILES ${vorn_dist}/completion/_vorntool DESTINATION ${CMAKE_INSTALL_DATADIR}/zsh/vendor-completions
        COMPONENT tool)
install(FILES ${vorn_dist}/examples/device.conf DESTINATION ${CMAKE_INSTALL_DATADIR}/doc/vorntool/examples
        COMPONENT tool)

# Manual pages: scdoc sources, rendered and compressed at build time.
if(VORN_BUILD_MAN)
  find_program(SCDOC scdoc)
  if(NOT SCDOC)
    message(FATAL_ERROR "scdoc builds the manual pages: run scripts/install-deps, or configure with -DVORN_BUILD_MAN=OFF")
  endif()
  set(vorn_pages)
  file(MAKE_DIRECTORY ${PROJECT_BINARY_DIR}/doc/man)
  foreach(vorn_page vorntool.1:tool vorn-device.conf.5:tool vornd.8:server vorn-helper.8:server)
    string(REPLACE ":" ";" vorn_page "${vorn_page}")
    list(GET vorn_page 0 vorn_name)
    list(GET vorn_page 1 vorn_component)
    string(REGEX REPLACE ".*\\." "" vorn_section ${vorn_name})
    set(vorn_source ${PROJECT_SOURCE_DIR}/doc/man/${vorn_name}.scd)
    set(vorn_output ${PROJECT_BINARY_DIR}/doc/man/${vorn_name}.gz)
    add_custom_command(OUTPUT ${vorn_output}
      COMMAND sh -ec "${SCDOC} <\"$1\" >\"$2.page\"; gzip -9n <\"$2.page\" >\"$2\"; rm \"$2.page\""
              sh ${vorn_source} ${vorn_output}
      DEPENDS ${vorn_source}
      COMMENT "Rendering the manual page ${vorn_name}"
      VERBATIM)
    list(APPEND vorn_pages ${vorn_output})
    install(FILES ${vorn_output} DESTINATION ${CMAKE_INSTALL_MANDIR}/man${vorn_section} COMPONENT ${vorn_component})
  endforeach()
  add_custom_target(man ALL DEPENDS ${vorn_pages})
endif()
