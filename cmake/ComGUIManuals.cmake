# Manual pages and completion for the programs that are installed. Pages are made where help2man is found.
foreach(program IN LISTS comgui_programs)
    install(FILES ${PROJECT_SOURCE_DIR}/tools/bash-completion
        DESTINATION ${CMAKE_INSTALL_DATADIR}/bash-completion/completions RENAME ${program})
endforeach()

find_program(COMGUI_HELP2MAN help2man)
if(COMGUI_HELP2MAN AND comgui_programs AND NOT COMGUI_SANITIZE)
    set(comgui_pages ${PROJECT_BINARY_DIR}/man1)
    set(comgui_program_files)
    foreach(program IN LISTS comgui_programs)
        list(APPEND comgui_program_files $<TARGET_FILE:${program}>)
    endforeach()
    add_custom_command(OUTPUT ${comgui_pages}.made
        COMMAND ${PROJECT_SOURCE_DIR}/tools/manual-pages ${comgui_pages} ${PROJECT_VERSION} ${comgui_program_files}
        COMMAND ${CMAKE_COMMAND} -E touch ${comgui_pages}.made
        DEPENDS ${comgui_programs} ${PROJECT_SOURCE_DIR}/tools/manual-pages
        COMMENT "Writing the manual pages" VERBATIM)
    add_custom_target(comgui_manual_pages ALL DEPENDS ${comgui_pages}.made)
    install(DIRECTORY ${comgui_pages} DESTINATION ${CMAKE_INSTALL_MANDIR})
endif()
