# comgui_wxwidgets: the base library of wxWidgets as one target. Read by the build and by the installed
# package, so that a host compiles with the very flags that the library was compiled with.
if(NOT TARGET comgui_wxwidgets)
    find_package(wxWidgets 3.1 QUIET COMPONENTS base)
    if(wxWidgets_FOUND)
        add_library(comgui_wxwidgets INTERFACE IMPORTED GLOBAL)
        target_include_directories(comgui_wxwidgets SYSTEM INTERFACE ${wxWidgets_INCLUDE_DIRS})
        target_compile_definitions(comgui_wxwidgets INTERFACE ${wxWidgets_DEFINITIONS} wxUSE_GUI=0)
        target_compile_options(comgui_wxwidgets INTERFACE ${wxWidgets_CXX_FLAGS})
        target_link_directories(comgui_wxwidgets INTERFACE ${wxWidgets_LIBRARY_DIRS})
        target_link_libraries(comgui_wxwidgets INTERFACE ${wxWidgets_LIBRARIES})
    endif()
endif()
