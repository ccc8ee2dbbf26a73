# Installs what starts vell at boot, run by `cmake --install` (and so by
# cpack). VELL_INIT in the environment overrides the configured choice, so one
# build serves an image of any init. The files name the binary by the prefix
# of this install (`--prefix` may differ from the configured one), so they are
# written now, and where they go is worked out now too: a relative directory
# lies below the prefix, an absolute one stands as it is, and /etc follows
# GNUInstallDirs' rule (/etc for the prefixes / and /usr, /etc/opt/NAME for
# /opt/NAME, PREFIX/etc otherwise). The caller sets VELL_INIT_CONFIGURED,
# VELL_SOURCE_DIR, VELL_BINARY_DIR, VELL_SBINDIR, VELL_SYSCONFDIR,
# VELL_DATADIR, VELL_DOCDIR, VELL_SYSTEMD_UNIT_DIR and VELL_SYSUSERS_DIR
# (empty: no sysusers.d entry).
set(init "${VELL_INIT_CONFIGURED}")
if(NOT "$ENV{VELL_INIT}" STREQUAL "")
  set(init "$ENV{VELL_INIT}")
endif()
if(NOT init MATCHES "^(systemd|sysvinit|openrc|busybox|none|debian)$")
  message(FATAL_ERROR "VELL_INIT is systemd, sysvinit, openrc, busybox, none or debian, not ${init}")
endif()
string(REGEX REPLACE "(.)/+$" "\\1" prefix "${CMAKE_INSTALL_PREFIX}")
function(under_prefix out dir)
  if(IS_ABSOLUTE "${dir}")
    set(${out} "${dir}" PARENT_SCOPE)
  else()
    set(${out} "${prefix}/${dir}" PARENT_SCOPE)
  endif()
endfunction()
under_prefix(VELL_SBIN "${VELL_SBINDIR}")
if(IS_ABSOLUTE "${VELL_SYSCONFDIR}")
  set(etc "${VELL_SYSCONFDIR}")
elseif(prefix STREQUAL "/" OR prefix STREQUAL "/usr")
  set(etc "/${VELL_SYSCONFDIR}")
elseif(prefix MATCHES "^/opt/[^/]+$")
  set(etc "/${VELL_SYSCONFDIR}${prefix}")
else()
  set(etc "${prefix}/${VELL_SYSCONFDIR}")
endif()

set(start "${VELL_BINARY_DIR}/start")
foreach(file vell.service init/sysvinit init/openrc init/busybox)
  get_filename_component(name ${file} NAME)
  configure_file("${VELL_SOURCE_DIR}/dist/${file}.in" "${start}/${name}" @ONLY)
endforeach()
set(data FILE_PERMISSIONS OWNER_READ OWNER_WRITE GROUP_READ WORLD_READ)
set(script FILE_PERMISSIONS OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ
    WORLD_EXECUTE)
if(init STREQUAL "systemd" OR init STREQUAL "debian")
  under_prefix(unit_dir "${VELL_SYSTEMD_UNIT_DIR}")
  file(INSTALL "${start}/vell.service" DESTINATION "${unit_dir}" ${data})
  if(NOT VELL_SYSUSERS_DIR STREQUAL "")
    under_prefix(sysusers_dir "${VELL_SYSUSERS_DIR}")
    file(INSTALL "${VELL_SOURCE_DIR}/dist/vell.sysusers" DESTINATION "${sysusers_dir}" RENAME vell.conf ${data})
  endif()
endif()
if(init STREQUAL "debian" OR init STREQUAL "sysvinit")
  # A Debian package ships the sysvinit script beside the unit, which systemd
  # passes over while the unit exists; the package's scripts enable both.
  file(INSTALL "${start}/sysvinit" DESTINATION "${etc}/init.d" RENAME vell ${script})
endif()
if(init STREQUAL "debian")
  under_prefix(doc_dir "${VELL_DOCDIR}")
  under_prefix(data_dir "${VELL_DATADIR}")
  file(INSTALL "${VELL_BINARY_DIR}/changelog.gz" "${VELL_SOURCE_DIR}/dist/debian/copyright"
       DESTINATION "${doc_dir}" ${data})
  file(INSTALL "${VELL_SOURCE_DIR}/dist/debian/lintian-overrides" DESTINATION "${data_dir}/lintian/overrides"
       RENAME vell ${data})
elseif(init STREQUAL "openrc")
  file(INSTALL "${start}/openrc" DESTINATION "${etc}/init.d" RENAME vell ${script})
elseif(init STREQUAL "busybox")
  file(INSTALL "${start}/busybox" DESTINATION "${etc}/init.d" RENAME S00vell ${script})
endif()
