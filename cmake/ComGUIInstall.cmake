# What is installed and where: libraries and the plug-in bundle side by side, headers as in the tree, a
# CMake package and pkg-config files. Nothing of it names the prefix, so the installed tree may be moved.
include(CMakePackageConfigHelpers)
include(CheckTypeSize)
include(CheckCXXSourceCompiles)

set(COMGUI_PACKAGE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/comgui)
set(COMGUI_BUNDLE_DIR ${CMAKE_INSTALL_LIBDIR}/ComGUI.Bundle)

if(APPLE)
    set(comgui_beside @loader_path)
else()
    set(comgui_beside $ORIGIN)
endif()

set_target_properties(comgui comgui_client comgui_host comgui_testing PROPERTIES INSTALL_RPATH ${comgui_beside})
set_target_properties(comgui_host PROPERTIES EXPORT_NAME host)
set_target_properties(comgui_corefoundation PROPERTIES INSTALL_RPATH ${comgui_beside} EXPORT_NAME corefoundation)
set_target_properties(comgui_module PROPERTIES INSTALL_RPATH ${comgui_beside}/../../..)

install(TARGETS comgui comgui_host comgui_module_kit comgui_fakes comgui_testing comgui_contracts EXPORT comgui-targets
    LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR} FILE_SET HEADERS)
# An export of its own, since the kit may be packaged apart.
install(TARGETS comgui_client EXPORT comgui-client-targets LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} FILE_SET HEADERS)
if(APPLE)
    install(TARGETS comgui_corefoundation EXPORT comgui-targets)    # no more than the system's own
else()
    # In a folder of its own: a system that has a CoreFoundation must not find this one by accident.
    install(TARGETS comgui_corefoundation EXPORT comgui-targets
        LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
        FILE_SET HEADERS DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/comgui-corefoundation)
endif()

get_target_property(comgui_built_module comgui_module LIBRARY_OUTPUT_DIRECTORY)
cmake_path(GET comgui_built_module FILENAME comgui_system)    # Linux or MacOS
install(TARGETS comgui_module LIBRARY DESTINATION ${COMGUI_BUNDLE_DIR}/Contents/${comgui_system})
install(DIRECTORY ${PROJECT_BINARY_DIR}/lib/ComGUI.Bundle/ DESTINATION ${COMGUI_BUNDLE_DIR}
    PATTERN Contents/${comgui_system} EXCLUDE)

# The trace: its bundle, and what loads it into programs.
set_target_properties(comgui_trace_module PROPERTIES INSTALL_RPATH ${comgui_beside}/../../..)
install(TARGETS comgui_trace_module
    LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}/ComGUI-Trace.Bundle/Contents/${comgui_system})
install(FILES ${PROJECT_BINARY_DIR}/lib/ComGUI-Trace.Bundle/Contents/Info.plist
    DESTINATION ${CMAKE_INSTALL_LIBDIR}/ComGUI-Trace.Bundle/Contents)
if(TARGET comgui_trace_start)
    install(TARGETS comgui_trace_start
        LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}/ComGUI-Trace.Bundle/Contents/${comgui_system})
endif()

