# Read by the scripts beside it: what more than one of them does. Leaves the shell in the root of the tree.
set -euo pipefail

script=$(realpath "$0")
cd "$(dirname "$script")/.."

fail()
{
    echo "$(basename "$0"): $*" >&2
    exit 1
}

# The comment at the head of the script that was started is its help.
print_help()
{
    sed -n '2,/^[^#]/{s/^# \{0,1\}//p}' "$script"
}

# How many compilers to run at a time: one a core, but none for which there is no memory; the largest test
# sources take about 1.5 GB each.
jobs()
{
    local cores memory
    cores=$(nproc)
    memory=$(awk '/^MemAvailable:/ { print int($2 / 1500000) }' /proc/meminfo)
    [ "${memory:-1}" -ge 1 ] || memory=1
    echo $((memory < cores ? memory : cores))
}
