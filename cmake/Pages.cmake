# Manual pages and shell completions, made from the built program's own --help. Needs Python; an instrumented program has no
# use for them, and a cross-compiled one does not run.
find_package(Python3 COMPONENTS Interpreter)
if(TONEWRIGHT_SANITIZERS OR TONEWRIGHT_COVERAGE OR CMAKE_CROSSCOMPILING OR NOT Python3_FOUND)
    message(STATUS "Manual pages and completions are not built")
    return()
endif()

set(compress $<$<BOOL:${TONEWRIGHT_PACKAGING}>:--compress>) # Debian's policy
# Debian's zsh searches site-functions below /usr/local only.
set(zsh_folder $<IF:$<BOOL:${TONEWRIGHT_PACKAGING}>,vendor-completions,site-functions>)

# install_pages(TARGET NAME COMPONENT): the pages and completions of a program.
function(install_pages target name component)
    set(pages ${PROJECT_BINARY_DIR}/pages-${name})
    add_custom_command(
        OUTPUT ${pages}.stamp
        COMMAND ${Python3_EXECUTABLE} ${PROJECT_SOURCE_DIR}/packaging/pages.py $<TARGET_FILE:${target}> ${PROJECT_VERSION} ${pages} ${compress}
        COMMAND ${CMAKE_COMMAND} -E touch ${pages}.stamp
        DEPENDS ${target} ${PROJECT_SOURCE_DIR}/packaging/pages.py
        COMMENT "Manual pages and completions of ${name}"
        VERBATIM
    )
    add_custom_target(${target}_pages ALL DEPENDS ${pages}.stamp)
    install(DIRECTORY ${pages}/man1 DESTINATION ${CMAKE_INSTALL_MANDIR} COMPONENT ${component})
    install(FILES ${pages}/${name} DESTINATION ${CMAKE_INSTALL_DATAROOTDIR}/bash-completion/completions COMPONENT ${component})
    install(FILES ${pages}/_${name} DESTINATION ${CMAKE_INSTALL_DATAROOTDIR}/zsh/${zsh_folder} COMPONENT ${component})
    install(FILES ${pages}/${name}.fish DESTINATION ${CMAKE_INSTALL_DATAROOTDIR}/fish/vendor_completions.d COMPONENT ${component})
endfunction()

install_pages(tonewright_host tonewright program)
install_pages(tonewright_covers tonewright-covers covers)
