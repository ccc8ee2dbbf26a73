# For vell's suite only, which builds offline with Debian's compilers:
# Buildroot refuses a distribution's compilers (configured with the sysroot
# /) and finds no sysroot in Debian's layout. dev/buildroot arranges one and
# names it in VELL_DEBIAN_SYSROOT.
check_unusable_toolchain = true
toolchain_find_sysroot = $(VELL_DEBIAN_SYSROOT)
