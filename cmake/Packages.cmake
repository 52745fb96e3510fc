# cpack -G DEB, best through scripts/package.sh:
#   libtonewright0      libraries, plug-ins and companions
#   tonewright          the command line program
#   libtonewright-dev   headers, link names, the library for plug-ins, documentation and examples
set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_NAME tonewright)
set(CPACK_PACKAGE_CONTACT "Tonewright maintainers <maintainers@tonewright.invalid>")
set(CPACK_PACKAGE_DIRECTORY ${PROJECT_SOURCE_DIR}/dist)
set(CPACK_STRIP_FILES ON)
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_COMPONENTS_ALL libraries program development)
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_ENABLE_COMPONENT_DEPENDS ON)
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS ON) # dependencies of other packages on the libraries
set(CPACK_DEBIAN_PACKAGE_RELEASE 1)
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY "") # each package has a first line of its own
# The packages contain these libraries themselves; dpkg-shlibdeps finds them in the build tree.
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS_PRIVATE_DIRS ${TONEWRIGHT_LIBRARY_DIR})

set(libraries_package libtonewright${PROJECT_VERSION_MAJOR})
set(program_package tonewright)
set(development_package libtonewright-dev)
foreach(component libraries program development)
    string(TOUPPER ${component} key)
    set(CPACK_DEBIAN_${key}_PACKAGE_NAME ${${component}_package})
    set(CPACK_DEBIAN_${key}_PACKAGE_SHLIBDEPS ON)
endforeach()
set(CPACK_DEBIAN_LIBRARIES_PACKAGE_SECTION libs)
set(CPACK_DEBIAN_LIBRARIES_PACKAGE_DEPENDS "libportaudio2") # loaded at the first use of a device, so not linked
set(CPACK_DEBIAN_PROGRAM_PACKAGE_SECTION sound)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SECTION libdevel)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SHLIBDEPS OFF)
set(CPACK_DEBIAN_LIBRARIES_PACKAGE_CONTROL_EXTRA ${PROJECT_SOURCE_DIR}/packaging/triggers)
set(CPACK_COMPONENT_PROGRAM_DEPENDS libraries)
set(CPACK_COMPONENT_DEVELOPMENT_DEPENDS libraries)
set(CPACK_COMPONENT_LIBRARIES_DESCRIPTION
    "core library of a desktop audio suite
The shared libraries, with plug-ins that read and write WAV, FLAC, Ogg Vorbis
and MP3, and the programs that the library starts."
)
set(CPACK_COMPONENT_PROGRAM_DESCRIPTION
    "converts, plays, records, mixes and tags sound files
The command line program of the Tonewright library."
)
set(CPACK_COMPONENT_DEVELOPMENT_DESCRIPTION
    "core library of a desktop audio suite (development files)
Headers, documentation and examples for programs that use the library and for
authors of media plug-ins."
)

# Every Debian package has a copyright file and two compressed changelogs under its own name.
if(TONEWRIGHT_PACKAGING)
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
    foreach(component libraries program development)
        install(
            FILES ${PROJECT_SOURCE_DIR}/packaging/copyright ${changelogs}
            DESTINATION ${doc_dir}/${${component}_package}
            COMPONENT ${component}
        )
    endforeach()
endif()
include(CPack)
