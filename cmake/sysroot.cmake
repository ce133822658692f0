# Toolchain: clang++ and lld with the libraries of Debian 11, which scripts/sysroot extracts.
#   cmake -DCMAKE_TOOLCHAIN_FILE=cmake/sysroot.cmake -DRUV_ARCH=arm64 ...
set(RUV_ARCH amd64 CACHE STRING "Debian architecture to build for: amd64, arm64 or i386")
list(APPEND CMAKE_TRY_COMPILE_PLATFORM_VARIABLES RUV_ARCH)

set(processor_amd64 x86_64)
set(processor_arm64 aarch64)
set(processor_i386 i686)

set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR ${processor_${RUV_ARCH}})
set(CMAKE_SYSROOT ${CMAKE_CURRENT_LIST_DIR}/../build/sysroot/${RUV_ARCH})
set(CMAKE_CXX_COMPILER clang++)
set(CMAKE_CXX_COMPILER_TARGET ${CMAKE_SYSTEM_PROCESSOR}-linux-gnu)
set(CMAKE_CXX_COMPILER_EXTERNAL_TOOLCHAIN ${CMAKE_SYSROOT}/usr)
set(CMAKE_EXE_LINKER_FLAGS_INIT "-fuse-ld=lld -Wl,--as-needed")

set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)
