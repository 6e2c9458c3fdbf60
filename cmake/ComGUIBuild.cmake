# How every target of the tree is compiled: C++20 inside, warnings, sanitizers, hidden symbols, and an
# output folder in which the library, its host library and the plug-in bundle lie side by side, as they
# do after installation.
set(CMAKE_CXX_STANDARD 20)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
set(CMAKE_CXX_VISIBILITY_PRESET hidden)
set(CMAKE_VISIBILITY_INLINES_HIDDEN ON)
set(CMAKE_POSITION_INDEPENDENT_CODE ON)
set(CMAKE_LIBRARY_OUTPUT_DIRECTORY ${PROJECT_BINARY_DIR}/lib)
set(CMAKE_ARCHIVE_OUTPUT_DIRECTORY ${PROJECT_BINARY_DIR}/lib)
set(CMAKE_RUNTIME_OUTPUT_DIRECTORY ${PROJECT_BINARY_DIR}/bin)

find_package(Threads REQUIRED)

add_library(comgui_warnings INTERFACE)
target_compile_options(comgui_warnings INTERFACE -Wall -Wextra -Wpedantic -Wconversion -Wshadow
    $<$<BOOL:${COMGUI_WERROR}>:-Werror>
    # gcc 12 reports strings of its own library as overlapping once they are inlined
    $<$<AND:$<CXX_COMPILER_ID:GNU>,$<VERSION_LESS:$<CXX_COMPILER_VERSION>,13>>:-Wno-restrict>)

if(COMGUI_SANITIZE)
    add_compile_options(-fsanitize=${COMGUI_SANITIZE} -fno-sanitize-recover=all -fno-omit-frame-pointer)
    add_link_options(-fsanitize=${COMGUI_SANITIZE})
endif()

if(COMGUI_FUZZ)
    add_compile_options(-fsanitize=fuzzer-no-link)    # the library tells the fuzzer which way an input takes
endif()

# The warnings are the tree's own matter: whoever links an installed target does not get them.
function(comgui_own_target target)
    target_link_libraries(${target} PRIVATE $<BUILD_INTERFACE:comgui_warnings>)
endfunction()
