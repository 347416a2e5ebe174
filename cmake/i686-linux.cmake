# 32-bit x86 Linux, built on an x86-64 machine with the multilib compilers
# (Debian: g++-multilib; GoogleTest from the googletest source package).
#   cmake -S . -B build-m32 -G Ninja --toolchain cmake/i686-linux.cmake \
#         -DTESSALINE_GTEST_FROM_SOURCE=/usr/src/googletest
# A kernel without 32-bit support (no IA32 emulation, as in some virtual
# machines) cannot start the test programs; they then run under qemu-i386
# (Debian: qemu-user), which CTest and test discovery use as the emulator.
set(CMAKE_SYSTEM_PROCESSOR i686)
set(CMAKE_LIBRARY_ARCHITECTURE i386-linux-gnu)

set(CMAKE_C_FLAGS_INIT -m32)
set(CMAKE_CXX_FLAGS_INIT -m32)
set(CMAKE_EXE_LINKER_FLAGS_INIT -m32)
set(CMAKE_SHARED_LINKER_FLAGS_INIT -m32)
set(CMAKE_MODULE_LINKER_FLAGS_INIT -m32)

# The 32-bit dynamic loader is itself a program: if the kernel runs it, it
# runs the tests too.
if(NOT DEFINED CMAKE_CROSSCOMPILING_EMULATOR)
  execute_process(COMMAND /lib/ld-linux.so.2 --version
    RESULT_VARIABLE tessaline_m32_native OUTPUT_QUIET ERROR_QUIET)
  if(NOT tessaline_m32_native EQUAL 0)
    find_program(TESSALINE_QEMU_I386 qemu-i386 REQUIRED)
    set(CMAKE_CROSSCOMPILING_EMULATOR ${TESSALINE_QEMU_I386})
  endif()
endif()
