# Manual pages and shell completions, made from the built program's own --help. Needs Python; an instrumented program has no
# use for them, and a cross-compiled one does not run.
find_package(Python3 COMPONENTS Interpreter)
if(TONEWRIGHT_SANITIZERS OR TONEWRIGHT_COVERAGE OR CMAKE_CROSSCOMPILING OR NOT Python3_FOUND)
    message(STATUS "Manual pages and completions are not built")
    return()
endif()

set(pages ${PROJECT_BINARY_DIR}/pages)
set(compress $<$<BOOL:${TONEWRIGHT_PACKAGING}>:--compress>) # Debian's policy
add_custom_command(
    OUTPUT ${pages}.stamp
    COMMAND ${Python3_EXECUTABLE} ${PROJECT_SOURCE_DIR}/packaging/pages.py $<TARGET_FILE:tonewright_host> ${PROJECT_VERSION} ${pages} ${compress}
    COMMAND ${CMAKE_COMMAND} -E touch ${pages}.stamp
    DEPENDS tonewright_host ${PROJECT_SOURCE_DIR}/packaging/pages.py
    COMMENT "Manual pages and completions"
    VERBATIM
)
add_custom_target(tonewright_pages ALL DEPENDS ${pages}.stamp)

# Debian's zsh searches site-functions below /usr/local only.
set(zsh_folder $<IF:$<BOOL:${TONEWRIGHT_PACKAGING}>,vendor-completions,site-functions>)
install(DIRECTORY ${pages}/man1 DESTINATION ${CMAKE_INSTALL_MANDIR} COMPONENT program)
install(FILES ${pages}/tonewright DESTINATION ${CMAKE_INSTALL_DATAROOTDIR}/bash-completion/completions COMPONENT program)
install(FILES ${pages}/_tonewright DESTINATION ${CMAKE_INSTALL_DATAROOTDIR}/zsh/${zsh_folder} COMPONENT program)
install(FILES ${pages}/tonewright.fish DESTINATION ${CMAKE_INSTALL_DATAROOTDIR}/fish/vendor_completions.d COMPONENT program)
