# comgui_wxwidgets: the base library of wxWidgets as one target. Read by the build and by the installed
# package, so that a host compiles with the very flags that the library was compiled with.
#
# A program with windows of its own sets the property COMGUI_GUI on its target and finds the GUI libraries
# itself; all others see wxWidgets without its GUI.
#
# Makes the target of these libraries of wxWidgets if they are there. A function, since the host's own
# wxWidgets_... variables must stay.
function(comgui_find_wxwidgets target)    # comgui_find_wxwidgets(TARGET LIBRARY...)
    find_package(wxWidgets 3.1 QUIET COMPONENTS ${ARGN})
    if(NOT wxWidgets_FOUND)
        return()
    endif()
    add_library(${target} INTERFACE IMPORTED GLOBAL)
    target_include_directories(${target} SYSTEM INTERFACE ${wxWidgets_INCLUDE_DIRS})
    target_compile_definitions(${target} INTERFACE ${wxWidgets_DEFINITIONS}
        $<$<NOT:$<BOOL:$<TARGET_PROPERTY:COMGUI_GUI>>>:wxUSE_GUI=0>)
    target_compile_options(${target} INTERFACE ${wxWidgets_CXX_FLAGS})
    target_link_directories(${target} INTERFACE ${wxWidgets_LIBRARY_DIRS})
    target_link_libraries(${target} INTERFACE ${wxWidgets_LIBRARIES})
endfunction()

if(NOT TARGET comgui_wxwidgets)
    comgui_find_wxwidgets(comgui_wxwidgets base)
endif()
if(TARGET comgui_wxwidgets AND NOT COMGUI_WXWIDGETS_LINKS)
    unset(COMGUI_WXWIDGETS_LINKS CACHE)
    try_compile(COMGUI_WXWIDGETS_LINKS ${CMAKE_CURRENT_BINARY_DIR}/comgui-wxwidgets-check
        ${CMAKE_CURRENT_LIST_DIR}/ComGUIWxWidgets-check.cpp LINK_LIBRARIES comgui_wxwidgets)
endif()
# The installed package reports both in the host's own words of find_package.
if(NOT CMAKE_FIND_PACKAGE_NAME STREQUAL "comgui")
    if(NOT TARGET comgui_wxwidgets)
        message(FATAL_ERROR "wxWidgets 3.1 or later was not found (wx-config base): run scripts/setup")
    elseif(NOT COMGUI_WXWIDGETS_LINKS)
        message(FATAL_ERROR "a program with this wxWidgets does not link: was it built with another C++ standard library?")
    endif()
endif()
