# Cross-compiles for 32-bit ARM as the devices have it: ARMv7 with NEON, without the later VFPv4. The C and C++
# libraries are the cross compiler's; every other one comes from the folder that scripts/sysroot fills.
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR armv7l)
set(CMAKE_C_COMPILER arm-linux-gnueabihf-gcc)
set(CMAKE_CXX_COMPILER arm-linux-gnueabihf-g++)
set(CMAKE_C_FLAGS_INIT "-march=armv7-a -mfpu=neon")
# Nothing here meets code of compilers before GCC 7, which passed some records otherwise.
set(CMAKE_CXX_FLAGS_INIT "-march=armv7-a -mfpu=neon -Wno-psabi")

cmake_path(ABSOLUTE_PATH CMAKE_CURRENT_LIST_DIR NORMALIZE OUTPUT_VARIABLE here)
cmake_path(GET here PARENT_PATH project)
set(sysroot ${project}/build/armhf-sysroot)
set(CMAKE_FIND_ROOT_PATH ${sysroot})
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)
set(ENV{PKG_CONFIG_SYSROOT_DIR} ${sysroot})
set(ENV{PKG_CONFIG_LIBDIR} ${sysroot}/usr/lib/arm-linux-gnueabihf/pkgconfig:${sysroot}/usr/share/pkgconfig)

# What the libraries in there need of each other.
set(link_paths -Wl,-rpath-link,${sysroot}/usr/lib/arm-linux-gnueabihf:${sysroot}/lib/arm-linux-gnueabihf)
set(CMAKE_EXE_LINKER_FLAGS_INIT ${link_paths})
set(CMAKE_SHARED_LINKER_FLAGS_INIT ${link_paths})
set(CMAKE_MODULE_LINKER_FLAGS_INIT ${link_paths})

# The processor of an OMAP4. One with VFPv4 would hide instructions that the devices do not have.
set(CMAKE_CROSSCOMPILING_EMULATOR qemu-arm -cpu cortex-a9 -L ${sysroot})
