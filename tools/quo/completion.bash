# SPDX-License-Identifier: Apache-2.0

# bash completion for quo: verbs, options and their values as its own help tells them, then file names.
_quo() {
    local current=${COMP_WORDS[COMP_CWORD]} previous=${COMP_WORDS[COMP_CWORD - 1]} command=(quo) help verbs words
    COMPREPLY=()
    # "--to=gr" comes as three words.
    [ "$current" = = ] && current=
    [ "$previous" = = ] && previous=${COMP_WORDS[COMP_CWORD - 2]}
    while true; do
        help=$("${command[@]}" --help 2>/dev/null)
        verbs=$(sed -n '/^Subcommands:/,/^$/ s/^  \([a-z][a-z-]*\) .*/\1/p' <<<"$help")
        [ -n "$verbs" ] && [ ${#command[@]} -lt "$COMP_CWORD" ] || break
        command+=("${COMP_WORDS[${#command[@]}]}")
    done
    if [[ $previous =~ ^--[a-z][a-z-]*$ ]]; then
        words=$(sed -n "s/^ *\(-[a-z],\)\{0,1\}$previous [^ ]*{\([^}]*\)}.*/\2/p" <<<"$help")
        if [ -n "$words" ]; then
            mapfile -t COMPREPLY < <(compgen -W "${words//,/ }" -- "$current")
            return
        fi
    fi
    if [ -n "$verbs" ] || [ "${current#-}" != "$current" ]; then
        words=$(grep -oE -- '--[a-z][a-z-]*' <<<"$help" | sort -u)
        mapfile -t COMPREPLY < <(compgen -W "$verbs $words" -- "$current")
    else
        compopt -o filenames 2>/dev/null
        mapfile -t COMPREPLY < <(compgen -f -- "$current")
    fi
}
complete -F _quo quo
