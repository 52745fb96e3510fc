# Functions that define the project's targets: libraries, plug-ins, tests, benchmarks and fuzzers.
include(GoogleTest)

set(TONEWRIGHT_LIBRARY_DIR ${CMAKE_BINARY_DIR}/lib)
set(CMAKE_RUNTIME_OUTPUT_DIRECTORY ${CMAKE_BINARY_DIR}/bin)
set(CMAKE_LIBRARY_OUTPUT_DIRECTORY ${TONEWRIGHT_LIBRARY_DIR})

# tw_sources(VARIABLE [FOLDER...]): sets VARIABLE to the sources of the given folders (by default the current one),
# including the platform code in their posix/.
macro(tw_sources variable)
    set(folders ${ARGN})
    if(NOT folders)
        set(folders .)
    endif()
    set(${variable})
    foreach(folder ${folders})
        set(path ${CMAKE_CURRENT_SOURCE_DIR}/${folder})
        file(GLOB found CONFIGURE_DEPENDS ${path}/*.cpp ${path}/*.h ${path}/posix/*.cpp ${path}/posix/*.h)
        list(APPEND ${variable} ${found})
    endforeach()
endmacro()

# An undefined symbol fails the build instead of the first call. Sanitizer runtimes are only linked into the
# executable, so their symbols are undefined here.
if(NOT TONEWRIGHT_SANITIZERS)
    set(TONEWRIGHT_LINK_STRICTLY -Wl,--no-undefined)
endif()

# tw_library(NAME FOLDERS folder... [PUBLIC lib...] [PRIVATE lib...]): a shared library with the alias tw::NAME.
function(tw_library name)
    cmake_parse_arguments(arg "" "" "FOLDERS;PUBLIC;PRIVATE" ${ARGN})
    tw_sources(sources ${arg_FOLDERS})
    if(NOT sources)
        return()
    endif()
    add_library(${name} SHARED ${sources})
    set_target_properties(${name} PROPERTIES LINKER_LANGUAGE CXX)
    add_library(tw::${name} ALIAS ${name})
    target_include_directories(${name} PUBLIC $<BUILD_INTERFACE:${CMAKE_SOURCE_DIR}/src>)
    target_link_libraries(${name} PUBLIC ${arg_PUBLIC} PRIVATE ${arg_PRIVATE} Threads::Threads)
    target_link_options(${name} PRIVATE ${TONEWRIGHT_LINK_STRICTLY})
    target_precompile_headers(${name} PRIVATE <algorithm> <cstdint> <cstring> <memory> <string> <vector>)
    set_target_properties(
        ${name}
        PROPERTIES VERSION ${PROJECT_VERSION}
                   SOVERSION ${PROJECT_VERSION_MAJOR}
                   BUILD_RPATH_USE_ORIGIN ON
                   INSTALL_RPATH "$ORIGIN"
    )
endfunction()

# tw_test(NAME [FOLDERS folder...] [PRIVATE lib...] [LABELS label...]): a test binary built from the current folder.
function(tw_test name)
    cmake_parse_arguments(arg "" "" "FOLDERS;PRIVATE;LABELS" ${ARGN})
    tw_sources(sources ${arg_FOLDERS})
    if(NOT sources)
        return()
    endif()
    add_executable(${name} ${sources})
    target_link_libraries(${name} PRIVATE ${arg_PRIVATE} GTest::gmock GTest::gtest_main)
    target_include_directories(${name} PRIVATE ${CMAKE_SOURCE_DIR}/tests)
    target_compile_definitions(${name} PRIVATE TONEWRIGHT_TEST_DATA="${CMAKE_SOURCE_DIR}/tests/data")
    # Tests spend more time compiling than running, and -O1 halves the compile time. The undefined behaviour
    # sanitizer covers the code under test only.
    target_compile_options(${name} PRIVATE -O1 -g1 -fno-sanitize=undefined)
    target_precompile_headers(${name} PRIVATE <gtest/gtest.h> <string> <vector>)
    gtest_discover_tests(${name} DISCOVERY_TIMEOUT 60 NO_PRETTY_VALUES PROPERTIES TIMEOUT 600 LABELS "${name};${arg_LABELS}")
endfunction()

# tw_benchmark(NAME lib...): a Google Benchmark binary built from the current folder.
function(tw_benchmark name)
    tw_sources(sources)
    add_executable(${name} ${sources})
    target_link_libraries(${name} PRIVATE ${ARGN} benchmark::benchmark benchmark::benchmark_main)
endfunction()

# tw_fuzzer(NAME source... LIBRARIES lib... [RUNS count]): a libFuzzer target with seeds in fuzz/corpus/NAME. Its
# test runs the seeds and a bounded number of mutations; new inputs are stored in the build directory.
function(tw_fuzzer name)
    cmake_parse_arguments(arg "" "RUNS" "LIBRARIES" ${ARGN})
    if(NOT arg_RUNS)
        set(arg_RUNS 50000)
    endif()
    add_executable(${name} ${arg_UNPARSED_ARGUMENTS})
    target_link_libraries(${name} PRIVATE ${arg_LIBRARIES})
    target_compile_options(${name} PRIVATE -fsanitize=fuzzer)
    target_link_options(${name} PRIVATE -fsanitize=fuzzer)
    set(found ${CMAKE_BINARY_DIR}/corpus/${name})
    file(MAKE_DIRECTORY ${found})
    add_test(NAME ${name} COMMAND ${name} -runs=${arg_RUNS} -max_len=4096 -timeout=20 -rss_limit_mb=2048
                                 ${found} ${CMAKE_SOURCE_DIR}/fuzz/corpus/${name})
    set_tests_properties(${name} PROPERTIES LABELS fuzz TIMEOUT 600)
endfunction()

# tw_plugin(NAME lib...): a media plug-in built from the current folder and placed next to the front library, where
# the plug-in handler looks for it.
function(tw_plugin name)
    tw_sources(sources)
    add_library(${name} MODULE ${sources})
    set_target_properties(${name} PROPERTIES PREFIX "" INSTALL_RPATH "$ORIGIN/..")
    target_link_libraries(${name} PRIVATE tw::sonora2 tw::plugin_support ${ARGN})
    target_link_options(${name} PRIVATE ${TONEWRIGHT_LINK_STRICTLY})
    set_property(GLOBAL APPEND PROPERTY TONEWRIGHT_PLUGINS ${name})
endfunction()
