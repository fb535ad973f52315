# vox_rinex: reads RINEX observation and navigation files (voxraw from-rinex, real-data tests).
add_library(vox_rinex STATIC ${CMAKE_CURRENT_LIST_DIR}/rinex_reader.cpp)
target_include_directories(vox_rinex PUBLIC ${CMAKE_CURRENT_LIST_DIR})
