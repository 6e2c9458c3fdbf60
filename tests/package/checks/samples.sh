# Read by the checks that do what README.md and docs/ show. A sample is the block behind a line <!-- NAME -->.

# sample PAGE NAME DIR: its lines, with DIR for the folder of the installation.
sample()
{
    local lines
    lines=$(awk -v marker="<!-- $2 -->" '
        $0 == marker { found = 1; next }
        found && /^```/ { if (inside) exit; inside = 1; next }
        inside
    ' "$1" | sed -E "s|\\bDIR\\b|$3|g")
    [ "$lines" ] || fail "$1: no sample $2"
    printf '%s\n' "$lines"
}

# run_sample PAGE NAME DIR: runs it as a person would who types it.
run_sample()
{
    local commands
    commands=$(sample "$@") || return
    bash -euxc "$commands"
}
