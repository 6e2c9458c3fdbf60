# comgui_add_module(TARGET FACTORY function [BUNDLE folder] [NAME name] [UUID uuid] SOURCES file...)
#
# Builds a communication plug-in, a bundle as hosts load it: folder/Contents with an Info.plist that names the
# factory, and the executable beside it. TARGET is the executable, to be linked with what it needs.
#
#   FACTORY   the exported function that COMGUI_PLUGIN defines; nothing else is exported
#   BUNDLE    the bundle's folder, ${CMAKE_CURRENT_BINARY_DIR}/ComGUI.Bundle unless given; hosts look for that name
#   NAME      of the executable, TARGET unless given
#   UUID      of the factory, in capitals; made from TARGET unless given. No two plug-ins may share one.
set(COMGUI_MODULE_TEMPLATES ${CMAKE_CURRENT_LIST_DIR})

function(comgui_add_module target)
    cmake_parse_arguments(PARSE_ARGV 1 COMGUI_MODULE "" "FACTORY;BUNDLE;NAME;UUID" "SOURCES")
    if(NOT COMGUI_MODULE_FACTORY OR NOT COMGUI_MODULE_SOURCES OR COMGUI_MODULE_UNPARSED_ARGUMENTS)
        message(FATAL_ERROR
            "comgui_add_module(${target}): FACTORY and SOURCES are needed, unknown is '${COMGUI_MODULE_UNPARSED_ARGUMENTS}'")
    endif()
    if(NOT COMGUI_MODULE_BUNDLE)
        set(COMGUI_MODULE_BUNDLE ${CMAKE_CURRENT_BINARY_DIR}/ComGUI.Bundle)
    endif()
    if(NOT COMGUI_MODULE_NAME)
        set(COMGUI_MODULE_NAME ${target})
    endif()
    if(NOT COMGUI_MODULE_UUID)
        string(UUID COMGUI_MODULE_UUID NAMESPACE 5CDEF0B8-6CFC-11D8-A365-003065B1346E NAME ${target} TYPE SHA1 UPPER)
    endif()

    add_library(${target} MODULE ${COMGUI_MODULE_SOURCES})
    set_target_properties(${target} PROPERTIES PREFIX "" SUFFIX "" OUTPUT_NAME ${COMGUI_MODULE_NAME}
        CXX_VISIBILITY_PRESET hidden VISIBILITY_INLINES_HIDDEN ON)
    if(APPLE)
        set_target_properties(${target} PROPERTIES LIBRARY_OUTPUT_DIRECTORY ${COMGUI_MODULE_BUNDLE}/Contents/MacOS)
        target_link_options(${target} PRIVATE LINKER:-exported_symbol,_${COMGUI_MODULE_FACTORY})
    else()
        set(exports ${CMAKE_CURRENT_BINARY_DIR}/${target}.exports)
        file(CONFIGURE OUTPUT ${exports} CONTENT "{ global: @COMGUI_MODULE_FACTORY@; local: *; };\n" @ONLY)
        set_target_properties(${target} PROPERTIES LINK_DEPENDS ${exports}
            LIBRARY_OUTPUT_DIRECTORY ${COMGUI_MODULE_BUNDLE}/Contents/Linux)
        target_link_options(${target} PRIVATE LINKER:--version-script,${exports}
            LINKER:-z,nodelete)    # its threads outlive every dlclose
    endif()
    configure_file(${COMGUI_MODULE_TEMPLATES}/ComGUIModule.plist.in ${COMGUI_MODULE_BUNDLE}/Contents/Info.plist @ONLY)
endfunction()
