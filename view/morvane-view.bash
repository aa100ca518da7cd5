# bash completion for morvane-view: options and subcommands. File names are bash's own part (-f), as it knows how to
# quote them.
_morvane_view() {
    local current=${COMP_WORDS[COMP_CWORD]} words=() word
    COMPREPLY=()
    case ${COMP_WORDS[COMP_CWORD - 1]} in --html | --maps | --record | --root | =) return ;; esac # their files alone
    if [[ $current == -* ]]; then
        case ${COMP_WORDS[1]} in
            diff) words=(--json --help) ;;
            san) words=(--json --html --help) ;;
            verify) words=(--root --maps --record --force --json --html --help) ;;
            *) words=(--json --html --help --version) ;;
        esac
    elif [[ $COMP_CWORD -eq 1 ]]; then
        words=(diff san verify)
    fi
    for word in "${words[@]}"; do
        [[ $word == "$current"* ]] && COMPREPLY+=("$word")
    done
    return 0
}
complete -f -o filenames -o bashdefault -F _morvane_view morvane-view
