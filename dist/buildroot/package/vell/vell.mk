################################################################################
#
# vell
#
################################################################################

VELL_VERSION = 0.1.0
# This tree ships inside vell's source, which is built from where it lies.
VELL_SITE = $(BR2_EXTERNAL_VELL_PATH)/../..
VELL_SITE_METHOD = local
# Not the build folders of a developer's checkout.
VELL_OVERRIDE_SRCDIR_RSYNC_EXCLUSIONS = --exclude=/build*
HOST_VELL_OVERRIDE_SRCDIR_RSYNC_EXCLUSIONS = $(VELL_OVERRIDE_SRCDIR_RSYNC_EXCLUSIONS)
VELL_LICENSE = vell
VELL_LICENSE_FILES = dist/debian/copyright

VELL_CONF_OPTS = -DVELL_BUILD_TESTS=OFF -DVELL_WERROR=OFF
ifeq ($(BR2_PACKAGE_VELL_STATIC_LIBSTDCPP),y)
VELL_CONF_OPTS += -DVELL_STATIC_LIBSTDCXX=ON
endif
ifeq ($(BR2_INIT_SYSTEMD),y)
# The unit's user comes from the users table below, not from sysusers.d.
VELL_CONF_OPTS += -DVELL_INIT=systemd -DVELL_SYSUSERS_DIR=
define VELL_USERS
	vell -1 vell -1 * - - - vell time-zone links
endef
else ifeq ($(BR2_INIT_OPENRC),y)
VELL_CONF_OPTS += -DVELL_INIT=openrc
else ifneq ($(BR2_INIT_BUSYBOX)$(BR2_INIT_SYSV),)
# Buildroot's sysvinit runs the same rcS as BusyBox init: S??* only.
VELL_CONF_OPTS += -DVELL_INIT=busybox
else
VELL_CONF_OPTS += -DVELL_INIT=none
endif

# What the device needs: vell and what starts it; no manual pages, no
# vell-try.
VELL_INSTALL_TARGET_OPTS = --component vell

# Once every package is in: the zone tree tzdata installed becomes the
# system data vell manages, and the device's programs read through vell's
# links, the local time being the configured one. The release is the one
# tzdata's source says (TZDATA_VERSION is "custom" for a source of one's own).
define VELL_LAY_OUT_TIME_ZONE_DATA
	$(VELL_DIR)/tools/vell-layout root --release "$$(cat $(TZDATA_DIR)/version)" \
		--zone $(or $(TZDATA_LOCALTIME),Etc/UTC) $(TARGET_DIR)
endef
VELL_TARGET_FINALIZE_HOOKS += VELL_LAY_OUT_TIME_ZONE_DATA

HOST_VELL_CONF_OPTS = -DVELL_BUILD_TESTS=OFF -DVELL_WERROR=OFF -DVELL_INIT=none

# vell-try, and a vell for this host that it runs on the target directory.
define HOST_VELL_INSTALL_CMDS
	$(HOST_MAKE_ENV) $(BR2_CMAKE) --install $(HOST_VELL_BUILDDIR) --component vell
	$(HOST_MAKE_ENV) $(BR2_CMAKE) --install $(HOST_VELL_BUILDDIR) --component vell-try
endef

$(eval $(cmake-package))
$(eval $(host-cmake-package))
