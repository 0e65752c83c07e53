# SPDX-License-Identifier: Apache-2.0
# Completion of quenxctl for bash: the program itself says what a word may become.
_quenxctl() {
    local line="${COMP_LINE:0:COMP_POINT}" word start words
    read -ra words <<<"$line"
    [[ $line != *[[:space:]] ]] || words+=("")
    # bash takes a word apart at colons, which ids have.
    start="${words[-1]%"${2-}"}"
    COMPREPLY=()
    while IFS=$'\t' read -r word _; do
        if [ "$word" = :files ]; then
            compopt -o default 2>/dev/null
            return
        fi
        COMPREPLY+=("${word#"$start"}")
    done < <("$1" complete "${words[@]:1}" 2>/dev/null)
}
complete -F _quenxctl quenxctl
