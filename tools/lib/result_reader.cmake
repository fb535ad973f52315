# vox_result_reader: decodes result files record by record (voxdump, tests).
add_library(vox_result_reader STATIC ${CMAKE_CURRENT_LIST_DIR}/result_reader.cpp)
target_include_directories(vox_result_reader PUBLIC ${CMAKE_CURRENT_LIST_DIR})
