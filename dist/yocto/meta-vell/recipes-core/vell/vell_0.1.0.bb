SUMMARY = "Points the time-zone links at usable data at every boot"
DESCRIPTION = "vell runs once at every boot and points the links under \
/var/db/timezone back at the system partition when the current data is \
missing, broken, incompatible or older, or forward to the newest downloaded \
update when it is compatible and newer; then it repairs the local-time link. \
vell-try runs it on an image in a sandbox and says whether its links would \
be usable."
SECTION = "admin"
LICENSE = "Proprietary"
NO_GENERIC_LICENSE[Proprietary] = "dist/debian/copyright"
LIC_FILES_CHKSUM = "file://dist/debian/copyright;md5=0b56f7aac026621b227c0cd3dba515e5"

# Built from the source tree that holds this layer (VELL_SOURCE_DIR, set in
# conf/layer.conf).
inherit cmake externalsrc
EXTERNALSRC = "${VELL_SOURCE_DIR}"
EXTERNALSRC_BUILD = "${WORKDIR}/build"

# What starts vell: vell.service with systemd, run as the user vell; with
# sysvinit, /etc/init.d/vell in runlevel S after the local mounts
# (mountall.sh 03, checkroot.sh's remount 05, read-only-rootfs-hook.sh 29)
# and before bootmisc.sh (36), which runs hwclock.sh, the first reader of
# time-zone data.
VELL_INIT = "${@bb.utils.contains('DISTRO_FEATURES', 'systemd', 'systemd', \
              bb.utils.contains('DISTRO_FEATURES', 'sysvinit', 'sysvinit', 'none', d), d)}"
VELL_INIT:class-native = "none"
# libstdc++ and libgcc linked into vell, the C library still shared: a start
# need not load libstdc++.so, most of what it costs; the binary grows by
# about half a megabyte.
PACKAGECONFIG ??= "static-libstdcxx"
PACKAGECONFIG:class-native ??= ""
PACKAGECONFIG[static-libstdcxx] = "-DVELL_STATIC_LIBSTDCXX=ON,-DVELL_STATIC_LIBSTDCXX=OFF"
EXTRA_OECMAKE = "-DVELL_BUILD_TESTS=OFF -DVELL_WERROR=OFF -DVELL_INIT=${VELL_INIT} \
                 -DVELL_SYSTEMD_UNIT_DIR=${systemd_system_unitdir} -DVELL_SYSUSERS_DIR="

inherit systemd update-rc.d
SYSTEMD_SERVICE:${PN} = "vell.service"
INITSCRIPT_NAME = "vell"
INITSCRIPT_PARAMS = "start 30 S ."

inherit ${@bb.utils.contains('DISTRO_FEATURES', 'systemd', 'useradd', '', d)}
USERADD_PACKAGES = "${PN}"
USERADD_PARAM:${PN} = "--system --no-create-home --home-dir / --shell /sbin/nologin --user-group vell"

# vell-try and vell-layout in a package of their own; as vell-native, they
# and a vell for the build host, to run on an image's root before it ships.
PACKAGES =+ "${PN}-try"
FILES:${PN}-try = "${sbindir}/vell-try ${sbindir}/vell-layout"
RRECOMMENDS:${PN}-try = "${PN}"
BBCLASSEXTEND = "native"
