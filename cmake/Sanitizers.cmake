# Sanitizer builds: VOX_SANITIZE=address (AddressSanitizer with UndefinedBehaviorSanitizer) or
# VOX_SANITIZE=thread (ThreadSanitizer). The flags go on every target of the tree, the library,
# the tools, the test engines and the tests alike, so that an engine loaded at run time finds
# the same sanitizer runtime as the program that loads it (the runtime is linked as a shared
# library by g++, and the program that starts first brings it in).
#
# Undefined behaviour stops the program (no recovery), so that a test fails instead of
# printing a warning nobody reads. Three checks are off: vptr, because the test engines and
# the library keep their type information hidden, which the check would take for a type
# mismatch; null and integer-divide-by-zero, because both fault in hardware anyway, and the
# library's guard around engine calls must see that fault (the tests provoke it on purpose)
# rather than have the checker end the process first.
set(VOX_SANITIZE "" CACHE STRING "Sanitizer build: empty, address (with undefined) or thread")
set_property(CACHE VOX_SANITIZE PROPERTY STRINGS "" address thread)

# The test executables that run threads of their own or through the library; a thread
# sanitizer build runs these (ctest label "threads", build target vox_threaded_tests).
set(VOX_THREADED_TESTS
  run_threads_test run_pipeline_test run_control_test tlock_test job_leap_seconds_test
  engine_log_test scratch_ring_test run_engine_steps_test faults_concurrency_test
  faults_threads_test)

if(VOX_SANITIZE STREQUAL "address")
  set(vox_sanitize_flags -fsanitize=address,undefined -fno-sanitize=vptr,null,integer-divide-by-zero
    -fno-sanitize-recover=undefined -fno-omit-frame-pointer -O1)
elseif(VOX_SANITIZE STREQUAL "thread")
  set(vox_sanitize_flags -fsanitize=thread -fno-omit-frame-pointer -O1)
elseif(NOT VOX_SANITIZE STREQUAL "")
  message(FATAL_ERROR "VOX_SANITIZE must be empty, address or thread (not ${VOX_SANITIZE})")
endif()

# Fuzz build (clang only): every object gets the fuzzer's coverage instrumentation with
# AddressSanitizer and UndefinedBehaviorSanitizer; only the fuzz targets link the fuzzer's
# driver (see fuzz/CMakeLists.txt).
option(VOX_FUZZ "Build the fuzz targets (clang with libFuzzer)" OFF)
if(VOX_FUZZ)
  if(NOT CMAKE_CXX_COMPILER_ID MATCHES "Clang")
    message(FATAL_ERROR "VOX_FUZZ needs clang (e.g. CXX=clang++-14 CC=clang-14)")
  endif()
  if(NOT VOX_SANITIZE STREQUAL "")
    message(FATAL_ERROR "VOX_FUZZ brings its own sanitizers; leave VOX_SANITIZE empty")
  endif()
  set(vox_sanitize_flags -fsanitize=address,undefined -fno-sanitize=vptr
    -fno-sanitize-recover=undefined -fno-omit-frame-pointer -O1)
  add_compile_options(-fsanitize=fuzzer-no-link)
endif()

if(vox_sanitize_flags)
  add_compile_options(${vox_sanitize_flags})
  add_link_options(${vox_sanitize_flags})
  # Tests run with the options the suite needs (see tests/sanitizer_options.sh): set here so
  # that a plain ctest in a sanitizer build folder behaves like the CI run.
  message(STATUS "vox: sanitizer build (${VOX_SANITIZE})")
endif()
