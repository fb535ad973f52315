# Builds the reference engines and their shared arithmetic outside the vox tree, against the
# installed SDK alone: the SDK component goes into a scratch prefix, and a small project
# compiles engines/common and each engine with find_package(vox) and nothing of src/.
#   cmake -DBUILD_DIR=<vox build> -DSOURCE_DIR=<vox source> -DGENERATOR=<generator> -P <this>
string(RANDOM LENGTH 8 tag)
set(scratch "/tmp/vox_engines_sdk_${tag}")
file(REMOVE_RECURSE "${scratch}")

function(run what)
  execute_process(COMMAND ${ARGN} RESULT_VARIABLE result OUTPUT_VARIABLE out ERROR_VARIABLE err)
  if(NOT result EQUAL 0)
    file(REMOVE_RECURSE "${scratch}")
    message(FATAL_ERROR "${what} failed (${result}):\n${out}\n${err}")
  endif()
endfunction()

run("installing the sdk component"
    ${CMAKE_COMMAND} --install "${BUILD_DIR}" --component sdk --prefix "${scratch}/prefix")
file(MAKE_DIRECTORY "${scratch}/project")
file(WRITE "${scratch}/project/CMakeLists.txt" "
cmake_minimum_required(VERSION 3.25)
project(reference_engines LANGUAGES CXX)
set(CMAKE_CXX_STANDARD 20)
set(CMAKE_POSITION_INDEPENDENT_CODE ON)
find_package(vox REQUIRED)
file(GLOB common_sources ${SOURCE_DIR}/engines/common/*.cpp)
add_library(common STATIC \${common_sources})
target_include_directories(common PUBLIC ${SOURCE_DIR}/engines/common)
target_link_libraries(common PUBLIC vox::vox)
foreach(engine rawfilter static kinematic)
  file(GLOB sources ${SOURCE_DIR}/engines/\${engine}/*.cpp)
  add_library(\${engine} MODULE \${sources})
  target_link_libraries(\${engine} PRIVATE common)
endforeach()
")
run("configuring the engines against the installed SDK"
    ${CMAKE_COMMAND} -S "${scratch}/project" -B "${scratch}/build" -G "${GENERATOR}"
    "-DCMAKE_PREFIX_PATH=${scratch}/prefix")
run("building the engines against the installed SDK" ${CMAKE_COMMAND} --build "${scratch}/build")
file(REMOVE_RECURSE "${scratch}")
message(STATUS "the reference engines build against the installed SDK alone")
