# SPDX-License-Identifier: Apache-2.0
# Toolchain of the device: ARMv8-A in AArch32 state with NEON, tuned for the Cortex-A35. Debian's cross
# compiler, with the libraries that scripts/make-sysroot.sh has unpacked; what is built runs on this machine
# under qemu-arm.

set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR armv8)

# A cache variable of the first run only; passed on to the nested ones, which try the compiler.
get_filename_component(project_folder "${CMAKE_CURRENT_LIST_DIR}" DIRECTORY)
set(QZ_SYSROOT "${project_folder}/build/sysroot-armhf" CACHE PATH "Libraries of the processor")
list(APPEND CMAKE_TRY_COMPILE_PLATFORM_VARIABLES QZ_SYSROOT)
if(NOT EXISTS "${QZ_SYSROOT}/packages")
  message(FATAL_ERROR "${QZ_SYSROOT} is missing or not complete: run scripts/make-sysroot.sh \"${QZ_SYSROOT}\"")
endif()
set(CMAKE_SYSROOT ${QZ_SYSROOT})

set(CMAKE_C_COMPILER arm-linux-gnueabihf-gcc)
set(CMAKE_CXX_COMPILER arm-linux-gnueabihf-g++)
set(processor "-mcpu=cortex-a35 -mfpu=neon-fp-armv8 -mfloat-abi=hard")
set(CMAKE_C_FLAGS_INIT "${processor}")
set(CMAKE_CXX_FLAGS_INIT "${processor}")

# Programs are this machine's, everything else is the device's.
set(CMAKE_LIBRARY_ARCHITECTURE arm-linux-gnueabihf)
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)

set(CMAKE_CROSSCOMPILING_EMULATOR qemu-arm -L ${QZ_SYSROOT})
