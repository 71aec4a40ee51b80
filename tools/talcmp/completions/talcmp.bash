# Completion of talcmp for bash.

_talcmp() {
    local current=${COMP_WORDS[COMP_CWORD]} previous=${COMP_WORDS[COMP_CWORD - 1]}
    COMPREPLY=()
    case $previous in
    --tol | --slice | --include | --exclude | -n | --max-differences | --threads)
        return # nothing that could be guessed
        ;;
    esac
    if [[ $current == -* ]]; then
        mapfile -t COMPREPLY < <(compgen -W "--tol --strict-type --slice --include --exclude
            --max-differences --report --json --quiet --verbose --threads --help --version" \
            -- "$current")
        return
    fi
    compopt -o filenames
    mapfile -t COMPREPLY < <(
        compgen -f -X '!*.np[yz]' -- "$current"
        compgen -d -- "$current"
    )
}

complete -F _talcmp talcmp
