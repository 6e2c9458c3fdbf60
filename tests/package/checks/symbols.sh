# Read by the checks of symbols.

# The functions and objects that a shared library gives to its users, by their C++ names. Weak ones are left
# out: inline functions and templates, of which each compiler emits others.
exported_names()
{
    nm --dynamic --defined-only "$1" | awk '$2 ~ /^[TDBRGS]$/ { print $3 }' | c++filt | sort -u
}

imported_names()
{
    nm --dynamic --undefined-only "$1" | awk '{ sub(/@.*/, "", $NF); print $NF }' | sort -u
}
