# Read by the checks of symbols.

# The functions and objects that a shared library gives to its users, by their C++ names.
exported_names()
{
    nm --dynamic --defined-only "$1" | awk '$2 != "A" { sub(/@.*/, "", $3); print $3 }' | c++filt | LC_ALL=C sort -u
}

# The same of object files: what is visible in them and stands in no inline function or template.
visible_names()
{
    readelf --symbols --wide "$@" | awk '$5 == "GLOBAL" && $6 == "DEFAULT" && $7 != "UND" { print $8 }' | c++filt |
        LC_ALL=C sort -u
}

imported_names()
{
    nm --dynamic --undefined-only "$1" | awk '{ sub(/@.*/, "", $NF); print $NF }' | sort -u
}