# The programs.
file(RELATIVE_PATH comgui_libraries ${CMAKE_INSTALL_FULL_BINDIR} ${CMAKE_INSTALL_FULL_LIBDIR})
set(comgui_programs)
foreach(program ticketstream comgui_site comgui_validate comgui_trace ticket_desk)
    if(TARGET ${program})
        list(APPEND comgui_programs ${program})
        set_target_properties(${program} PROPERTIES INSTALL_RPATH ${comgui_beside}/${comgui_libraries})
        install(TARGETS ${program} RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
    endif()
endforeach()

# What a consumer's wxWidgets and standard library must have in common with those of this build.
function(comgui_describe_build)
    set(CMAKE_REQUIRED_LIBRARIES comgui_wxwidgets)
    set(CMAKE_EXTRA_INCLUDE_FILES wx/string.h)
    check_type_size(wxString COMGUI_SIZEOF_WXSTRING LANGUAGE CXX)
    set(sizes)
    set(CMAKE_EXTRA_INCLUDE_FILES string vector list set map)
    foreach(container "std::string" "std::vector<int>" "std::list<int>" "std::set<std::string>"
            "std::map<std::string, int>")
        string(MAKE_C_IDENTIFIER "COMGUI_SIZEOF_${container}" variable)
        check_type_size("${container}" ${variable} LANGUAGE CXX)
        list(APPEND sizes ${${variable}})
    endforeach()
    list(JOIN sizes ", " sizes)
    set(COMGUI_CONTAINER_SIZES ${sizes} PARENT_SCOPE)
    check_cxx_source_compiles("#include <string>\n#ifndef _LIBCPP_VERSION\n#error\n#endif\nint main() {}"
        COMGUI_USES_LIBCPP)
    if(COMGUI_USES_LIBCPP)
        set(COMGUI_STANDARD_LIBRARY libc++ PARENT_SCOPE)
    else()
        set(COMGUI_STANDARD_LIBRARY libstdc++ PARENT_SCOPE)
    endif()
    get_target_property(folders comgui_wxwidgets INTERFACE_INCLUDE_DIRECTORIES)
    find_file(COMGUI_WX_VERSION_H wx/version.h PATHS ${folders} NO_DEFAULT_PATH REQUIRED)
    foreach(part MAJOR MINOR)
        file(STRINGS ${COMGUI_WX_VERSION_H} line REGEX "define +wx${part}_(VERSION|NUMBER)")
        string(REGEX MATCH "[0-9]+$" number "${line}")
        set(COMGUI_WX_${part} ${number} PARENT_SCOPE)
    endforeach()
endfunction()
comgui_describe_build()

configure_file(${PROJECT_SOURCE_DIR}/cmake/comgui-config.cmake.in ${PROJECT_BINARY_DIR}/comgui-config.cmake @ONLY)
configure_file(${PROJECT_SOURCE_DIR}/cmake/comgui-check.cpp.in ${PROJECT_BINARY_DIR}/comgui-check.cpp @ONLY)
write_basic_package_version_file(${PROJECT_BINARY_DIR}/comgui-config-version.cmake
    COMPATIBILITY SameMinorVersion)    # before 1.0.0 every minor version may break
install(FILES ${PROJECT_BINARY_DIR}/comgui-config.cmake ${PROJECT_BINARY_DIR}/comgui-config-version.cmake
    ${PROJECT_BINARY_DIR}/comgui-check.cpp ${PROJECT_SOURCE_DIR}/cmake/ComGUIWxWidgets.cmake
    ${PROJECT_SOURCE_DIR}/cmake/ComGUIWxWidgets-check.cpp
    ${PROJECT_SOURCE_DIR}/cmake/ComGUIModule.cmake ${PROJECT_SOURCE_DIR}/cmake/ComGUIModule.plist.in
    DESTINATION ${COMGUI_PACKAGE_DIR})
foreach(export comgui-targets comgui-client-targets)
    install(EXPORT ${export} NAMESPACE comgui:: DESTINATION ${COMGUI_PACKAGE_DIR})
endforeach()

# wxWidgets has no pkg-config file that these could require, so they carry its flags: all but wxUSE_GUI, which
# depends on whether the program has windows.
function(comgui_pkg_config name wxwidgets)
    get_target_property(folders ${wxwidgets} INTERFACE_INCLUDE_DIRECTORIES)
    get_target_property(definitions ${wxwidgets} INTERFACE_COMPILE_DEFINITIONS)
    get_target_property(options ${wxwidgets} INTERFACE_COMPILE_OPTIONS)
    get_target_property(libraries ${wxwidgets} INTERFACE_LINK_LIBRARIES)
    list(FILTER definitions EXCLUDE REGEX "wxUSE_GUI")
    list(TRANSFORM folders PREPEND "-isystem ")
    list(TRANSFORM definitions PREPEND "-D")
    list(REMOVE_ITEM libraries "")
    list(JOIN folders " " folders)
    list(JOIN definitions " " definitions)
    list(JOIN libraries " " COMGUI_PC_LIBS)
    set(COMGUI_PC_CFLAGS "${folders} ${definitions} ${options}")
    file(RELATIVE_PATH COMGUI_PC_PREFIX ${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig ${CMAKE_INSTALL_PREFIX})
    string(REGEX REPLACE "/$" "" COMGUI_PC_PREFIX ${COMGUI_PC_PREFIX})
    file(RELATIVE_PATH COMGUI_PC_LIBDIR ${CMAKE_INSTALL_PREFIX} ${CMAKE_INSTALL_FULL_LIBDIR})
    file(RELATIVE_PATH COMGUI_PC_INCLUDEDIR ${CMAKE_INSTALL_PREFIX} ${CMAKE_INSTALL_FULL_INCLUDEDIR})
    configure_file(${PROJECT_SOURCE_DIR}/cmake/${name}.pc.in ${PROJECT_BINARY_DIR}/${name}.pc @ONLY)
    install(FILES ${PROJECT_BINARY_DIR}/${name}.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
endfunction()
comgui_pkg_config(comgui comgui_wxwidgets)
comgui_pkg_config(comgui_host comgui_wxwidgets)
comgui_pkg_config(comgui_client comgui_wxwidgets)

# For programs with windows, where wxWidgets' GUI is there; nothing else of this build needs it.
comgui_find_wxwidgets(comgui_wxwidgets_gui core base)
if(TARGET comgui_wxwidgets_gui)
    comgui_pkg_config(comgui_gui comgui_wxwidgets_gui)
endif()
