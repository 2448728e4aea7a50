# The trace file is opened once per process, so its check is a program of its own, run in a
# scratch working directory. Include this file from the matrix tests' build description.
add_executable(test_matrix_trace ${CMAKE_CURRENT_LIST_DIR}/trace/trace_file_check.cpp)
target_link_libraries(test_matrix_trace PRIVATE kelstat_core kelstat_options)
set(KELSTAT_TRACE_SCRATCH ${CMAKE_CURRENT_BINARY_DIR}/matrix_trace_scratch)
file(MAKE_DIRECTORY ${KELSTAT_TRACE_SCRATCH})
add_test(NAME matrix_trace_file COMMAND test_matrix_trace WORKING_DIRECTORY ${KELSTAT_TRACE_SCRATCH})
