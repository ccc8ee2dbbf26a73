#!/bin/sh
# A post-build script (BR2_ROOTFS_POST_BUILD_SCRIPT): runs vell twice on the
# target directory in vell-try's sandbox, with a vell built for this host
# from the same source, and fails the build when the image's time-zone links
# would not be usable. Needs the host package (BR2_PACKAGE_HOST_VELL), and
# user namespaces when the build does not run as root.
set -e
exec "${HOST_DIR}/sbin/vell-try" --vell "${HOST_DIR}/sbin/vell" --starts 2 "$1"
