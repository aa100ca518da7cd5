# bash completion for morvane-watch: commands, and the logs that they take.
_morvane_watch() {
    local current=${COMP_WORDS[COMP_CWORD]} words=() file
    if [[ $COMP_CWORD -eq 1 ]]; then
        words=(run status accept history show diff --help)
    elif [[ ${COMP_WORDS[1]} == @(accept|show|diff) ]]; then
        words=(last baseline)
        for file in /var/lib/morvane/history/*.log.zst; do
            file=${file##*/}
            words+=("${file%%.*}")
        done
    fi
    COMPREPLY=()
    local word
    for word in "${words[@]}"; do
        [[ $word == "$current"* && $word != "*" ]] && COMPREPLY+=("$word")
    done
    return 0
}
complete -F _morvane_watch morvane-watch
