# Functions that define the project's targets: libraries, plug-ins, tests, benchmarks and fuzzers.
include(GoogleTest)
include(TonewrightPlugin)

# The build tree has the layout of an installation, so one relative run path serves both. A run path that CMake changes
# during installation is padded with colons, and the loader searches the working directory for an empty entry.
set(TONEWRIGHT_LIBRARY_DIR ${PROJECT_BINARY_DIR}/${CMAKE_INSTALL_LIBDIR})
set(CMAKE_RUNTIME_OUTPUT_DIRECTORY ${PROJECT_BINARY_DIR}/bin)
set(CMAKE_LIBRARY_OUTPUT_DIRECTORY ${TONEWRIGHT_LIBRARY_DIR})
set(CMAKE_BUILD_WITH_INSTALL_RPATH ON)
set(CMAKE_INSTALL_RPATH "$ORIGIN/../${CMAKE_INSTALL_LIBDIR}")
set(CMAKE_INSTALL_RPATH_USE_LINK_PATH ON) # libraries outside of the system's folders

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

# A library binds its own functions and type information at link time: fewer searches for symbols at start-up, and no
# other library can replace them. Types are compared by name, and no library exports variables. An undefined symbol fails
# the build instead of the first call.
# The sanitizers compare types by address, and their runtimes are only linked into the executable, so that their symbols
# are undefined here.
if(TONEWRIGHT_SANITIZERS)
    set(TONEWRIGHT_LINK_STRICTLY -Wl,-Bsymbolic-functions)
else()
    set(TONEWRIGHT_LINK_STRICTLY -Wl,-Bsymbolic -Wl,--no-undefined)
endif()

# Installed below lib and libexec.
set(TONEWRIGHT_PLUGIN_FOLDER ${CMAKE_INSTALL_LIBDIR}/tonewright)
set(TONEWRIGHT_COMPANION_FOLDER ${CMAKE_INSTALL_LIBEXECDIR}/tonewright)
set(TONEWRIGHT_GENERATED_DIR ${PROJECT_BINARY_DIR}/generated)
configure_file(${CMAKE_CURRENT_LIST_DIR}/InstallFolders.h.in ${TONEWRIGHT_GENERATED_DIR}/InstallFolders.h @ONLY)

# tw_library(NAME [INTERNAL] [C_INTERFACE] FOLDERS folder... [PUBLIC lib...] [PRIVATE lib...]): a shared library with the
# alias tw::NAME. An INTERNAL one is installed to the plug-in folder, since only other libraries of the project link it.
# With C_INTERFACE its users need no C++ compiler, and it exports C functions only: those in the exports.map of its folder,
# or all of Tonewright's.
function(tw_library name)
    cmake_parse_arguments(arg "INTERNAL;C_INTERFACE" "" "FOLDERS;PUBLIC;PRIVATE" ${ARGN})
    tw_sources(sources ${arg_FOLDERS})
    if(NOT sources)
        return()
    endif()
    add_library(${name} SHARED ${sources})
    set_target_properties(${name} PROPERTIES LINKER_LANGUAGE CXX)
    add_library(tw::${name} ALIAS ${name})
    add_library(tonewright::${name} ALIAS ${name}) # the name that an installed package gives it
    target_include_directories(${name} PUBLIC $<BUILD_INTERFACE:${PROJECT_SOURCE_DIR}/src>)
    if(NOT arg_C_INTERFACE)
        target_compile_features(${name} INTERFACE cxx_std_20)
    elseif(NOT EXISTS ${CMAKE_CURRENT_SOURCE_DIR}/exports.map)
        target_link_options(${name} PRIVATE -Wl,--version-script=${PROJECT_SOURCE_DIR}/cmake/c-interface.map)
        set_property(TARGET ${name} APPEND PROPERTY LINK_DEPENDS ${PROJECT_SOURCE_DIR}/cmake/c-interface.map)
    endif()
    target_link_libraries(${name} PUBLIC ${arg_PUBLIC} PRIVATE ${arg_PRIVATE} Threads::Threads)
    target_link_options(${name} PRIVATE ${TONEWRIGHT_LINK_STRICTLY})
    target_precompile_headers(${name} PRIVATE <algorithm> <cstdint> <cstring> <memory> <string> <vector>)
    set_target_properties(
        ${name}
        PROPERTIES VERSION ${PROJECT_VERSION}
                   SOVERSION ${PROJECT_VERSION_MAJOR}
                   INSTALL_RPATH "$ORIGIN"
    )
    if(arg_INTERNAL)
        set_target_properties(${name} PROPERTIES INSTALL_RPATH "$ORIGIN/..;$ORIGIN")
        set_property(GLOBAL APPEND PROPERTY TONEWRIGHT_INTERNAL_LIBRARIES ${name})
    else()
        set_property(GLOBAL APPEND PROPERTY TONEWRIGHT_LIBRARIES ${name})
    endif()
endfunction()

