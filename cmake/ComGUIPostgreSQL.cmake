# Whether the store over PostgreSQL is built: COMGUI_POSTGRESQL becomes true or false. What else is built does
# not need it.
set(COMGUI_POSTGRESQL AUTO CACHE STRING "Build the store over PostgreSQL: AUTO (where libpq is found), ON or OFF")
set_property(CACHE COMGUI_POSTGRESQL PROPERTY STRINGS AUTO ON OFF)

if(COMGUI_POSTGRESQL STREQUAL AUTO)
    find_package(PostgreSQL)
    set(COMGUI_POSTGRESQL ${PostgreSQL_FOUND})
elseif(COMGUI_POSTGRESQL)
    find_package(PostgreSQL REQUIRED)
endif()
