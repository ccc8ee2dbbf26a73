# 32-bit ARM devices with hardware floating point.
set(VELL_TRIPLE arm-linux-gnueabihf)
set(VELL_DEB_ARCH armhf)
set(CMAKE_SYSTEM_PROCESSOR armv7l)
set(VELL_EMULATOR qemu-arm)
include(${CMAKE_CURRENT_LIST_DIR}/cross.cmake)
