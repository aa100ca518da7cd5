# bash completion for morvane-view
_morvane_view() {
    local current=${COMP_WORDS[COMP_CWORD]} previous=${COMP_WORDS[COMP_CWORD - 1]} command=""
    [[ ${COMP_WORDS[1]} == diff || ${COMP_WORDS[1]} == san ]] && command=${COMP_WORDS[1]}
    local words="--json --html --help --version"
    [[ $command == diff ]] && words="--json --help"
    [[ $command == san ]] && words="--json --html --help"
    [[ $COMP_CWORD -eq 1 ]] && words="diff san $words"
    [[ $previous == --html ]] && words=""
    compopt -o filenames 2>/dev/null
    mapfile -t COMPREPLY < <(compgen -W "$words" -- "$current"; compgen -f -- "$current")
}
complete -F _morvane_view morvane-view
