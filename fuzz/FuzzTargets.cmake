# The fuzz targets, one per reader of outside input: the source with LLVMFuzzerTestOneInput, the
# libraries it needs, and the longest input worth trying. Their seed and regression inputs are in
# fuzz/corpus/<name>/. The fuzz build (fuzz/CMakeLists.txt) links them to libFuzzer; the tests
# (tests/fuzz) link them to ReplayMain.cpp, which runs each stored input once.
set(KV_FUZZ_DIR ${CMAKE_CURRENT_LIST_DIR})
set(KV_FUZZ_TARGETS dispatcher binary_log measurement_file hardware_config candump_replay
  configuration_file)

set(KV_FUZZ_SOURCE_dispatcher DispatcherFuzz.cpp)
set(KV_FUZZ_LIBS_dispatcher kv_service kv_protocol)
set(KV_FUZZ_SOURCE_binary_log BinaryLogFuzz.cpp)
set(KV_FUZZ_LIBS_binary_log kv_kvlog)
set(KV_FUZZ_SOURCE_measurement_file MeasurementFileFuzz.cpp)
set(KV_FUZZ_LIBS_measurement_file kv_kvlog)
set(KV_FUZZ_SOURCE_hardware_config HardwareConfigFuzz.cpp)
set(KV_FUZZ_LIBS_hardware_config tarvix)
set(KV_FUZZ_SOURCE_candump_replay CandumpReplayFuzz.cpp)
set(KV_FUZZ_LIBS_candump_replay tarvix)
set(KV_FUZZ_SOURCE_configuration_file ConfigurationFileFuzz.cpp)
set(KV_FUZZ_LIBS_configuration_file kv_service kv_protocol)

# kv_add_fuzz_executable(TARGET NAME [SOURCES...]): the executable TARGET of fuzz target NAME.
function(kv_add_fuzz_executable target name)
  add_executable(${target} ${KV_FUZZ_DIR}/${KV_FUZZ_SOURCE_${name}} ${KV_FUZZ_DIR}/FuzzSupport.cpp
    ${ARGN})
  target_include_directories(${target} PRIVATE ${KV_FUZZ_DIR}/..)
  target_link_libraries(${target} PRIVATE ${KV_FUZZ_LIBS_${name}})
endfunction()
