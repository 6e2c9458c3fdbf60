# Catalogues of translated texts: the .po files of a folder po become share/locale/LANGUAGE/LC_MESSAGES/DOMAIN.mo, in the
# build as in the installation, so that a program finds them from its own place in both.
find_package(Gettext QUIET)
if(NOT GETTEXT_MSGFMT_EXECUTABLE)
    message(STATUS "No msgfmt: all texts are English only; Debian's package gettext has it")
endif()

# comgui_catalogues(DOMAIN): makes DOMAIN_catalogues of the folder po beside the caller, where there is msgfmt.
function(comgui_catalogues domain)
    if(NOT GETTEXT_MSGFMT_EXECUTABLE)
        return()
    endif()
    set(catalogues)
    foreach(language de fr ja)
        set(source ${CMAKE_CURRENT_SOURCE_DIR}/po/${language}.po)
        set(folder ${language}/LC_MESSAGES)
        set(catalogue ${PROJECT_BINARY_DIR}/share/locale/${folder}/${domain}.mo)
        add_custom_command(OUTPUT ${catalogue} DEPENDS ${source} VERBATIM
            COMMAND ${CMAKE_COMMAND} -E make_directory ${PROJECT_BINARY_DIR}/share/locale/${folder}
            COMMAND ${GETTEXT_MSGFMT_EXECUTABLE} --check --check-accelerators=& -o ${catalogue} ${source})
        install(FILES ${catalogue} DESTINATION ${CMAKE_INSTALL_LOCALEDIR}/${folder})
        list(APPEND catalogues ${catalogue})
    endforeach()
    add_custom_target(${domain}_catalogues ALL DEPENDS ${catalogues})
endfunction()
