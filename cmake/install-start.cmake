# Installs what starts vell at boot, run by `cmake --install` (and so by
# cpack). VELL_INIT in the environment overrides the configured choice, so one
# build serves an image of any init. The files name the binary by the prefix
# of this install, so they are written now; /etc whatever the prefix, where
# every init looks. The caller sets VELL_INIT_CONFIGURED, VELL_SOURCE_DIR,
# VELL_BINARY_DIR, VELL_SBINDIR, VELL_SYSTEMD_UNIT_DIR and VELL_SYSUSERS_DIR.
set(init "${VELL_INIT_CONFIGURED}")
if(NOT "$ENV{VELL_INIT}" STREQUAL "")
  set(init "$ENV{VELL_INIT}")
endif()
set(VELL_SBIN "${CMAKE_INSTALL_PREFIX}/${VELL_SBINDIR}")
set(start "${VELL_BINARY_DIR}/start")
foreach(file vell.service init/sysvinit init/openrc init/busybox)
  get_filename_component(name ${file} NAME)
  configure_file("${VELL_SOURCE_DIR}/dist/${file}.in" "${start}/${name}" @ONLY)
endforeach()
set(data FILE_PERMISSIONS OWNER_READ OWNER_WRITE GROUP_READ WORLD_READ)
set(script FILE_PERMISSIONS OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ
    WORLD_EXECUTE)
if(init STREQUAL "systemd")
  # As Debian ships a service: the unit, and the sysvinit script beside it,
  # which systemd passes over while the unit exists.
  file(INSTALL "${start}/vell.service" DESTINATION "${CMAKE_INSTALL_PREFIX}/${VELL_SYSTEMD_UNIT_DIR}" ${data})
  file(INSTALL "${VELL_SOURCE_DIR}/dist/vell.sysusers" DESTINATION
       "${CMAKE_INSTALL_PREFIX}/${VELL_SYSUSERS_DIR}" RENAME vell.conf ${data})
  file(INSTALL "${start}/sysvinit" DESTINATION /etc/init.d RENAME vell ${script})
elseif(init STREQUAL "sysvinit")
  file(INSTALL "${start}/sysvinit" DESTINATION /etc/init.d RENAME vell ${script})
elseif(init STREQUAL "openrc")
  file(INSTALL "${start}/openrc" DESTINATION /etc/init.d RENAME vell ${script})
elseif(init STREQUAL "busybox")
  file(INSTALL "${start}/busybox" DESTINATION /etc/init.d RENAME S00vell ${script})
else()
  message(FATAL_ERROR "VELL_INIT is systemd, sysvinit, openrc or busybox, not ${init}")
endif()
