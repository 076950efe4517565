# Builds for 32-bit ARM (hard float) with Debian's cross compiler and runs what it builds under
# qemu-user. QV_ARMHF_ROOT is the folder with the unpacked armhf packages that the project links,
# as scripts/test-armhf.sh makes it.
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR armv7l)

set(CMAKE_C_COMPILER arm-linux-gnueabihf-gcc)
set(CMAKE_CXX_COMPILER arm-linux-gnueabihf-g++)
set(CMAKE_LIBRARY_ARCHITECTURE arm-linux-gnueabihf)
set(CMAKE_CROSSCOMPILING_EMULATOR qemu-arm -L /usr/arm-linux-gnueabihf)
# The compiler tells with every template that takes a 64-bit value that an older version of it
# passed these otherwise; everything here comes from one version.
set(CMAKE_CXX_FLAGS_INIT -Wno-psabi)

set(QV_ARMHF_ROOT "" CACHE PATH "Folder with the unpacked armhf packages")
list(APPEND CMAKE_TRY_COMPILE_PLATFORM_VARIABLES QV_ARMHF_ROOT)

# Some libraries are named by others, which are linker scripts. CMake leaves a folder of these flags
# out of the run path, so that has to be said too.
set(CMAKE_EXE_LINKER_FLAGS_INIT -L${QV_ARMHF_ROOT}/usr/lib/arm-linux-gnueabihf)
set(CMAKE_BUILD_RPATH ${QV_ARMHF_ROOT}/usr/lib/arm-linux-gnueabihf)

set(CMAKE_FIND_ROOT_PATH ${QV_ARMHF_ROOT} /usr/arm-linux-gnueabihf)
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)
