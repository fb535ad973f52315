# vox_raw_writer: builds raw observation files from plain values (tests, tools, benchmarks).
add_library(vox_raw_writer STATIC ${CMAKE_CURRENT_LIST_DIR}/raw_writer.cpp)
target_include_directories(vox_raw_writer PUBLIC ${CMAKE_CURRENT_LIST_DIR})
target_sources(vox_raw_writer PRIVATE ${CMAKE_CURRENT_LIST_DIR}/raw_fields.cpp)
target_include_directories(vox_raw_writer PUBLIC ${PROJECT_SOURCE_DIR}/include)
