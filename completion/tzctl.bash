# SPDX-License-Identifier: BSD-2-Clause
# Completes the words of tzctl(8) in bash.
# shellcheck shell=bash

_tzctl() {
    local word=${COMP_WORDS[COMP_CWORD]} before=${COMP_WORDS[COMP_CWORD - 1]} root='' verb='' i
    COMPREPLY=()
    for ((i = 1; i < COMP_CWORD; i++)); do
        case ${COMP_WORDS[i]} in
        --root) root=${COMP_WORDS[++i]} ;;
        -*) ;;
        *) verb=${verb:-${COMP_WORDS[i]}} ;;
        esac
    done

    local words='' directories=
    case $before,$verb in
    --root,*) directories=yes ;;
    *,) words='status install use cleanup make --root --help --version' ;;
    *,status) words='--json --root' ;;
    *,install) words='--force --root' directories=yes ;;
    *,use) words="system $(cd "$root/var/db/timezone/tz" 2>/dev/null && echo *)" ;;
    *,cleanup) words='--dry-run --root' ;;
    make,make) words='update system' ;;
    *,make) compopt -o default ;;
    esac
    mapfile -t COMPREPLY < <(compgen -W "$words" -- "$word")
    if [ -n "$directories" ]; then
        compopt -o filenames
        mapfile -t -O "${#COMPREPLY[@]}" COMPREPLY < <(compgen -d -- "$word")
    fi
}

complete -F _tzctl tzctl
