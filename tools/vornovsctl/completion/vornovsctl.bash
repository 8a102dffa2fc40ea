# shellcheck shell=bash
# Completion of vornovsctl's command line for bash.

_vornovsctl()
{
    # A "=" would end a word; the modes of bonds have one inside.
    local word=${COMP_WORDS[COMP_CWORD]} words=("${COMP_WORDS[@]:1:COMP_CWORD-1}") line prefix=''
    if declare -F _get_comp_words_by_ref >/dev/null; then
        local cur cword
        _get_comp_words_by_ref -n = cur words cword
        word=$cur
        words=("${words[@]:1:cword-1}")
        [[ $word == *=* ]] && prefix=${word%"${word##*=}"}
    fi

    COMPREPLY=()
    while IFS= read -r line; do
        line=${line%%$'\t'*}
        # Options are offered once the word begins like one.
        if [[ $line == "$word"* && ($line != -* || $word == -*) ]]; then
            COMPREPLY+=("$(printf '%q' "${line#"$prefix"}")")
        fi
    done < <("${VORNOVS_CANDIDATES:-/usr/share/vornovs-tools/candidates}" "${COMP_WORDS[0]}" \
        "${words[@]}" 2>/dev/null)
}

complete -F _vornovsctl vornovsctl
