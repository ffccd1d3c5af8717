# bash completion for quo: its verbs and their options as its own help tells them, then file names.
_quo() {
    local current=${COMP_WORDS[COMP_CWORD]} words
    COMPREPLY=()
    if [ "$COMP_CWORD" -eq 1 ]; then
        words=$(quo --help 2>/dev/null | sed -n '/^Subcommands:/,/^$/ s/^  \([a-z][a-z-]*\) .*/\1/p')
        mapfile -t COMPREPLY < <(compgen -W "$words --help --version" -- "$current")
    elif [ "${current#-}" != "$current" ]; then
        words=$(quo "${COMP_WORDS[1]}" --help 2>/dev/null | grep -oE -- '--[a-z][a-z-]*' | sort -u)
        mapfile -t COMPREPLY < <(compgen -W "$words" -- "$current")
    else
        compopt -o filenames 2>/dev/null
        mapfile -t COMPREPLY < <(compgen -f -- "$current")
    fi
}
complete -F _quo quo
