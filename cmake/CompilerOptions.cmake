# Language level, warnings, visibility, hardening, sanitizers and the compiler cache, for every target.
set(CMAKE_CXX_STANDARD 20)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
set(CMAKE_C_STANDARD 11)
set(CMAKE_C_VISIBILITY_PRESET hidden)
set(CMAKE_CXX_VISIBILITY_PRESET hidden)
set(CMAKE_VISIBILITY_INLINES_HIDDEN ON)
set(CMAKE_POSITION_INDEPENDENT_CODE ON)

if(NOT CMAKE_BUILD_TYPE AND PROJECT_IS_TOP_LEVEL)
    set(CMAKE_BUILD_TYPE RelWithDebInfo CACHE STRING "Build type" FORCE)
endif()
# -O3 instead of -O2: the sample and character loops are written to be vectorised.
set(CMAKE_CXX_FLAGS_RELWITHDEBINFO "-O3 -g -DNDEBUG")
set(CMAKE_C_FLAGS_RELWITHDEBINFO "-O3 -g -DNDEBUG")

add_compile_options(-Wall -Wextra -Wpedantic $<$<COMPILE_LANGUAGE:CXX>:-Wnon-virtual-dtor> -Wno-unused-parameter)
if(TONEWRIGHT_WERROR)
    add_compile_options(-Werror)
endif()
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
    add_compile_options(-Wshadow=local)
    # Interfaces have protected, virtual destructors; GCC 12 reports false positives inside its
    # std::string, more of them with precompiled headers.
    add_compile_options(-Wno-maybe-uninitialized -Wno-restrict -Wno-stringop-overflow -Wno-array-bounds $<$<COMPILE_LANGUAGE:CXX>:-Wno-non-virtual-dtor>)
endif()

if(TONEWRIGHT_HARDENING AND NOT TONEWRIGHT_SANITIZERS)
    include(CheckPIESupported)
    check_pie_supported()
    # Distributions pass a fortify level of their own, and a second definition would be a warning. Without optimisation
    # glibc cannot check anything and warns about that.
    add_compile_options(-fstack-protector-strong $<$<NOT:$<CONFIG:Debug>>:-U_FORTIFY_SOURCE> $<$<NOT:$<CONFIG:Debug>>:-D_FORTIFY_SOURCE=2>)
    add_link_options(-Wl,-z,relro,-z,now)
endif()

# Relocations of addresses within a library as bits instead of records: less to read at start-up.
include(CheckLinkerFlag)
check_linker_flag(CXX LINKER:-z,pack-relative-relocs TONEWRIGHT_HAS_PACKED_RELOCATIONS)
if(TONEWRIGHT_HAS_PACKED_RELOCATIONS)
    add_link_options(LINKER:-z,pack-relative-relocs)
endif()

if(TONEWRIGHT_SANITIZERS)
    add_compile_options(-fsanitize=${TONEWRIGHT_SANITIZERS} -fno-omit-frame-pointer -fno-sanitize-recover=all -O1 -g1)
    add_link_options(-fsanitize=${TONEWRIGHT_SANITIZERS})
    add_compile_definitions(TONEWRIGHT_SANITIZED)
endif()
if(TONEWRIGHT_FUZZERS)
    # Coverage feedback from the libraries, not only from the target's own source file.
    add_compile_options(-fsanitize=fuzzer-no-link)
endif()
if(TONEWRIGHT_COVERAGE)
    add_compile_options(--coverage)
    add_link_options(--coverage)
endif()

find_program(TONEWRIGHT_CCACHE ccache)
if(TONEWRIGHT_CCACHE AND NOT CMAKE_CXX_COMPILER_LAUNCHER)
    # ccache needs this sloppiness to cache precompiled headers. The base directory lets several checkouts share
    # one cache.
    set(launcher
        ${CMAKE_COMMAND} -E env CCACHE_SLOPPINESS=pch_defines,time_macros,include_file_mtime,include_file_ctime
        CCACHE_BASEDIR=${PROJECT_SOURCE_DIR} CCACHE_NOHASHDIR=1 ${TONEWRIGHT_CCACHE}
    )
    set(CMAKE_C_COMPILER_LAUNCHER ${launcher})
    set(CMAKE_CXX_COMPILER_LAUNCHER ${launcher})
    if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
        add_compile_options($<$<COMPILE_LANGUAGE:CXX>:-fpch-preprocess>)
    endif()
endif()
