# Helpers shared by the CMake files of the tree.

# vox_room(NAME SOURCES...): one room of the library (src/NAME), compiled once into objects
# that go both into the shared library and into the static archive the unit tests link.
function(vox_room name)
  add_library(vox_${name} OBJECT ${ARGN})
  target_include_directories(vox_${name} PUBLIC ${PROJECT_SOURCE_DIR}/include ${PROJECT_SOURCE_DIR}/src)
  target_compile_definitions(vox_${name} PUBLIC VOX_BUILDING_LIBRARY)
  set_target_properties(vox_${name} PROPERTIES
    CXX_VISIBILITY_PRESET hidden
    VISIBILITY_INLINES_HIDDEN ON)
  set_property(GLOBAL APPEND PROPERTY VOX_ROOMS vox_${name})
endfunction()

# vox_engine_library(NAME FILENAME SOURCES...): an engine built on the public SDK alone,
# as a third party would build it. FILENAME is the file name the library is loaded under.
function(vox_engine_library name filename)
  add_library(${name} MODULE ${ARGN})
  target_include_directories(${name} PRIVATE ${PROJECT_SOURCE_DIR}/include)
  target_link_libraries(${name} PRIVATE vox)
  string(REGEX MATCH "\\.[^.]*$" suffix "${filename}")
  string(REGEX REPLACE "\\.[^.]*$" "" stem "${filename}")
  set_target_properties(${name} PROPERTIES
    PREFIX "" OUTPUT_NAME "${stem}" SUFFIX "${suffix}"
    CXX_VISIBILITY_PRESET hidden
    BUILD_RPATH "$ORIGIN;${PROJECT_BINARY_DIR}/lib"
    INSTALL_RPATH "$ORIGIN")
endfunction()
