# Installation: libraries in lib, plug-ins in lib/tonewright, companions in libexec/tonewright, headers in
# include/tonewright, documentation in share/doc/tonewright, manual pages and completions, pkg-config files and a CMake
# package.
#
# Libraries that plug-ins and C++ hosts link (peru, peru_media, sonora2, filetag) are public and have a soname in lib. The
# others are installed next to the plug-ins, where only the front library finds them.
include(CMakePackageConfigHelpers)
include(PublicHeaders)

set(include_dir ${CMAKE_INSTALL_INCLUDEDIR}/tonewright)
set(package_dir ${CMAKE_INSTALL_LIBDIR}/cmake/Tonewright)
set(doc_dir ${CMAKE_INSTALL_DATAROOTDIR}/doc)

get_property(libraries GLOBAL PROPERTY TONEWRIGHT_LIBRARIES)
get_property(internal_libraries GLOBAL PROPERTY TONEWRIGHT_INTERNAL_LIBRARIES)
get_property(plugins GLOBAL PROPERTY TONEWRIGHT_PLUGINS)
get_property(descriptions GLOBAL PROPERTY TONEWRIGHT_PLUGIN_DESCRIPTIONS)
get_property(companions GLOBAL PROPERTY TONEWRIGHT_COMPANIONS)

set(c_libraries tonewright tonewright_host_support discio2)
list(REMOVE_ITEM libraries ${c_libraries})
foreach(library ${libraries})
    target_include_directories(${library} INTERFACE $<INSTALL_INTERFACE:${include_dir}>)
endforeach()
foreach(library ${c_libraries})
    target_include_directories(${library} INTERFACE $<INSTALL_INTERFACE:${CMAKE_INSTALL_INCLUDEDIR}>)
endforeach()
target_include_directories(plugin_support INTERFACE $<INSTALL_INTERFACE:${include_dir}/plugin>)

install(
    TARGETS ${c_libraries} ${libraries}
    EXPORT tonewright-targets
    LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT libraries NAMELINK_COMPONENT development
)
if(internal_libraries)
    install(
        TARGETS ${internal_libraries}
        EXPORT tonewright-targets
        LIBRARY DESTINATION ${TONEWRIGHT_PLUGIN_FOLDER} COMPONENT libraries NAMELINK_SKIP
    )
endif()
install(TARGETS ${plugins} LIBRARY DESTINATION ${TONEWRIGHT_PLUGIN_FOLDER} COMPONENT libraries)
install(FILES ${descriptions} DESTINATION ${TONEWRIGHT_PLUGIN_FOLDER} COMPONENT libraries)
install(TARGETS ${companions} RUNTIME DESTINATION ${TONEWRIGHT_COMPANION_FOLDER} COMPONENT libraries)
install(TARGETS tonewright_host RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT program)
# Apart from the others, whose packages would otherwise depend on the user interface toolkit.
install(TARGETS tonewright_covereditor LIBRARY DESTINATION ${TONEWRIGHT_PLUGIN_FOLDER} COMPONENT covers)
install(TARGETS tonewright_covers RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT covers)
install(
    FILES ${PROJECT_SOURCE_DIR}/docs/covers.md ${PROJECT_SOURCE_DIR}/docs/project.xsd ${PROJECT_SOURCE_DIR}/docs/examples/showcase.py
    DESTINATION ${doc_dir}/tonewright-covers
    COMPONENT covers
)
install(
    TARGETS plugin_support
    EXPORT tonewright-plugin-support-targets
    ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT development
)

install(DIRECTORY ${PROJECT_SOURCE_DIR}/include/tonewright DESTINATION ${CMAKE_INSTALL_INCLUDEDIR} COMPONENT development)
function(install_headers from to)
    foreach(header ${ARGN})
        get_filename_component(folder ${header} DIRECTORY)
        install(FILES ${PROJECT_SOURCE_DIR}/${from}/${header} DESTINATION ${to}/${folder} COMPONENT development)
    endforeach()
endfunction()
install_headers(src ${include_dir} ${TONEWRIGHT_PUBLIC_HEADERS})
# A folder of its own: "support/..." is too common a name for the include path of every host.
install_headers(plugins ${include_dir}/plugin ${TONEWRIGHT_PLUGIN_HEADERS})

# Written during installation, since --prefix may name another place than the one configured.
install(
    CODE "set(PROJECT_VERSION \"${PROJECT_VERSION}\")
set(PROJECT_DESCRIPTION \"${PROJECT_DESCRIPTION}\")
set(LIBDIR \"${CMAKE_INSTALL_LIBDIR}\")
set(INCLUDEDIR \"${CMAKE_INSTALL_INCLUDEDIR}\")
foreach(NAME tonewright tonewright-host)
    set(LIBS -ltonewright)
    if(NAME STREQUAL tonewright-host)
        set(LIBS \"-ltonewright_host -ltonewright\")
    endif()
    configure_file(\"${PROJECT_SOURCE_DIR}/cmake/tonewright.pc.in\" \"${PROJECT_BINARY_DIR}/\${NAME}.pc\" @ONLY)
endforeach()"
    COMPONENT development
)
install(FILES ${PROJECT_BINARY_DIR}/tonewright.pc ${PROJECT_BINARY_DIR}/tonewright-host.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig COMPONENT development)

foreach(set tonewright-targets tonewright-plugin-support-targets)
    install(EXPORT ${set} NAMESPACE tonewright:: DESTINATION ${package_dir} COMPONENT development)
endforeach()
configure_package_config_file(
    ${PROJECT_SOURCE_DIR}/cmake/TonewrightConfig.cmake.in ${PROJECT_BINARY_DIR}/TonewrightConfig.cmake
    INSTALL_DESTINATION ${package_dir}
)
write_basic_package_version_file(
    ${PROJECT_BINARY_DIR}/TonewrightConfigVersion.cmake COMPATIBILITY SameMinorVersion
)
install(
    FILES ${PROJECT_BINARY_DIR}/TonewrightConfig.cmake ${PROJECT_BINARY_DIR}/TonewrightConfigVersion.cmake
          ${PROJECT_SOURCE_DIR}/cmake/TonewrightPlugin.cmake
    DESTINATION ${package_dir}
    COMPONENT development
)

install(
    FILES ${PROJECT_SOURCE_DIR}/README.md ${PROJECT_SOURCE_DIR}/CHANGELOG.md ${PROJECT_SOURCE_DIR}/packaging/copyright
    DESTINATION ${doc_dir}/tonewright
    COMPONENT program
)
install(
    DIRECTORY ${PROJECT_SOURCE_DIR}/docs
    DESTINATION ${doc_dir}/tonewright
    COMPONENT development
    PATTERN Doxyfile EXCLUDE
)

include(Pages)
if(PROJECT_IS_TOP_LEVEL)
    include(Packages)
endif()
