# Installs the SDK component of a build into a scratch folder outside any source tree, then
# configures and builds the installed example engine there with find_package(vox) alone.
#   cmake -DBUILD_DIR=<vox build> -DGENERATOR=<generator> -P sdk_package_test.cmake
string(RANDOM LENGTH 8 tag)
set(scratch "/tmp/vox_sdk_package_${tag}")
file(REMOVE_RECURSE "${scratch}")

function(run what)
  execute_process(COMMAND ${ARGN} RESULT_VARIABLE result OUTPUT_VARIABLE out ERROR_VARIABLE err)
  if(NOT result EQUAL 0)
    file(REMOVE_RECURSE "${scratch}")
    message(FATAL_ERROR "${what} failed (${result}):\n${out}\n${err}")
  endif()
  set(last_output "${out}" PARENT_SCOPE)
endfunction()

run("installing the sdk component"
    ${CMAKE_COMMAND} --install "${BUILD_DIR}" --component sdk --prefix "${scratch}/prefix")
foreach(f include/vox/vox_engine.h include/vox/vox_sdk_epoch.h lib/cmake/vox/voxConfig.cmake
          share/vox/export_list.txt share/vox/example-engine/CMakeLists.txt)
  if(NOT EXISTS "${scratch}/prefix/${f}")
    file(REMOVE_RECURSE "${scratch}")
    message(FATAL_ERROR "the installed SDK lacks ${f}")
  endif()
endforeach()

file(COPY "${scratch}/prefix/share/vox/example-engine/" DESTINATION "${scratch}/engine")
run("configuring the example engine"
    ${CMAKE_COMMAND} -S "${scratch}/engine" -B "${scratch}/build" -G "${GENERATOR}"
    "-DCMAKE_PREFIX_PATH=${scratch}/prefix")
run("building the example engine" ${CMAKE_COMMAND} --build "${scratch}/build")

set(engine "${scratch}/build/example.eng")
if(NOT EXISTS "${engine}")
  file(REMOVE_RECURSE "${scratch}")
  message(FATAL_ERROR "no example.eng was built")
endif()
run("listing the engine's exports" nm -D --defined-only "${engine}")
if(NOT last_output MATCHES "_eng_GetEngineVOXVersion" OR last_output MATCHES " T vox_")
  file(REMOVE_RECURSE "${scratch}")
  message(FATAL_ERROR "unexpected engine exports:\n${last_output}")
endif()
run("listing the engine's imports" nm -D --undefined-only "${engine}")
if(NOT last_output MATCHES "vox_OpenEpochStream")
  file(REMOVE_RECURSE "${scratch}")
  message(FATAL_ERROR "the engine does not import the epoch stream:\n${last_output}")
endif()
run("reading the engine's library needs" readelf -d "${engine}")
if(NOT last_output MATCHES "libvox.so")
  file(REMOVE_RECURSE "${scratch}")
  message(FATAL_ERROR "the engine is not linked with libvox:\n${last_output}")
endif()
file(REMOVE_RECURSE "${scratch}")
message(STATUS "the example engine builds against the installed SDK alone")
