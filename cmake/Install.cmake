# Installation: libraries in lib, plug-ins in lib/tonewright, companions in libexec/tonewright, headers in
# include/tonewright, a pkg-config file and a CMake package.
include(CMakePackageConfigHelpers)

if(NOT TARGET tonewright)
    return()
endif()

install(
    TARGETS tonewright
    EXPORT tonewright-targets
    LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT runtime NAMELINK_COMPONENT development
    INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}
)
install(
    TARGETS peru peru_media sonora2 filetag zvr_lang
    EXPORT tonewright-targets
    LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT runtime NAMELINK_COMPONENT development
    INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/tonewright
)
get_property(plugins GLOBAL PROPERTY TONEWRIGHT_PLUGINS)
if(plugins)
    install(TARGETS ${plugins} LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}/tonewright COMPONENT runtime)
endif()
get_property(companions GLOBAL PROPERTY TONEWRIGHT_COMPANIONS)
if(companions)
    install(TARGETS ${companions} RUNTIME DESTINATION ${CMAKE_INSTALL_LIBEXECDIR}/tonewright COMPONENT runtime)
endif()
if(TARGET tonewright_host)
    install(TARGETS tonewright_host RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT runtime)
endif()

install(
    DIRECTORY ${CMAKE_SOURCE_DIR}/include/tonewright
    DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}
    COMPONENT development
)
# C++ hosts and plug-ins include "peru/...", "sonora2/..." and "filetag/..." from this directory.
foreach(library peru sonora2 filetag)
    install(
        DIRECTORY ${CMAKE_SOURCE_DIR}/src/${library}
        DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/tonewright
        COMPONENT development
        FILES_MATCHING PATTERN "*.h" PATTERN "posix" EXCLUDE
    )
endforeach()

file(RELATIVE_PATH TONEWRIGHT_PC_TO_PREFIX /prefix/${CMAKE_INSTALL_LIBDIR}/pkgconfig /prefix)
configure_file(cmake/tonewright.pc.in tonewright.pc @ONLY)
install(
    FILES ${CMAKE_BINARY_DIR}/tonewright.pc
    DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig
    COMPONENT development
)

set(package_dir ${CMAKE_INSTALL_LIBDIR}/cmake/Tonewright)
install(
    EXPORT tonewright-targets
    NAMESPACE tonewright::
    DESTINATION ${package_dir}
    COMPONENT development
)
configure_package_config_file(cmake/TonewrightConfig.cmake.in TonewrightConfig.cmake INSTALL_DESTINATION ${package_dir})
write_basic_package_version_file(TonewrightConfigVersion.cmake COMPATIBILITY SameMinorVersion)
install(
    FILES ${CMAKE_BINARY_DIR}/TonewrightConfig.cmake ${CMAKE_BINARY_DIR}/TonewrightConfigVersion.cmake
    DESTINATION ${package_dir}
    COMPONENT development
)

# cpack -G DEB: tonewright (libraries, plug-ins, program) and tonewright-dev (headers, link names).
set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_NAME tonewright)
set(CPACK_PACKAGE_CONTACT "Tonewright maintainers <maintainers@tonewright.invalid>")
set(CPACK_PACKAGE_DIRECTORY ${CMAKE_SOURCE_DIR}/dist)
set(CPACK_STRIP_FILES ON)
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_COMPONENTS_ALL runtime development)
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_ENABLE_COMPONENT_DEPENDS ON)
set(CPACK_DEBIAN_RUNTIME_PACKAGE_NAME tonewright)
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SECTION sound)
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SHLIBDEPS ON)
# The package contains these libraries itself; dpkg-shlibdeps finds them in the build tree.
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS_PRIVATE_DIRS ${TONEWRIGHT_LIBRARY_DIR})
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_NAME tonewright-dev)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SECTION libdevel)
set(CPACK_COMPONENT_RUNTIME_DESCRIPTION "${PROJECT_DESCRIPTION}: libraries, plug-ins and the command line program")
set(CPACK_COMPONENT_DEVELOPMENT_DESCRIPTION "${PROJECT_DESCRIPTION}: headers")
set(CPACK_COMPONENT_DEVELOPMENT_DEPENDS runtime)
include(CPack)
