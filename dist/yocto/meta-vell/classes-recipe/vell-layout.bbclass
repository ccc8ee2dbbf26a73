# For images: vell, and the time-zone data it manages. tzdata's zone tree
# becomes the system data, /usr/share/zoneinfo.default, with the release its
# tzdata.zi names; the image's programs read through vell's links; and the
# local time is the zone tzdata linked /etc/localtime to (DEFAULT_TIMEZONE).
# In local.conf: IMAGE_CLASSES += "vell-layout"; or inherit it in an image.
IMAGE_INSTALL:append = " vell tzdata"
do_rootfs[depends] += "vell-native:do_populate_sysroot"
ROOTFS_POSTPROCESS_COMMAND += "vell_layout_rootfs"

vell_layout_rootfs() {
	${STAGING_SBINDIR_NATIVE}/vell-layout root ${IMAGE_ROOTFS}
}
