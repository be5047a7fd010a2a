#!/usr/bin/env bash
# SPDX-License-Identifier: BSD-2-Clause
# usage: faults.sh BUILD-DIRECTORY "START..." DISTURBANCE...
# Disturbs every system call of each START in turn. DISTURBANCE is an action of strace's option
# "inject": error=EIO makes the call fail, signal=KILL kills the program as it enters the call. A
# START may also be the verb "install", "use" or "cleanup" of tzctl.
set -euo pipefail
PATH=$PATH:/usr/sbin:/sbin # where chroot is, for an ordinary user
if [ "$(id -u)" -ne 0 ]; then
    echo "Not root, so this needs user namespaces, which a chroot does not allow." >&2
    exec unshare --map-root-user "$0" "$@"
fi
export ASAN_OPTIONS=detect_leaks=0 # which cannot be done under strace
build=$(realpath "$1")
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
cd "$work"
disturbances=("${3?}" "${@:4}")
mkdir root
untouched=none
tzreconcile=(chroot root /tzreconcile)
if [ -x "$build/tests/tzreconcile" ]; then # the program is not static
    tzreconcile=("$build/tests/tzreconcile" root)
    untouched='mmap|pipe2|sigaltstack|write' # as the sanitizers need them
fi
tzctl=("$build/tzctl" --root root)

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

put_back() { # STATE
    rm -rf root/var
    cp -a "$1" root/var
}

run() { # OPTION-OF-STRACE COMMAND...
    put_back given
    status=0
    { strace -o calls -e "$1" "${@:2}" >/dev/null 2>said || status=$?; } 2>killed
}

disturb_every_call() { # CHECK-OF-WHAT-IS-LEFT COMMAND...
    run trace=%file,%desc,%signal "${@:2}"
    # The calls from the first in main on, each numbered among all calls of the same name.
    awk -F '(' -v untouched="^($untouched)$" '
        { number[$1]++ }
        /^fcntl\(0, F_GETFD/ { started = 1 }
        started && /^[a-z]/ && $1 !~ untouched { print $1 ":when=" number[$1] }' calls >in_turn
    [ -s in_turn ] || fail "runs no call"
    local call disturbance
    for call in $(<in_turn) "?unlink,?symlink,unlinkat,symlinkat"; do # and all of these at once
        for disturbance in "${disturbances[@]}"; do
            run "inject=$call:$disturbance" "${@:2}"
            if ! grep -q 'INJECTED)$\|killed by SIGKILL' calls; then
                [[ $call == \?* ]] || fail "does not get to $call"
            elif ! "$1"; then
                fail "not $1 with $call:$disturbance, status $status: $(<said)"
            fi
        done
    done
    echo "$start: $(wc -l <in_turn) calls"
}

usable() { # VAR
    local target
    target=$(readlink "$1/db/timezone/zoneinfo") && [ -e "root$target/+VERSION" ]
}

# Usable data stays usable, unless the program is killed between a link's removal and creation. The
# next start repairs that.
survived() {
    case $status in
    0) usable root/var ;;
    1) [[ $(tail -n 1 said) == *": Could not set all time-zone links: "* ]] ;;
    *) [ "$status" -eq 137 ] ;;
    esac &&
        { usable root/var || ! usable given || tail -n 2 calls | grep -q '^symlink.*/zoneinfo"'; } &&
        "${tzreconcile[@]}" 2>said && usable root/var
}

disturb_start() {
    cp "$build/tzreconcile" root
    disturb_every_call survived "${tzreconcile[@]}"

    run trace=none "${tzreconcile[@]}"
    rm -rf after && mv root/var after
    put_back given # No reader of the warnings, no byte in a file, few descriptors.
    { (ulimit -f 0 -n 5 && sleep 0.1 && exec "${tzreconcile[@]}") <&- 2>&1 >&- 3>&- 4>&- | : &&
        diff -r --no-dereference -x TZVersionDiffRecord after root/var; } || fail "hampered"
}

is_like() { # STATE WHAT-DOES-NOT-COUNT
    diff -r --no-dereference -x "${2-.tzctl.lock}" "$1" root/var >>said
}

# A failure leaves the links as they were. Also after a kill every update is whole, and the next
# tzctl completes what was begun, and removes the leftovers.
done_or_not() {
    case $status in
    0) is_like after '.tzctl.*' ;;
    1) is_like given '.tzctl.*' || { [[ $call$start =~ ^write|cleanup ]] && is_like after '.tzctl.*'; } ;;
    *) [ "$status" -eq 137 ] ;;
    esac && usable root/var || return
    local found update
    found=$(find root/var -printf '%P %y %s %l\n' | sed 's/tzctl\.[0-9a-f]*//' | sort)
    if [ -z "${mended[$found]-}" ]; then
        for update in root/var/db/timezone/tz/*; do
            diff -r "$update" "whole/${update##*/}" >>said || return
        done
        rm -rf left && cp -a root/var left
        "${verb[@]}" >/dev/null 2>said && is_like after || return
        put_back left
        "${tzctl[@]}" cleanup >/dev/null 2>said &&
            { is_like given_clean || is_like after_clean; } || return
        mended[$found]=yes
    fi
}

disturb_tzctl() { # VERB...
    verb=("${tzctl[@]}" "$@")
    declare -A mended=() # what has been found and mended before
    local state
    run trace=none "${verb[@]}"
    rm -rf after && cp -a root/var after
    for state in given after; do
        put_back $state && "${tzctl[@]}" cleanup >/dev/null
        rm -rf ${state}_clean && mv root/var ${state}_clean
    done
    disturb_every_call done_or_not "${verb[@]}"
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
cp -a whole/2016f .
for start in $2; do
    rm -rf given
    cp -a var given
    for link in ${starts[$start]}; do
        target=${link#*=}
        ln -s "${target/@//var/db/timezone/tz/}" "given/db/timezone/${link%%=*}"
    done
    case $start in
    install) disturb_tzctl install 2016f ;;
    use) disturb_tzctl use 2016e ;;
    cleanup) disturb_tzctl cleanup ;;
    *) disturb_start ;;
    esac
done
