# comgui_wxwidgets: the base library of wxWidgets as one target. Read by the build and by the installed
# package, so that a host compiles with the very flags that the library was compiled with.
#
# A program with windows of its own sets the property COMGUI_GUI on its target and finds the GUI libraries
# itself; all others see wxWidgets without its GUI.
function(comgui_find_wxwidgets)    # a function, since the host's own wxWidgets_... variables must stay
    find_package(wxWidgets 3.1 QUIET COMPONENTS base)
    if(NOT wxWidgets_FOUND)
        return()
    endif()
    add_library(comgui_wxwidgets INTERFACE IMPORTED GLOBAL)
    target_include_directories(comgui_wxwidgets SYSTEM INTERFACE ${wxWidgets_INCLUDE_DIRS})
    target_compile_definitions(comgui_wxwidgets INTERFACE ${wxWidgets_DEFINITIONS}
        $<$<NOT:$<BOOL:$<TARGET_PROPERTY:COMGUI_GUI>>>:wxUSE_GUI=0>)
    target_compile_options(comgui_wxwidgets INTERFACE ${wxWidgets_CXX_FLAGS})
    target_link_directories(comgui_wxwidgets INTERFACE ${wxWidgets_LIBRARY_DIRS})
    target_link_libraries(comgui_wxwidgets INTERFACE ${wxWidgets_LIBRARIES})
endfunction()

if(NOT TARGET comgui_wxwidgets)
    comgui_find_wxwidgets()
endif()
# The installed package reports this in the host's own words of find_package.
if(NOT TARGET comgui_wxwidgets AND NOT CMAKE_FIND_PACKAGE_NAME STREQUAL "comgui")
    message(FATAL_ERROR "wxWidgets 3.1 or later was not found (wx-config base): run scripts/setup")
endif()
