#!/bin/bash
# SPDX-License-Identifier: BSD-2-Clause
# Asks tzctl, in the build directory named as the argument, for all that it can do, and for much that
# it must refuse, in a root directory laid out anew for each row.
set -eu
tzctl=$(realpath "$1")/tzctl
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
cd "$work"
state=root/var/db/timezone
fail() { echo "$*" >&2 && exit 1; }

dataset() { # DIRECTORY SCHEMA
    mkdir -p "$1/zoneinfo/Europe" "$1/icutz"
    printf TZif2 >"$1/zoneinfo/Europe/Paris"
    touch "$1/icutz/icutz$2.dat"
}

# The system at 2016c, update 2016d current, and others older, newer, incompatible and latest.
lay_out() {
    chmod -R u+rwX root 2>/dev/null || true
    rm -rf root 20* .2016h
    mkdir -p root/usr/share/{icu,zoneinfo.default} $state/tz
    echo 2016c >root/usr/share/zoneinfo.default/+VERSION
    printf TZif2 >root/usr/share/zoneinfo.default/UTC
    echo 44l >root/usr/share/icu/icutzformat.txt
    for update in 2016b:44l 2016d:44l 2016e:44b 2016f:44l 2016g:44l; do
        dataset "$state/tz/${update%:*}" "${update#*:}"
    done
    ln -s /var/db/timezone/tz/2016d/zoneinfo $state/zoneinfo
    ln -s /var/db/timezone/tz/2016d/icutz $state/icutz
    ln -s /var/db/timezone/tz/2016f $state/tz_latest
    ln -s /var/db/timezone/zoneinfo/Europe/Paris $state/localtime
    dataset 2016h 44l
}

ctl() { "$tzctl" --root root "$@"; }
disturbed() { strace -qqo /dev/null -e inject="$1" "$tzctl" --root root "${@:2}"; } # HOW VERB...
mounted() { # FILE: what is told while it is a mount point
    unshare --map-root-user --mount sh -c "mount --bind $PWD/root/usr/share/icu/icutzformat.txt $1 &&
        '$tzctl' --root root"
}
in_order() { if ctl | grep -P '\x1b|.{81}|not as it should'; then return 1; fi; echo fits; }
coloured_lines() { env "$@" script -qec "'$tzctl' --root root" /dev/null | grep -c $'\e'; }
told() { ctl status --json | jq -cr "$1"; }
left() { # the versions in the links, and the updates
    for link in $state/{zoneinfo,icutz,tz_latest}; do readlink "$link" || echo none; done |
        sed 's:/var/db/timezone/tz/::; s:/usr/share/::' | paste -s -d ' '
    ls -A $state/tz/ 2>/dev/null || true
}

# Before the commands something may be changed. Unless they succeed, nothing else may be.
while IFS='|' read -r commands status said after; do
    lay_out
    case $commands in *';'*) eval "${commands%;*}" >/dev/null ;; esac
    before=$(left)
    (eval "${commands##*;}") </dev/null >output 2>&1 && actual=0 || actual=$?
    [ "$actual" = "$status" ] || fail "$commands: exit status $actual: $(cat output)"
    grep -qF -- "$said" output || fail "$commands: $(cat output)"
    [ "$(left | xargs)" = "${after:-$(echo "$before" | xargs)}" ] || fail "$commands: left $(left)"
