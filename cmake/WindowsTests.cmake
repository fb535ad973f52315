# The test suite of the Windows build (included by tests/CMakeLists.txt when WIN32).
#
# GoogleTest is built from Debian's sources for the cross compiler. Each test program runs
# whole under Wine (one Wine start per program, not per case), from scripts/test-windows.sh
# or ctest. Suites that need POSIX-only facilities (fork, resource limits, /proc, signals,
# the ELF loader) are not built here.
set(VOX_GOOGLETEST_SOURCE /usr/src/googletest CACHE PATH "GoogleTest sources for the cross build")
set(INSTALL_GTEST OFF CACHE BOOL "" FORCE)
set(gtest_disable_pthreads OFF CACHE BOOL "" FORCE)
add_subdirectory(${VOX_GOOGLETEST_SOURCE} ${PROJECT_BINARY_DIR}/googletest EXCLUDE_FROM_ALL)
foreach(target gtest gtest_main gmock gmock_main)
  if(TARGET ${target} AND NOT TARGET GTest::${target})
    add_library(GTest::${target} ALIAS ${target})
    # GoogleTest's own sources are not ours to hold to our warning flags.
    target_compile_options(${target} PRIVATE -w)
  endif()
endforeach()

include(GoogleTest)
# Listing a program's cases means starting it under Wine: do that when ctest runs, not at
# every build.
set(CMAKE_GTEST_DISCOVER_TESTS_DISCOVERY_MODE PRE_TEST)

get_filename_component(VOX_SHARED_DIR "${PROJECT_SOURCE_DIR}/../shared" ABSOLUTE)

# Programs that need POSIX-only facilities; they are defined (so that their rooms' CMake
# files stay as they are) but neither built nor run here.
#   engine_example_job_test    runs programs and reads their wait status
#   raw_probe_job_test         forks a child per job
#   engines_reference_test     exports the library from the test program so that engines bind
#                              to its task (engines bind to vox.dll on Windows; the reference
#                              engines run through voxrun.exe in windows_voxrun_jobs instead)
#   api_probe_engine_test      the same export of the library from the test program
#   api_export_list_test       reads the ELF symbol table (windows_export_table reads the DLL's)
#   results_probe_job_test     (listed for completeness; defined by its room directly)
set(VOX_WINDOWS_EXCLUDED_TESTS engines_reference_test engine_example_job_test
  raw_probe_job_test results_probe_job_test api_probe_engine_test api_export_list_test)

# vox_test(NAME SOURCES...): as on Linux, but one ctest entry per program.
function(vox_test name)
  if(name IN_LIST VOX_WINDOWS_EXCLUDED_TESTS)
    add_executable(${name} EXCLUDE_FROM_ALL ${ARGN})
    target_link_libraries(${name} PRIVATE vox_internal GTest::gtest GTest::gmock GTest::gtest_main)
    return()
  endif()
  add_executable(${name} ${ARGN})
  target_link_libraries(${name} PRIVATE vox_internal GTest::gtest GTest::gmock GTest::gtest_main)
  target_compile_options(${name} PRIVATE -include ${PROJECT_SOURCE_DIR}/tests/windows/posix_shims.h)
  if(TARGET vox_test_support)
    target_link_libraries(${name} PRIVATE vox_test_support)
  endif()
  target_compile_definitions(${name} PRIVATE
    VOX_SHARED_DIR="${VOX_SHARED_DIR}"
    VOX_BUILD_DIR="${PROJECT_BINARY_DIR}"
    VOX_TEST_ENGINE_DIR="${PROJECT_BINARY_DIR}/tests/engines")
  add_test(NAME ${name} COMMAND ${name})
  set_tests_properties(${name} PROPERTIES TIMEOUT 300 LABELS windows)
  set_property(GLOBAL APPEND PROPERTY VOX_WINDOWS_TESTS ${name})
endfunction()
add_custom_target(vox_threaded_tests)

set(tests_dir ${PROJECT_SOURCE_DIR}/tests)
add_subdirectory(${tests_dir}/support ${PROJECT_BINARY_DIR}/tests/support)
add_subdirectory(${tests_dir}/engines ${PROJECT_BINARY_DIR}/tests/engines)
foreach(room base job engine raw results run api faults)
  add_subdirectory(${tests_dir}/${room} ${PROJECT_BINARY_DIR}/tests/${room})
endforeach()
# More programs of that kind that the rooms define themselves (they fork, or run voxrun and
# read its wait status): kept out of the build; voxrun.exe has its own job test here. Their cases carry no "windows" label.
foreach(name engine_example_job_test results_probe_job_test run_api_test voxrun_test
        run_schedule_job_test faults_threads_test api_example_engine_test)
  if(TARGET ${name})
    set_target_properties(${name} PROPERTIES EXCLUDE_FROM_ALL ON)
  endif()
endforeach()
add_subdirectory(${tests_dir}/windows ${PROJECT_BINARY_DIR}/tests/windows)
