# Installs the independent NMEA parser (the npm package nmea-simple) into NPM_PREFIX, once.
# Run by ctest as a fixture before the tests that check NMEA files with it. Never fails: a
# machine without npm or without access to the registry simply runs those checks as skipped.
#   cmake -DNPM_PREFIX=<build>/npm -P install_nmea_parser.cmake
if(EXISTS "${NPM_PREFIX}/node_modules/nmea-simple/package.json")
  message(STATUS "nmea-simple already in ${NPM_PREFIX}")
  return()
endif()
find_program(NPM npm)
if(NOT NPM)
  message(STATUS "npm not found: the independent NMEA checks will be skipped")
  return()
endif()
file(MAKE_DIRECTORY "${NPM_PREFIX}")
execute_process(
  COMMAND "${NPM}" install --prefix "${NPM_PREFIX}" --no-audit --no-fund --loglevel=error
          nmea-simple
  RESULT_VARIABLE result
  OUTPUT_VARIABLE output
  ERROR_VARIABLE output
  TIMEOUT 120)
if(NOT result EQUAL 0)
  message(STATUS "npm could not install nmea-simple (${result}): the independent NMEA checks "
                 "will be skipped\n${output}")
else()
  message(STATUS "nmea-simple installed in ${NPM_PREFIX}")
endif()
