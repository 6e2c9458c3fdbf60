# comgui_shared_library(TARGET): a shared library that is installed. Before 1.0.0 every minor version may
# break its users, so its file name has two numbers.
#
# It exports the names in the exports.txt of its folder, and no others. Hidden visibility alone does not achieve
# that: templates of the standard library and inline functions of wxWidgets are declared as visible, so each
# compiler would export those that it happened to emit. The names are C++ names, one list for all compilers. They
# carry a version, so that two minor versions can be loaded into one process.
function(comgui_shared_library target)
    add_library(${target} SHARED)
    comgui_own_target(${target})
    set_target_properties(${target} PROPERTIES VERSION ${PROJECT_VERSION}
        SOVERSION ${PROJECT_VERSION_MAJOR}.${PROJECT_VERSION_MINOR} VERIFY_INTERFACE_HEADER_SETS ON)
    if(APPLE)
        return()    # its linker has no version scripts; hidden visibility must do
    endif()
    set(list ${CMAKE_CURRENT_SOURCE_DIR}/exports.txt)
    set(script ${CMAKE_CURRENT_BINARY_DIR}/${target}.exports)
    file(READ ${list} names)
    string(REGEX REPLACE "([^\n]+)\n" "    \"\\1\";\n" names "${names}")
    file(CONFIGURE OUTPUT ${script} @ONLY CONTENT
"COMGUI_@PROJECT_VERSION_MAJOR@.@PROJECT_VERSION_MINOR@ {
  global: extern \"C++\" {
@names@  };
  local: *;
};
")
    target_link_options(${target} PRIVATE LINKER:--version-script,${script})
    set_property(TARGET ${target} APPEND PROPERTY LINK_DEPENDS ${script})
    set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS ${list})
endfunction()