done <<'END'
ctl install 2016h|0|adopts update 2016h|2016d/zoneinfo 2016d/icutz 2016h 2016b 2016d 2016e 2016f 2016g 2016h
mkdir root/new; mv 2016h root/new; ctl install /new/2016h/|0|adopts|2016d/zoneinfo 2016d/icutz 2016h 2016b 2016d 2016e 2016f 2016g 2016h
cp -r 2016h root; rm -r 2016h/zoneinfo; ctl install 2016h|1|holds no tz database
mkdir -p root$PWD; cp -r 2016h root$PWD; rm -r 2016h/zoneinfo; ctl install $PWD/2016h|0|adopts|2016d/zoneinfo 2016d/icutz 2016h 2016b 2016d 2016e 2016f 2016g 2016h
mkdir $state/tz/.tzctl; ctl install 2016h|0|adopts|2016d/zoneinfo 2016d/icutz 2016h 2016b 2016d 2016e 2016f 2016g 2016h
mv 2016h 2016a; ctl install 2016a|1|2016a is not newer than 2016d
mv 2016h 2016a; ctl install --force 2016a|0|keeps update 2016d|2016d/zoneinfo 2016d/icutz 2016a 2016a 2016b 2016d 2016e 2016f 2016g
mv 2016h/icutz/icutz44{l,b}.dat; ctl install 2016h|1|2016h has ICU schema 44b, the system ICU schema 44l.
rm -r 2016h/zoneinfo; ctl install 2016h|1|holds no tz database
mv 2016h 2016H; ctl install 2016H|1|"2016H" is not a version
mv 2016h .2016h; ctl install --force .2016h|1|".2016h" is not a version
mv 2016h 20160000000h; ctl install 20160000000h|1|a number beyond 2147483647
mv 2016h 2016g; ctl install 2016g|1|2016g is installed already
mkfifo 2016h/zoneinfo/pipe; ctl install 2016h|1|pipe is neither a file
mv $state/tz root/; ln -s /tz $state/tz; ctl install 2016h|1|a link perhaps
rm -r $state; ctl install 2016h|1|timezone/: No such file
rm -r 2016h/zoneinfo; ctl install --force 2016h|0|holds no tz database|2016d/zoneinfo 2016d/icutz 2016h 2016b 2016d 2016e 2016f 2016g 2016h
ctl install missing|1|missing: No such file
rm $state/tz_latest; mkdir $state/tz_latest; ctl install 2016h|1|tz_latest
ctl use 2016f|0|Current now: update 2016f.|2016f/zoneinfo 2016f/icutz 2016f 2016b 2016d 2016e 2016f 2016g
ctl use 2016f && told .next_start.decision|0|keep|2016f/zoneinfo 2016f/icutz 2016f 2016b 2016d 2016e 2016f 2016g
ctl use system && told .next_start.decision|0|keep|zoneinfo.default none none 2016b 2016d 2016e 2016f 2016g
ln -s x $state/zoneinfo.tzctl-new; ln -s x $state/icutz.tzctl-old; ln -s x $state/tz_latest.tzctl-new; ctl use 2016f|0|Current now|2016f/zoneinfo 2016f/icutz 2016f 2016b 2016d 2016e 2016f 2016g
ctl use 2016b|1|2016c.1.0 (the system's own data) is newer than 2016b.
ctl use 2016e|1|2016e has ICU schema 44b
ctl use 2016h|1|"2016h" is not installed
ctl use ..|1|is not installed
ctl use ../tz/2016f|1|is not installed
rm -r $state/tz/2016f/zoneinfo; ctl use 2016f|1|holds no tz database
rm $state/icutz; mkdir $state/icutz; ctl use 2016f|1|File exists
ctl cleanup --dry-run|0|Would delete update 2016b
head -c 3000000 /dev/zero >$state/tz/2016b/x; ln $state/tz/2016b/{x,y}; ctl cleanup --dry-run|0|update 2016b: 3.0 MB
ln -sfn localtime $state/localtime; ctl cleanup --dry-run|0|Would delete update 2016b
ctl cleanup|0|Deleted update 2016g|2016d/zoneinfo 2016d/icutz 2016f 2016d 2016f
ln -sfn /var/db/timezone/tz/2016g/../2016d/icutz $state/icutz; ctl cleanup|0|2016b|2016d/zoneinfo 2016g/../2016d/icutz 2016f 2016d 2016f 2016g
mv $state/tz/2016b root/; ln -s ../../../../2016b $state/tz/2016b; ctl cleanup && cat root/2016b/zoneinfo/Europe/Paris|0|TZif|2016d/zoneinfo 2016d/icutz 2016f 2016b 2016d 2016f
ln -sfn 2016g $state/tz/2016d; rm -r $state/tz/2016d/2016g; ln -sfn tz/2016d/../2016b $state/tz_latest; ctl cleanup|0|2016e|2016d/zoneinfo 2016d/icutz tz/2016d/../2016b 2016b 2016d
ln -sfn $(printf %0300d 0) $state/localtime; ctl cleanup|1|File name too long
ln -sfn nowhere $state/zoneinfo; ctl cleanup|1|current link cannot be read
rm $state/tz_latest; touch $state/tz_latest; ctl cleanup|1|tz_latest cannot be read
mv $state/tz root/; ln -s /tz $state/tz; ctl cleanup|1|a link perhaps
disturbed sendfile:signal=INT:when=1 install 2016h|1|interrupted
disturbed rename:error=EIO:when=2 install 2016h|1|tz_latest: Input/output error
disturbed rename:error=EIO:when=2 use 2016f|1|tz_latest: Input/output error
disturbed rename:signal=INT:when=1 cleanup|1|interrupted|2016d/zoneinfo 2016d/icutz 2016f 2016d 2016e 2016f 2016g
exec {lock}<$state; flock $lock; ctl install 2016h|1|another tzctl is at work
ctl status >/dev/full|1|standard output
ctl --version >&-|1|standard output
in_order|0|fits
coloured_lines NO_COLOR=|0|3
coloured_lines NO_COLOR=1|1|0
ctl|0|yes         yes   latest
ctl|0|yes         no    may be removed
ln -sfn nowhere $state/zoneinfo; ctl|0|It will say
rm -r $state/tz/*; echo 9999999999a >root/usr/share/zoneinfo.default/+VERSION; ctl|0|  icutz     -> /var
rm $state/localtime; touch $state/localtime; mounted $state/localtime|0|create_symlink: from /var/db/timezone/localtime
rm $state/icutz; ctl|0|What is not as it should be
touch $state/tz/note; mkdir $state/tz/.tzctl; told '.installed[5] == null'|0|true
mv $state/tz/{2016g,9999999999a}; told '[.installed[4]["version", "newer_than_system"], .findings[0]]'|0|["9999999999a",false,"9999999999a: the version holds a number beyond 2147483647"]
echo 9999999999a >root/usr/share/zoneinfo.default/+VERSION; told '[.system, .current.newer_than_system, .findings[0]]'|0|[null,false,"No start can use the system's own data"
rm root/usr/share/zoneinfo.default/UTC; told .findings[]|0|There is no zone file in /usr/share/zoneinfo.default.
rm $state/icutz $state/tz_latest; mkdir $state/icutz; ln -sfn nowhere $state/localtime; told '[.links[].state]'|0|["ok","not a link","missing","dangling"]
touch $state/needs_cleanup; printf 2016c_2016d >$state/TZVersionDiffRecord; told '[.format, .marker, .record]'|0|[1,true,"2016c_2016d"]
ln -sfn nowhere $state/zoneinfo; told .findings[]|0|Bad zoneinfo link
ln -sfn nowhere $state/tz_latest; told .findings[]|0|The latest link leads nowhere.
ctl use system; ln -s x $state/icutz; told .findings[]|0|The ICU link has been left behind
told '.installed[0].version + .installed[4].version + .system.version'|0|2016g2016b2016c.1.0
ln -sfn "$(printf 'a\377b\033')" $state/localtime; told .links.localtime.target|0|a\xffb
ln -sfn "$(printf 'a\377b\033\302\233\177\303\251')" $state/localtime; ctl|0|a\xffb\x1b\xc2\x9b\x7fé
rm $state/icutz; told .findings[]|0|The ICU link does not lead into the current update
ln -sfn /var/db/timezone/zoneinfo/Europe $state/localtime; told .findings[]|0|The local-time link leads to no zone file
rm $state/tz/2016f/zoneinfo/Europe/Paris; told .findings[]|0|lacks the local zone
ctl --help|0|Delete the updates
ctl use|2|tzctl: VERSION
"$tzctl" --root "" cleanup|2|--root
ctl frobnicate|2|frobnicate
ctl status cleanup|2|cleanup
ctl make update|2|takes no --root
"$tzctl" make frobnicate|2|usage: make-dataset
END
