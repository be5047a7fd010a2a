#!/usr/bin/env bash
# SPDX-License-Identifier: BSD-2-Clause
# usage: faults.sh BUILD-DIRECTORY "START..." DISTURBANCE...
# Disturbs every system call of each START in turn, as strace's option "inject" says it: the call
# fails, or the program is killed on its way in. The verbs "install", "use" and "cleanup" of
# tzctl are disturbed like a start. The root holds only the static programs and data.
set -euo pipefail
PATH=$PATH:/usr/sbin:/sbin # where chroot is, for an ordinary user
[ "$(id -u)" -eq 0 ] || exec unshare --map-root-user "$0" "$@"
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
mkdir "$work/root"
cp "$1"/tzreconcile "$1"/tzctl "$work/root"
cd "$work"
disturbances=("${3?}" "${@:4}")

declare -A starts=( # the links that each finds
    [use]="zoneinfo=@2016d/zoneinfo icutz=@2016d/icutz tz_latest=@2016d"
    [install]="zoneinfo=@2016d/zoneinfo icutz=@2016d/icutz tz_latest=@2016e"
    [cleanup]="zoneinfo=@2016d/zoneinfo icutz=@2016d/icutz tz_latest=@2016e"
    [adopt]="zoneinfo=@2016d/zoneinfo icutz=@2016d/icutz tz_latest=@2016e"
    [drop_and_adopt]="zoneinfo=@2016a/zoneinfo icutz=@2016a/icutz tz_latest=@2016d"
    [first]="tz_latest=@2016d"
    [legacy]="zoneinfo=@2016d/zoneinfo ../icutz=@2016d/icutz localtime=/usr/share/zoneinfo/x"
)

fail() {
    echo "$start: $*" >&2
    exit 1
}

put_back() {
    rm -rf root/var
    cp -a given root/var
}

run() { # OPTION-OF-STRACE COMMAND...
    put_back
    status=0
    { strace -o calls -e "$1" chroot root "${@:2}" >/dev/null 2>said || status=$?; } 2>killed
}

disturb_every_call() { # CHECK-OF-WHAT-IS-LEFT COMMAND...
    run trace=%file,%desc,%signal "${@:2}"
    # What follows the COMMAND's execve, numbered among all calls of the same name.
    awk -F '(' -v program="\"$2\"," '
        { number[$1]++ }
        started && /^[a-z]/ { print $1 ":when=" number[$1] }
        $1 == "execve" && index($2, program) == 1 { started = 1 }' calls >in_turn
    local call disturbance
    for call in $(<in_turn) "?unlink,?symlink,unlinkat,symlinkat"; do # and all of these at once
        for disturbance in "${disturbances[@]}"; do
            run "inject=$call:$disturbance" "${@:2}"
            { [ -s in_turn ] && grep -q 'INJECTED)$\|killed by SIGKILL' calls && "$1"; } ||
                fail "not $1 with $call:$disturbance, status $status: $(<said)"
        done
    done
    echo "$start: $(wc -l <in_turn) calls"
}

usable() { # VAR
    local target
    target=$(readlink "$1/db/timezone/zoneinfo") && [ -e "root$target/+VERSION" ]
}

# Usable data stays usable, but for a death between a link's removal and creation, which the next
# start mends.
survived() {
    case $status in
    0) usable root/var ;;
    1) [[ $(tail -n 1 said) == *": Could not set all time-zone links: "* ]] ;;
    *) [ "$status" -eq 137 ] ;;
    esac &&
        { usable root/var || ! usable given || tail -n 2 calls | grep -q '^symlink.*/zoneinfo"'; } &&
        chroot root /tzreconcile 2>said && usable root/var
}

disturb_start() {
    disturb_every_call survived /tzreconcile

    run trace=none /tzreconcile
    rm -rf after && mv root/var after
    put_back # Nobody reads the warnings, files must stay empty, few may be open.
    { (ulimit -f 0 -n 5 && sleep 0.1 && exec chroot root /tzreconcile) <&- 2>&1 >&- 3>&- 4>&- | : &&
        diff -r --no-dereference -x TZVersionDiffRecord after root/var; } || fail "hampered"
}

# All or nothing: the links are as before or as after, the data that they name is there, and every
# update is whole. Only a death may leave what the next one deletes.
done_or_not() {
    local var=root/var/db/timezone update expected
    [ "$status" -ne 137 ] || rm -rf $var/tz/.tzctl $var/*.tzctl-*
    for update in "$var"/tz/*; do diff -r "$update" "whole/${update##*/}" || return; done
    for expected in given after; do
        ! diff -r --no-dereference $expected root/var | grep -qv '/tz: 2016[af]$' && break
    done && usable root/var && [ -e "root$(readlink $var/tz_latest)/zoneinfo" ]
}

disturb_tzctl() { # VERB...
    run trace=none /tzctl "$@"
    rm -rf after && cp -a root/var after
    disturb_every_call done_or_not /tzctl "$@"
}

mkdir -p root/usr/share/{icu,zoneinfo.default} var/db/timezone/tz/2016{a,d,e}/{icutz,zoneinfo}
echo 44l >root/usr/share/icu/icutzformat.txt
echo 2016c >root/usr/share/zoneinfo.default/+VERSION
for update in 2016a 2016d 2016e; do
    touch var/db/timezone/tz/$update/{icutz/icutz44l.dat,zoneinfo/+VERSION}
    echo TZif >var/db/timezone/tz/$update/zoneinfo/UTC
done
cp -a var/db/timezone/tz whole
cp -a whole/2016e whole/2016f
cp -a whole/2016f root
for start in $2; do
    rm -rf given
    cp -a var given
    for link in ${starts[$start]}; do
        target=${link#*=}
        ln -s "${target/@//var/db/timezone/tz/}" "given/db/timezone/${link%%=*}"
    done
    case $start in
    install) disturb_tzctl install /2016f ;;
    use) disturb_tzctl use 2016e ;;
    cleanup) disturb_tzctl cleanup ;;
    *) disturb_start ;;
    esac
done
