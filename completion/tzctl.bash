# SPDX-License-Identifier: BSD-2-Clause
# Completes the words of tzctl(8) in bash.
# shellcheck shell=bash

_tzctl() {
    local word=${COMP_WORDS[COMP_CWORD]} before=${COMP_WORDS[COMP_CWORD - 1]} root='' verb='' i
    COMPREPLY=()
    for ((i = 1; i < COMP_CWORD; i++)); do
        case ${COMP_WORDS[i]} in
        --root | =) root=${COMP_WORDS[i + 1]} ;;
        "$root" | -*) ;;
        *) verb=${verb:-${COMP_WORDS[i]}} ;;
        esac
    done

    local words=() directories='' versions='' name
    case $before,$verb in
    --root,* | =,*) directories=yes ;;
    *,) words=(status diff check install use cleanup make --json --root --help --version) ;;
    *,status) words=(--json --root) ;;
    *,diff) words=(system current latest --json --root) versions=yes directories=yes ;;
    *,check) words=(--root) ;;
    *,install) words=(--force --root) directories=yes ;;
    *,use) words=(system) versions=yes ;;
    *,cleanup) words=(--dry-run --root) ;;
    make,make) words=(update system) ;;
    *,make) compopt -o default ;;
    esac
    if [ -n "$versions" ]; then
        for name in "$root"/var/db/timezone/tz/*; do # any other name may contain a command
            [[ ! ${name##*/} =~ ^[0-9]+[a-z]+(\.[0-9]+){0,2}$ ]] || words+=("${name##*/}")
        done
    fi
    [ -z "$directories" ] || compopt -o filenames
    for name in "${words[@]}"; do
        [[ $name != "$word"* ]] || COMPREPLY+=("$name")
    done
    if [ -n "$directories" ]; then
        mapfile -t -O "${#COMPREPLY[@]}" COMPREPLY < <(compgen -d -- "$word")
    fi
}

complete -F _tzctl tzctl
