# Windows install layout: a host needs vox.dll with the engines beside it (bare engine names
# are looked for in the library's own folder), the headers and the import library.
#
#   bin/      vox.dll, kra_rawfilter.dll, kra_static.eng, kra_kinematic.eng, the tools (.exe)
#   lib/      libvox.dll.a (import library), cmake/vox/
#   include/  vox/*.h
foreach(engine kra_rawfilter kra_static kra_kinematic)
  if(TARGET ${engine})
    install(TARGETS ${engine} LIBRARY DESTINATION ${CMAKE_INSTALL_BINDIR})
  endif()
endforeach()
