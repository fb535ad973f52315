# Cross build for Windows x64 with Debian's MinGW-w64 compilers (the "posix" thread model,
# which std::thread and std::mutex need). Tests and tools run under Wine:
#
#   cmake -S . -B build-win -G Ninja -DCMAKE_TOOLCHAIN_FILE=cmake/toolchain-mingw64.cmake
#
# The runtime libraries are linked statically, so the DLLs and programs need nothing beside
# them but the system's own DLLs.
set(CMAKE_SYSTEM_NAME Windows)
set(CMAKE_SYSTEM_PROCESSOR x86_64)

set(VOX_MINGW_TRIPLET x86_64-w64-mingw32)
set(CMAKE_C_COMPILER ${VOX_MINGW_TRIPLET}-gcc-posix)
set(CMAKE_CXX_COMPILER ${VOX_MINGW_TRIPLET}-g++-posix)
set(CMAKE_RC_COMPILER ${VOX_MINGW_TRIPLET}-windres)
set(CMAKE_AR ${VOX_MINGW_TRIPLET}-gcc-ar-posix CACHE FILEPATH "")
set(CMAKE_RANLIB ${VOX_MINGW_TRIPLET}-gcc-ranlib-posix CACHE FILEPATH "")

set(CMAKE_FIND_ROOT_PATH /usr/${VOX_MINGW_TRIPLET})
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)
# Header-only packages of the host (CLI11, nlohmann-json) serve the cross build as well, but
# their own package files would put the host's /usr/include (glibc's headers) on the include
# path. Stand-ins expose only the packages' own header folders.
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE BOTH)
set(vox_host_packages ${CMAKE_BINARY_DIR}/host-packages)
foreach(entry "CLI11;CLI11::CLI11;CLI" "nlohmann_json;nlohmann_json::nlohmann_json;nlohmann")
  list(GET entry 0 package)
  list(GET entry 1 target)
  list(GET entry 2 folder)
  if(EXISTS /usr/include/${folder} AND NOT EXISTS ${vox_host_packages}/${package}Config.cmake)
    file(MAKE_DIRECTORY ${vox_host_packages}/include)
    file(CREATE_LINK /usr/include/${folder} ${vox_host_packages}/include/${folder} SYMBOLIC)
    file(WRITE ${vox_host_packages}/${package}Config.cmake
      "if(NOT TARGET ${target})\n"
      "  add_library(${target} INTERFACE IMPORTED)\n"
      "  set_target_properties(${target} PROPERTIES INTERFACE_INCLUDE_DIRECTORIES ${vox_host_packages}/include)\n"
      "endif()\n")
  endif()
  set(${package}_DIR ${vox_host_packages} CACHE PATH "")
endforeach()

# No libgcc, libstdc++ or winpthread DLL to ship: everything from the compiler is linked in.
# -static makes the linker take the archive of every library that has one (libgcc,
# libstdc++, winpthread); the system DLLs have only import libraries and stay DLLs.
set(VOX_MINGW_STATIC_RUNTIME "-static -static-libgcc -static-libstdc++")
set(CMAKE_EXE_LINKER_FLAGS_INIT "${VOX_MINGW_STATIC_RUNTIME}")
set(CMAKE_SHARED_LINKER_FLAGS_INIT "${VOX_MINGW_STATIC_RUNTIME}")
set(CMAKE_MODULE_LINKER_FLAGS_INIT "${VOX_MINGW_STATIC_RUNTIME}")

# Programs built here run under Wine (test discovery, ctest).
find_program(VOX_WINE NAMES wine wine64)
if(VOX_WINE)
  set(CMAKE_CROSSCOMPILING_EMULATOR ${VOX_WINE})
endif()