# tw_test(NAME [UNITY] [FOLDERS folder...] [PRIVATE lib...] [REALTIME test...]): a test binary built from the current
# folder. Its tests have the label NAME, except the REALTIME ones, patterns such as Play.*: they have NAME_realtime, and
# scripts/run-tests.sh runs them apart. With UNITY the files are compiled in groups, which takes about half the time; the
# names in their unnamed namespaces must differ then.
function(tw_test name)
    cmake_parse_arguments(arg "UNITY" "" "FOLDERS;PRIVATE;REALTIME" ${ARGN})
    tw_sources(sources ${arg_FOLDERS})
    if(NOT sources)
        return()
    endif()
    add_executable(${name} ${sources})
    if(arg_UNITY)
        set_target_properties(${name} PROPERTIES UNITY_BUILD ON UNITY_BUILD_BATCH_SIZE 5)
        target_compile_options(${name} PRIVATE -Wno-subobject-linkage) # fixtures are in unnamed namespaces
    endif()
    target_link_libraries(${name} PRIVATE ${arg_PRIVATE} GTest::gmock GTest::gtest_main)
    target_include_directories(${name} PRIVATE ${PROJECT_SOURCE_DIR}/tests)
    target_compile_definitions(${name} PRIVATE TONEWRIGHT_TEST_DATA="${PROJECT_SOURCE_DIR}/tests/data")
    # Tests spend more time compiling than running, and -O1 halves the compile time. The undefined behaviour
    # sanitizer covers the code under test only.
    target_compile_options(${name} PRIVATE -O1 -g1 -fno-sanitize=undefined)
    target_precompile_headers(${name} PRIVATE <gtest/gtest.h> <string> <vector>)
    set(settings DISCOVERY_TIMEOUT 60 NO_PRETTY_VALUES PROPERTIES TIMEOUT 600)
    if(arg_REALTIME)
        list(JOIN arg_REALTIME : realtime)
        gtest_discover_tests(${name} TEST_FILTER -${realtime} ${settings} LABELS ${name})
        gtest_discover_tests(
            ${name} TEST_FILTER ${realtime} TEST_LIST ${name}_realtime ${settings} LABELS ${name}_realtime
        )
    else()
        gtest_discover_tests(${name} ${settings} LABELS ${name})
    endif()
endfunction()

# tw_benchmark(NAME lib...): a Google Benchmark binary built from the current folder.
function(tw_benchmark name)
    tw_sources(sources)
    add_executable(${name} ${sources})
    target_link_libraries(${name} PRIVATE ${ARGN} benchmark::benchmark benchmark::benchmark_main)
endfunction()

# tw_fuzzer(NAME source... LIBRARIES lib... [RUNS count]): a libFuzzer target with seeds in fuzz/corpus/NAME. Its
# test runs the seeds and a bounded number of mutations, the same ones in every fresh build tree; new inputs are stored in
# the build directory, so a further run goes on from them.
function(tw_fuzzer name)
    cmake_parse_arguments(arg "" "RUNS" "LIBRARIES" ${ARGN})
    if(NOT arg_RUNS)
        set(arg_RUNS 30000)
    endif()
    add_executable(${name} ${arg_UNPARSED_ARGUMENTS})
    target_link_libraries(${name} PRIVATE ${arg_LIBRARIES})
    target_compile_options(${name} PRIVATE -fsanitize=fuzzer)
    target_link_options(${name} PRIVATE -fsanitize=fuzzer)
    set(found ${PROJECT_BINARY_DIR}/corpus/${name})
    file(MAKE_DIRECTORY ${found})
    add_test(NAME ${name} COMMAND ${name} -seed=1 -runs=${arg_RUNS} -max_len=4096 -timeout=20 -rss_limit_mb=2048
                                 ${found} ${PROJECT_SOURCE_DIR}/fuzz/corpus/${name})
    set_tests_properties(${name} PROPERTIES LABELS fuzz TIMEOUT 600)
endfunction()

# tw_plugin(NAME lib...): a media plug-in built from the current folder and placed next to the front library, where
# the plug-in handler looks for it.
function(tw_plugin name)
    tw_sources(sources)
    tonewright_add_plugin(${name} ${sources})
    target_link_libraries(${name} PRIVATE ${ARGN})
    target_link_options(${name} PRIVATE ${TONEWRIGHT_LINK_STRICTLY})
    # The libraries are in the parent folder of an installed plug-in and next to one in the build tree.
    set_target_properties(${name} PROPERTIES INSTALL_RPATH "$ORIGIN/..;$ORIGIN")
    set_property(GLOBAL APPEND PROPERTY TONEWRIGHT_PLUGINS ${name})
    # The description names the library that it belongs to by its build ID. Without one, such as for another processor,
    # the plug-in is loaded at start-up.
    target_link_options(${name} PRIVATE -Wl,--build-id)
    if(NOT CMAKE_CROSSCOMPILING)
        add_custom_command(
            TARGET ${name} POST_BUILD COMMAND plugin_describer $<TARGET_FILE:${name}>
            BYPRODUCTS ${TONEWRIGHT_LIBRARY_DIR}/${name}.plugin VERBATIM
        )
        set_property(GLOBAL APPEND PROPERTY TONEWRIGHT_PLUGIN_DESCRIPTIONS ${TONEWRIGHT_LIBRARY_DIR}/${name}.plugin)
    endif()
endfunction()
