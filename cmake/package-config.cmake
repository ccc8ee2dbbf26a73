# Read by cpack: the Debian package ships the unit, its user's sysusers.d
# entry, the sysvinit script beside them, and Debian's own files, whatever
# VELL_INIT the build was configured with.
set(ENV{VELL_INIT} debian)
