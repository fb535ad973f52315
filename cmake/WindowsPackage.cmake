# Windows form of the export rule (included by VoxPackage.cmake): vox.dll exports exactly
# the names of src/api/export_list.txt, undecorated, through a module-definition file made
# from it, and comes with its import library (libvox.dll.a) for hosts and engines.
set(VOX_DEF_FILE ${PROJECT_BINARY_DIR}/vox.def)
set(vox_def "LIBRARY vox.dll\nEXPORTS\n")
foreach(line IN LISTS vox_export_lines)
  string(STRIP "${line}" line)
  if(line STREQUAL "" OR line MATCHES "^#")
    continue()
  endif()
  string(APPEND vox_def "    ${line}\n")
endforeach()
file(CONFIGURE OUTPUT ${VOX_DEF_FILE} CONTENT "${vox_def}" @ONLY)

target_sources(vox PRIVATE ${VOX_DEF_FILE})
# The library's own objects mark the exports as well (dllexport); the definition file makes
# sure nothing else leaves, and the runtime libraries linked in statically stay hidden.
target_link_options(vox PRIVATE "LINKER:--exclude-all-symbols")
set_property(TARGET vox APPEND PROPERTY LINK_DEPENDS ${VOX_DEF_FILE})
set_target_properties(vox PROPERTIES PREFIX "" IMPORT_PREFIX "lib" RUNTIME_OUTPUT_DIRECTORY ${PROJECT_BINARY_DIR}/bin)

# Windows finds a DLL beside the program or the library that loads it: the library, its
# engines and the tools go side by side into bin/ (the build tree's layout as well); the
# import library goes to lib/.
