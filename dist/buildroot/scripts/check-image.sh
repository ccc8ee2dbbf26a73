#!/bin/sh
# Runs vell twice in vell-try's sandbox, with a vell built for this host from
# the same source, and fails the build when the image's time-zone links would
# not be usable: as a post-build script (BR2_ROOTFS_POST_BUILD_SCRIPT) on the
# target directory, as a post-image script (BR2_ROOTFS_POST_IMAGE_SCRIPT) on
# the rootfs.tar the build emits. Needs the host package
# (BR2_PACKAGE_HOST_VELL), and user namespaces when the build does not run as
# root.
set -e
image=$1
if [ "$image" = "${BINARIES_DIR:-}" ]; then
	image=$BINARIES_DIR/rootfs.tar
fi
exec "${HOST_DIR}/sbin/vell-try" --vell "${HOST_DIR}/sbin/vell" --starts 2 "$image"
