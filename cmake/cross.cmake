# What the ARM toolchain files share: clang for VELL_TRIPLE, and libc++ for
# that architecture unpacked from Debian's packages into the build folder
# (Debian cannot install it beside the host's; the headers are the host's,
# the same for every architecture). Everything links statically, so the test
# binary, like vell, runs under qemu-user without a loader.
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_C_COMPILER clang)
set(CMAKE_CXX_COMPILER clang++)
set(CMAKE_C_COMPILER_TARGET ${VELL_TRIPLE})
set(CMAKE_CXX_COMPILER_TARGET ${VELL_TRIPLE})

get_filename_component(libcxx_root "${CMAKE_CURRENT_LIST_DIR}/../build/libcxx-${VELL_DEB_ARCH}" ABSOLUTE)
set(libcxx "${libcxx_root}/usr/lib/llvm-14")
if(NOT EXISTS "${libcxx}/lib/libc++.a")
  execute_process(COMMAND "${CMAKE_CURRENT_LIST_DIR}/../dev/fetch-libcxx" ${VELL_DEB_ARCH} "${libcxx_root}"
                  RESULT_VARIABLE failed)
  if(failed)
    message(FATAL_ERROR "libc++ for ${VELL_DEB_ARCH} could not be fetched")
  endif()
endif()
set(CMAKE_EXE_LINKER_FLAGS_INIT "-static -L${libcxx}/lib")
# clang names the host's libunwind.a whatever the target.
set(VELL_LIBUNWIND "${libcxx}/lib/libunwind.a")
