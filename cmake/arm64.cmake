# 64-bit ARM devices.
set(VELL_TRIPLE aarch64-linux-gnu)
set(VELL_DEB_ARCH arm64)
set(CMAKE_SYSTEM_PROCESSOR aarch64)
set(VELL_EMULATOR qemu-aarch64)
include(${CMAKE_CURRENT_LIST_DIR}/cross.cmake)
