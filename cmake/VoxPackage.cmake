# What leaves the build for others: exactly the listed exports, and a CMake package so that
# find_package(vox) works for engines and hosts built outside this tree.
#
# src/api/export_list.txt is the one list of exported functions. The linker gets a version
# script made from it, so nothing else (not even template code the standard headers mark as
# visible) reaches the dynamic symbol table; the export test and the SDK documentation read
# the same file.

set(VOX_EXPORT_LIST ${PROJECT_SOURCE_DIR}/src/api/export_list.txt)
set(VOX_VERSION_SCRIPT ${PROJECT_BINARY_DIR}/vox.map)
set_property(DIRECTORY ${PROJECT_SOURCE_DIR} APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS ${VOX_EXPORT_LIST})

file(STRINGS ${VOX_EXPORT_LIST} vox_export_lines)
if(WIN32)
  # Windows exports through a module-definition file made from the same list.
  include(${PROJECT_SOURCE_DIR}/cmake/WindowsPackage.cmake)
else()
set(vox_map "{\n  global:\n")
foreach(line IN LISTS vox_export_lines)
  string(STRIP "${line}" line)
  if(line STREQUAL "" OR line MATCHES "^#")
    continue()
  endif()
  string(APPEND vox_map "    ${line};\n")
endforeach()
string(APPEND vox_map "  local:\n    *;\n};\n")
file(CONFIGURE OUTPUT ${VOX_VERSION_SCRIPT} CONTENT "${vox_map}" @ONLY)

target_link_options(vox PRIVATE "LINKER:--version-script=${VOX_VERSION_SCRIPT}")
set_property(TARGET vox APPEND PROPERTY LINK_DEPENDS ${VOX_VERSION_SCRIPT})
endif()

# Engines in this tree link the same name an outside engine gets from find_package(vox).
add_library(vox::vox ALIAS vox)

# ---- Installed package: lib/cmake/vox/voxConfig.cmake with the imported target vox::vox.
include(CMakePackageConfigHelpers)
set(VOX_CMAKE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/vox)

# Everything an engine author needs is also the install component "sdk", so that
#   cmake --install <build> --component sdk --prefix <folder>
# gives a usable SDK without the tools.
install(TARGETS vox EXPORT voxTargets
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT sdk
  RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT sdk
  ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT sdk
  INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(DIRECTORY ${PROJECT_SOURCE_DIR}/include/vox DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}
  COMPONENT sdk FILES_MATCHING PATTERN "*.h")
install(EXPORT voxTargets NAMESPACE vox:: DESTINATION ${VOX_CMAKE_DIR} COMPONENT sdk)

configure_package_config_file(${PROJECT_SOURCE_DIR}/cmake/voxConfig.cmake.in
  ${PROJECT_BINARY_DIR}/voxConfig.cmake INSTALL_DESTINATION ${VOX_CMAKE_DIR}
  PATH_VARS CMAKE_INSTALL_DATADIR)
write_basic_package_version_file(${PROJECT_BINARY_DIR}/voxConfigVersion.cmake
  VERSION ${PROJECT_VERSION} COMPATIBILITY SameMajorVersion)
install(FILES ${PROJECT_BINARY_DIR}/voxConfig.cmake ${PROJECT_BINARY_DIR}/voxConfigVersion.cmake
  DESTINATION ${VOX_CMAKE_DIR} COMPONENT sdk)

# The export list and the example engine travel with the SDK.
install(FILES ${VOX_EXPORT_LIST} ${PROJECT_SOURCE_DIR}/docs/engine-sdk.md
  DESTINATION ${CMAKE_INSTALL_DATADIR}/vox COMPONENT sdk)
install(DIRECTORY ${PROJECT_SOURCE_DIR}/engines/example/
  DESTINATION ${CMAKE_INSTALL_DATADIR}/vox/example-engine COMPONENT sdk)
