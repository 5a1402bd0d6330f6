# Fuzz targets: each is a file that defines LLVMFuzzerTestOneInput.
#
# Every build makes tav_fuzz_<name>_replay, the target with a main of our own
# that feeds it files, so that CTest replays the seeds and the regression
# inputs with whatever compiler and platform the build uses. With
# TAV_FUZZ_ENGINE=libfuzzer (clang only) it also makes tav_fuzz_<name>, the
# target linked with libFuzzer, and a short bounded run of it as a test.
set(TAV_FUZZ_ENGINE "" CACHE STRING "Fuzzing engine for the fuzz targets: libfuzzer or empty")
set(TAV_FUZZ_SECONDS 60 CACHE STRING "How long the short fuzzing run of each target lasts in CTest")

if(TAV_FUZZ_ENGINE STREQUAL "libfuzzer" AND NOT CMAKE_CXX_COMPILER_ID STREQUAL "Clang")
  message(FATAL_ERROR "TAV_FUZZ_ENGINE=libfuzzer needs clang (the fuzz preset uses clang-16)")
elseif(NOT TAV_FUZZ_ENGINE STREQUAL "" AND NOT TAV_FUZZ_ENGINE STREQUAL "libfuzzer")
  message(FATAL_ERROR "Unknown TAV_FUZZ_ENGINE value: ${TAV_FUZZ_ENGINE}")
endif()

if(NOT TARGET tav_fuzz)
  add_custom_target(tav_fuzz)
endif()

# tav_add_fuzz_target(<name> SOURCES <files...> LIBRARIES <targets...>
#                     [DICTIONARY <file>])
# Seeds live in seeds/<name>/, inputs that once found a fault in
# regression/<name>/.
function(tav_add_fuzz_target name)
  cmake_parse_arguments(PARSE_ARGV 1 arg "" "DICTIONARY" "SOURCES;LIBRARIES")
  set(seeds ${CMAKE_CURRENT_SOURCE_DIR}/seeds/${name})
  set(regression ${CMAKE_CURRENT_SOURCE_DIR}/regression/${name})

  set(replay tav_fuzz_${name}_replay)
  add_executable(${replay} ${arg_SOURCES} ${CMAKE_CURRENT_SOURCE_DIR}/replay_main.cpp)
  target_link_libraries(${replay} PRIVATE ${arg_LIBRARIES})
  target_include_directories(${replay} PRIVATE ${CMAKE_CURRENT_SOURCE_DIR} ${PROJECT_SOURCE_DIR}/tests)
  add_dependencies(tav_fuzz ${replay})
  add_test(NAME fuzz_replay_${name} COMMAND ${replay} ${regression} ${seeds})
  set_tests_properties(fuzz_replay_${name} PROPERTIES LABELS fuzz TIMEOUT 600)

  if(TAV_FUZZ_ENGINE STREQUAL "libfuzzer")
    set(fuzzer tav_fuzz_${name})
    add_executable(${fuzzer} ${arg_SOURCES})
    target_link_libraries(${fuzzer} PRIVATE ${arg_LIBRARIES})
    target_include_directories(${fuzzer} PRIVATE ${CMAKE_CURRENT_SOURCE_DIR} ${PROJECT_SOURCE_DIR}/tests)
    target_link_options(${fuzzer} PRIVATE -fsanitize=fuzzer)
    add_dependencies(tav_fuzz ${fuzzer})

    # New inputs go to the build folder, the checked-in seeds are only read.
    set(corpus ${CMAKE_CURRENT_BINARY_DIR}/corpus/${name})
    set(artifacts ${CMAKE_CURRENT_BINARY_DIR}/artifacts/${name}/)
    file(MAKE_DIRECTORY ${corpus} ${artifacts})
    set(options -max_total_time=${TAV_FUZZ_SECONDS} -artifact_prefix=${artifacts} -print_final_stats=1)
    if(arg_DICTIONARY)
      list(APPEND options -dict=${arg_DICTIONARY})
    endif()
    add_test(NAME fuzz_run_${name} COMMAND ${fuzzer} ${options} ${corpus} ${seeds} ${regression})
    set_tests_properties(fuzz_run_${name} PROPERTIES LABELS "fuzz;fuzz-run" TIMEOUT 900)
  endif()
endfunction()
