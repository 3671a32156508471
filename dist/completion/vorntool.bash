# SPDX-License-Identifier: MIT
# bash completion for vorntool: the words that the tool's own prompt offers,
# for a command line. "back" only moves the prompt, so it is left out;
# --version may only stand alone; oslog's output path is a file name.

# Adds to `offer` what may follow handler $1 and the arguments after it.
# Returns 2 where a file name is due, 1 where nothing is.
_vorntool_handler() {
    local handler=$1 positionals=0 leading=0 file_at=-1 word
    local -a words
    shift
    case $handler in
        tel | core) words=(nocompress tar.gz tar nonui) leading=1 ;;
        bb) words=(nocompress tar.gz tar) leading=1 ;;
        oslog) words=(-p -i) positionals=2 file_at=1 ;;
        *) return 1 ;;
    esac
    if (($# < positionals)); then
        (($# == file_at)) && return 2
        return 1
    fi
    shift "$positionals"
    # Leading options end at the first other word, the reason; nothing
    # after it is read.
    if ((leading)); then
        for word in "$@"; do
            [[ " ${words[*]} " == *" $word "* ]] || return 1
        done
    fi
    # A word already given is not offered again.
    for word in "${words[@]}"; do
        [[ " $* " == *" $word "* ]] || offer+=("$word")
    done
}

_vorntool() {
    local cur=${COMP_WORDS[COMP_CWORD]} first_group=1 i
    local -a group=() offer=()
    # Command groups are separated by "--"; only the current one matters.
    for ((i = 1; i < COMP_CWORD; i++)); do
        if [[ ${COMP_WORDS[i]} == -- ]]; then
            group=()
            first_group=0
        else
            group+=("${COMP_WORDS[i]}")
        fi
    done

    case ${#group[@]}:${group[*]} in
        0:)
            offer=(logdump cd help quit exit)
            ((first_group)) && offer+=(--version) ;;
        1:cd) offer=(logdump ..) ;;
        1:logdump) offer=(bb core oslog tel cd help) ;;
        2:"logdump cd") offer=(..) ;;
        *:"logdump "*)
            _vorntool_handler "${group[@]:1}"
            if (($? == 2)); then
                compopt -o filenames 2>/dev/null
                if declare -F _filedir >/dev/null; then
                    _filedir
                else
                    mapfile -t COMPREPLY < <(compgen -f -- "$cur")
                fi
                return 0
            fi ;;
    esac
    mapfile -t COMPREPLY < <(compgen -W "${offer[*]}" -- "$cur")
}

complete -F _vorntool vorntool
