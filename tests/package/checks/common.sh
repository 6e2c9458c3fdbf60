# Read by the checks beside it. A check prints each thing that is wrong and fails; it fails too when there
# is nothing to look at, since a check that has lost its subject would pass for ever.
set -euo pipefail
export LC_ALL=C

fail()
{
    printf '%s\n' "$*" >&2
    exit 1
}

# is_built SOURCE COMPILE_COMMANDS: whether that file, named from the root, is compiled.
is_built()
{
    grep -qF "\"file\": \"$1\"" "$2"
}

# loads_host_library_of PREFIX PROGRAM: whether that is the one that the program would load.
loads_host_library_of()
{
    [[ $(realpath "$(ldd "$2" | awk '/libcomgui_host/ { print $3 }')") = "$1"/* ]]
}
