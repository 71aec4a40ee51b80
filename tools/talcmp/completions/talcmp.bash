# Completion of talcmp for bash.

# _talcmp_files ENDING...: files with these endings, and folders, that begin with $current.
_talcmp_files() {
    local ending
    for ending; do
        compgen -f -X "!*.$ending" -- "$current"
    done
    compgen -d -- "$current"
}

_talcmp() {
    local current=${COMP_WORDS[COMP_CWORD]} previous=${COMP_WORDS[COMP_CWORD - 1]}
    COMPREPLY=()
    case $previous in
    --tol | --relative | --absolute | --slice | --include | --exclude | -n | --max-differences | \
        --threads)
        return # nothing that could be guessed
        ;;
    --picture)
        compopt -o filenames
        mapfile -t COMPREPLY < <(_talcmp_files png svg)
        return
        ;;
    esac
    if [[ $current == -* ]]; then
        mapfile -t COMPREPLY < <(compgen -W "--tol --relative --absolute --equal-nan --strict-type
            --squeeze --slice --ignore --include --exclude --skip-others --first
            --max-differences --report --json --picture --quiet --verbose --threads --help
            --version" \
            -- "$current")
        return
    fi
    compopt -o filenames
    mapfile -t COMPREPLY < <(_talcmp_files np[yz] h5 hdf5 he5 nc nc4 cdf)
}

complete -F _talcmp talcmp
