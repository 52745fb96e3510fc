# cpack -G DEB, best through scripts/package.sh:
#   libtonewright0      libraries, plug-ins and companions
#   tonewright          the command line program
#   tonewright-covers   the program for graphic documents, with their module
#   libtonewright-dev   headers, link names, the library for plug-ins, documentation and examples
set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_NAME tonewright)
set(CPACK_PACKAGE_CONTACT "Tonewright maintainers <maintainers@tonewright.invalid>")
set(CPACK_PACKAGE_DIRECTORY ${PROJECT_SOURCE_DIR}/dist)
set(CPACK_STRIP_FILES ON)
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_COMPONENTS_ALL libraries program covers development)
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_ENABLE_COMPONENT_DEPENDS ON)
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)
set(CPACK_DEBIAN_PACKAGE_RELEASE 1)
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY "") # each package has a first line of its own
# The packages contain these libraries themselves; dpkg-shlibdeps finds them in the build tree.
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS_PRIVATE_DIRS ${TONEWRIGHT_LIBRARY_DIR})

set(libraries_package libtonewright${PROJECT_VERSION_MAJOR})
set(program_package tonewright)
set(covers_package tonewright-covers)
set(development_package libtonewright-dev)
foreach(component libraries program covers development)
    string(TOUPPER ${component} key)
    set(CPACK_DEBIAN_${key}_PACKAGE_NAME ${${component}_package})
    set(CPACK_DEBIAN_${key}_PACKAGE_SHLIBDEPS ON)
endforeach()
set(CPACK_DEBIAN_LIBRARIES_PACKAGE_SECTION libs)
# Loaded at the first use of a device and at the first write of a disc, so not linked.
set(CPACK_DEBIAN_LIBRARIES_PACKAGE_DEPENDS "libportaudio2, libburn4, libisofs6")
set(CPACK_DEBIAN_PROGRAM_PACKAGE_SECTION sound)
set(CPACK_DEBIAN_COVERS_PACKAGE_SECTION graphics)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SECTION libdevel)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SHLIBDEPS OFF)
set(CPACK_COMPONENT_PROGRAM_DEPENDS libraries)
set(CPACK_COMPONENT_COVERS_DEPENDS libraries)
set(CPACK_COMPONENT_DEVELOPMENT_DEPENDS libraries)
set(CPACK_COMPONENT_LIBRARIES_DESCRIPTION
    "core library of a desktop audio suite
The shared libraries, with plug-ins that read and write WAV, FLAC, Ogg Vorbis
and MP3, and the programs that the library starts."
)
set(CPACK_COMPONENT_PROGRAM_DESCRIPTION
    "converts, plays, records, mixes and tags sound files
The command line program of the Tonewright library. It reads and writes WAV,
FLAC, Ogg Vorbis and MP3, carries tags and pictures from one format to the
other, and replaces a file only by a complete one."
)
set(CPACK_COMPONENT_COVERS_DESCRIPTION
    "shows, paints and converts covers and labels of discs
The module of the Tonewright library for graphic documents, with a command
line program that paints designs as PNG, PDF and SVG and converts projects.
It needs no display."
)
set(CPACK_COMPONENT_DEVELOPMENT_DESCRIPTION
    "core library of a desktop audio suite (development files)
Headers, documentation and examples for programs that use the library and for
authors of media plug-ins."
)

if(TONEWRIGHT_PACKAGING)
    # What packages built against the libraries depend on. The C interfaces stay compatible, so each of their functions has
    # the version that introduced it; a user of the C++ libraries needs exactly the version it was built against. Not
    # CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS, which treats both alike.
    set(shlibs)
    foreach(library ${libraries})
        string(APPEND shlibs "lib${library} ${PROJECT_VERSION_MAJOR} ${libraries_package} (= ${PROJECT_VERSION}-${CPACK_DEBIAN_PACKAGE_RELEASE})\n")
    endforeach()
    foreach(library tonewright tonewright_host discio2)
        string(APPEND shlibs "lib${library} ${PROJECT_VERSION_MAJOR} ${libraries_package} (>= ${PROJECT_VERSION})\n")
    endforeach()
    file(WRITE ${PROJECT_BINARY_DIR}/shlibs "${shlibs}")
    set(symbols ${PROJECT_BINARY_DIR}/symbols)
    set(known_symbols ${PROJECT_SOURCE_DIR}/packaging/${libraries_package}.symbols)
    add_custom_command(
        OUTPUT ${symbols}
        COMMAND dpkg-gensymbols -p${libraries_package} -v${PROJECT_VERSION} -I${known_symbols} -O${symbols}
                -e$<TARGET_FILE:tonewright> -e$<TARGET_FILE:tonewright_host_support> -e$<TARGET_FILE:discio2>
        DEPENDS ${c_libraries} ${known_symbols}
        COMMENT "Versions of the exported functions"
        VERBATIM
    )
    add_custom_target(exported_symbols ALL DEPENDS ${symbols})
    set(CPACK_DEBIAN_LIBRARIES_PACKAGE_CONTROL_EXTRA ${PROJECT_SOURCE_DIR}/packaging/triggers ${PROJECT_BINARY_DIR}/shlibs ${symbols})

    foreach(component libraries covers)
        install(
            FILES ${PROJECT_SOURCE_DIR}/packaging/${${component}_package}.lintian-overrides
            DESTINATION ${CMAKE_INSTALL_DATAROOTDIR}/lintian/overrides
            RENAME ${${component}_package}
            COMPONENT ${component}
        )
    endforeach()

    # Every Debian package has a copyright file and two compressed changelogs under its own name.
    find_program(GZIP gzip REQUIRED)
    set(changelogs ${PROJECT_BINARY_DIR}/changelog.gz ${PROJECT_BINARY_DIR}/changelog.Debian.gz)
    string(TIMESTAMP date "%a, %d %b %Y %H:%M:%S +0000" UTC)
    file(
        WRITE ${PROJECT_BINARY_DIR}/changelog.Debian
        "tonewright (${PROJECT_VERSION}-${CPACK_DEBIAN_PACKAGE_RELEASE}) unstable; urgency=medium\n\n  * See changelog.gz.\n\n"
        " -- ${CPACK_PACKAGE_CONTACT}  ${date}\n"
    )
    configure_file(${PROJECT_SOURCE_DIR}/CHANGELOG.md ${PROJECT_BINARY_DIR}/changelog COPYONLY)
    foreach(name changelog changelog.Debian)
        execute_process(COMMAND ${GZIP} -9nkf ${name} WORKING_DIRECTORY ${PROJECT_BINARY_DIR} COMMAND_ERROR_IS_FATAL ANY)
    endforeach()
    foreach(component libraries program covers development)
        install(
            FILES ${PROJECT_SOURCE_DIR}/packaging/copyright ${changelogs}
            DESTINATION ${doc_dir}/${${component}_package}
            COMPONENT ${component}
        )
    endforeach()
endif()
include(CPack)
