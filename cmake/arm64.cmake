# Toolchain for AArch64 on another machine: Debian's cross compiler, the libraries that cmake/arm64-root fetched, and qemu to run
# what is built. A machine that is AArch64 itself needs none of this.
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR aarch64)
set(CMAKE_C_COMPILER aarch64-linux-gnu-gcc)
set(CMAKE_CXX_COMPILER aarch64-linux-gnu-g++)

get_filename_component(KEL_ARM64_ROOT ${CMAKE_CURRENT_LIST_DIR}/../build/arm64-root ABSOLUTE CACHE)
list(APPEND CMAKE_TRY_COMPILE_PLATFORM_VARIABLES KEL_ARM64_ROOT)
set(CMAKE_FIND_ROOT_PATH ${KEL_ARM64_ROOT})
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_LIBRARY_ARCHITECTURE aarch64-linux-gnu)
set(ENV{PKG_CONFIG_LIBDIR} ${KEL_ARM64_ROOT}/usr/lib/aarch64-linux-gnu/pkgconfig)
set(ENV{PKG_CONFIG_SYSROOT_DIR} ${KEL_ARM64_ROOT})
foreach(language C CXX) # headers that differ between architectures
  set(CMAKE_${language}_FLAGS_INIT "-isystem ${KEL_ARM64_ROOT}/usr/include/aarch64-linux-gnu")
endforeach()
foreach(kind EXE SHARED) # what the libraries there need themselves
  string(APPEND CMAKE_${kind}_LINKER_FLAGS_INIT " -Wl,-rpath-link,${KEL_ARM64_ROOT}/usr/lib/aarch64-linux-gnu:${KEL_ARM64_ROOT}/lib/aarch64-linux-gnu")
endforeach()
set(CMAKE_CROSSCOMPILING_EMULATOR qemu-aarch64 -L ${KEL_ARM64_ROOT})
