#!/bin/bash
# SPDX-License-Identifier: BSD-2-Clause
# usage: tzctl_test.sh BUILD-DIRECTORY
# Tests what tzctl does and what it refuses, in a root directory laid out anew for each row.
set -eu
tzctl=$(realpath "$1")/tzctl
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
mkdir "$work/now"
cd "$work/now"
export ASAN_OPTIONS=detect_leaks=0 # which cannot be done in another root
s=root/var/db/timezone

dataset() { # DIRECTORY SCHEMA
    mkdir -p "$1/zoneinfo/Europe" "$1/icutz"
    printf TZif2 >"$1/zoneinfo/Europe/Paris"
    echo "${1##*/}" >"$1/zoneinfo/+VERSION"
    touch "$1/icutz/icutz$2.dat"
}

link() { # TARGET NAME: in the state directory; "@g" is update 2016g
    ln -sfn "${1/@//var/db/timezone/tz/2016}" "$s/$2"
}

# The system at 2016c, update 2016d current, and others older, newer, incompatible and latest.
mkdir -p root/usr/share/{icu,zoneinfo.default} $s/tz
echo 2016c >root/usr/share/zoneinfo.default/+VERSION
printf TZif2 >root/usr/share/zoneinfo.default/UTC
echo 44l >root/usr/share/icu/icutzformat.txt
for update in $s/tz/2016{b,d,f,g} 2016h; do dataset "$update" 44l; done
dataset $s/tz/2016e 44b
link @d/zoneinfo zoneinfo
link @d/icutz icutz
link @f tz_latest
link /var/db/timezone/zoneinfo/Europe/Paris localtime
mv "$PWD" "$work/given"

ctl() { "$tzctl" --root root "$@"; }
# shellcheck disable=SC2086 # there may be several options
disturbed() { strace -qqo /dev/null -e inject=$1 "$tzctl" --root root "${@:2}"; } # HOW VERB...
mounted() { # FILE-OR-DIRECTORY PLACE MODE VERB: runs the verb with the former mounted on the latter
    local as_root=()
    [ "$(id -u)" -eq 0 ] || as_root=(--map-root-user)
    # shellcheck disable=SC2016,SC2086 # expanded by sh; there may be several words, or none
    ${before-} unshare "${as_root[@]}" --mount --propagation unchanged sh -c '
        mount --bind "$1" "$2" && mount -o "remount,bind,$3" "$2" || exit
        "$0" --root root "$4" && status=0 || status=$?
        umount $(grep -o " $PWD/root[^ ]*" /proc/mounts)
        exit $status' "$tzctl" "$@"
}
in_order() { if ctl | grep -P '\x1b|.{81}|Problems'; then return 1; fi; echo fits; }
coloured_lines() { env "$@" script -qec "'$tzctl' --root root" /dev/null | grep -c $'\e'; }
told() { ctl status --json | jq -cr "$1"; }
left() { # the versions in the links; the updates; what a tzctl has left behind
    for link in $s/{zoneinfo,icutz,tz_latest}; do
        readlink "$link" || { [ -e "$link" ] && echo other || echo none; }
    done | sed 's:/var/db/timezone/tz/2016\([a-z]\)\(/zoneinfo\|/icutz\)\?$:\1:; s:/usr/share/::'
    find $s/tz/ -mindepth 1 -maxdepth 1 -printf '%f\n' 2>&1 | sed 's/^2016//; s/^\.tzctl\..*/.tzctl.*/' | sort
    find root/var/db $s -maxdepth 1 -name '*tzctl*' ! -name .tzctl.lock -printf '%f\n' 2>&1
}

"$tzctl" --root "$work/given/root" >/dev/null # or it says what is missing, such as user namespaces
failures=0
# An indented line continues the row before it. If the last column is empty, the command must leave
# the links and the updates as they were.
while IFS='|' read -r about setup command status said after; do
    rm -rf "$work/now" && cp -a "$work/given" "$work/now" && cd "$work/now"
    if ! eval "$setup" </dev/null >/dev/null; then
        [[ $setup =~ ^(chattr|script) ]] || exit
        echo "Not tested, since this fails here: ${setup%%;*}: $about" >&2
        continue
    fi
    [ -n "$after" ] || after=$(left | xargs)
    (eval "$command") </dev/null >output 2>&1 && actual=0 || actual=$?
    [ "$actual" = "$status" ] && grep -qF -- "$said" output && [ "$(left | xargs)" = "$after" ] && continue
    echo "$about: exit status $actual, left $(left | xargs): $(cat output)" >&2
    failures=$((failures + 1))
done < <(sed -z 's/\n  *//g' <<'END'
install||ctl install 2016h|0|adopts update 2016h|d d h b d e f g h
- with a slash at the end|mkdir new; mv 2016h new|ctl install new/2016h/|0|adopts|d d h b d e f g h
- by an absolute path, where the caller is|mkdir root/new; mv 2016h root/new|ctl install /new/2016h|1|
    /new/2016h: No such file
- by a path that is in the image, too|mkdir -p root$PWD; cp -r 2016h root$PWD; rm -r 2016h/zoneinfo|
    ctl install $PWD/2016h|1|holds no zone
- by a link that leads to itself|ln -s loop loop|ctl install loop/2016h|1|loop/2016h: Too many levels
- nothing||ctl install missing|1|tzctl: missing: No such file
- a file||ctl install root/usr/share/icu/icutzformat.txt|1|Not a directory
- what is older|mv 2016h 2016a|ctl install 2016a|1|2016a is not newer than 2016d
- what is older, by force|mv 2016h 2016a|ctl install --force 2016a|0|keeps update 2016d|d d a a b d e f g
- another schema|mv 2016h/icutz/icutz44{l,b}.dat|ctl install 2016h|1|2016h has ICU schema 44b, the system
- no zones|rm -r 2016h/zoneinfo|ctl install 2016h|1|holds no zone
- no zones, by force|rm -r 2016h/zoneinfo|ctl install --force 2016h|0|holds no zone|d d h b d e f g h
- with two objections, by force|rm -r 2016h/zoneinfo/Europe; echo 2016g >2016h/zoneinfo/+VERSION|
    ctl install --force 2016h|0|its data is of release 2016g.|d d h b d e f g h
- zones in posix and right only|mv 2016h/zoneinfo new; mkdir 2016h/zoneinfo; cp -r new 2016h/zoneinfo/right;
    mv new 2016h/zoneinfo/posix|ctl install 2016h|1|holds no zone
- no version as a name|mv 2016h 2016H|ctl install 2016H|1|2016H: its name is not a version
- the root directory||ctl install /|1|tzctl: /: its name
- a hidden name, by force|mv 2016h .2016h|ctl install --force .2016h|1|.2016h: its name
- too large a number|mv 2016h 20160000000h|ctl install 20160000000h|1|a number beyond 2147483647
- again|ctl install 2016h; link @f tz_latest|ctl install 2016h|0|installed already|d d h b d e f g h
- other data again|ctl install 2016h; printf x >>2016h/zoneinfo/Europe/Paris|ctl install --force 2016h|1|
    tz/2016h: installed already, with other
- fewer data again|ctl install 2016h; rm 2016h/icutz/*|ctl install --force 2016h|1|installed already
- an old release under a new name|echo 2016g >2016h/zoneinfo/+VERSION|ctl install 2016h|1|is of release 2016g
- older ICU data|echo 2016h >$s/tz/2016d/icutz/+VERSION; echo 2016g >2016h/icutz/+VERSION|ctl install 2016h|1|
    older than the current 2016h
- a FIFO|mkfifo 2016h/zoneinfo/pipe|ctl install 2016h|1|2016h/zoneinfo/pipe: neither a file, a directory nor
- too deep a directory|mkdir -p 2016h/zoneinfo/1/2/3/4/5/6/7/8/9/10/11/12/13/14/15/16/17|ctl install 2016h|1|too
- zones by a link out|mv 2016h/zoneinfo new; ln -s ../new 2016h/zoneinfo|ctl install --force 2016h|1|
    2016h/zoneinfo: a symbolic link that leads out
- a link out and in again|ln -s ../../2016h/icutz 2016h/zoneinfo/x|ctl install 2016h|1|2016h/zoneinfo/x: a symb
- an absolute link|ln -s $PWD/2016h/zoneinfo/Europe 2016h/zoneinfo/x|ctl install 2016h|1|2016h/zoneinfo/x: a symb
- a link to nowhere|ln -s nowhere 2016h/zoneinfo/x|ctl install 2016h|1|2016h/zoneinfo/x: a symb
- links inside|ln -s Europe 2016h/zoneinfo/x; ln -s x/../../icutz/./icutz44l.dat 2016h/zoneinfo/y|
    ctl install 2016h && cat $s/tz/2016h/zoneinfo/x/Paris|0|TZif2|d d h b d e f g h
- modes|chmod 700 2016h/icutz; chmod 4600 2016h/zoneinfo/Europe/Paris|ctl install 2016h;
    echo $(stat -c %a $s/tz/2016h/{icutz,zoneinfo/Europe/Paris})|0|755 644|d d h b d e f g h
- beside what is half-made|mkdir -p $s/tz/.tzctl.0/x $s/tz/.tzctl; touch $s/.tzctl.x|ctl install 2016h|0|adopts|
    d d h b d e f g h
- beside what is only named alike|touch $s/.tzctlrc $s/tz/.tzctl-2 root/var/db/.tzctl_x|ctl install 2016h|0|adopts|
    d d h .tzctl-2 b d e f g h .tzctl_x .tzctlrc
- a link in the place of the updates|mv $s/tz root/; ln -s /tz $s/tz|ctl install 2016h|1|
    root/var/db/timezone/tz: not a directory (a symbolic link
- no updates|rm -r $s/tz|ctl install 2016h|1|root/var/db/timezone/tz: No such file
- no state directory|rm -r $s|ctl install 2016h|1|tzctl: root/var/db/timezone/: No such file
- an interruption||disturbed sendfile:signal=TERM:when=1 install 2016h|143|nterrupted
- a link that cannot be looked at|ln -s Europe 2016h/zoneinfo/x|disturbed openat2:error=EIO:when=1 install 2016h|1|
    2016h/zoneinfo/x: Input/output error
- whose effect cannot be determined||disturbed memfd_create:error=EMFILE install 2016h|0|Too many open|d d h b d e f g h
- a link that cannot be replaced||disturbed ?rename,?renameat,renameat2:error=EIO:when=2 install 2016h|1|
    root/var/db/timezone/tz_latest: Input/output error
- what nobody else can read until it is installed||{ sleep 0.4; stat -c 'mode %a' $s/tz/.tzctl.*; } &
    disturbed sendfile:delay_enter=800000:when=1 install 2016h; stat -c %a $s/tz/2016h|0|mode 700|d d h b d e f g h
- a name that appears meanwhile||{ sleep 0.4; mkdir $s/tz/2016h; } &
    disturbed ?rename,?renameat,renameat2:delay_enter=800000:when=1 install 2016h|1|tz/2016h: |d d f b d e f g h
- where renaming has no flags||disturbed renameat2:error=EINVAL install 2016h|0|adopts|d d h b d e f g h
- what cannot be written to the disk||disturbed ?sync,syncfs:error=EIO install 2016h|1|Input/output error
- while another tzctl runs||exec {lock}<>$s/.tzctl.lock; flock $lock; ctl install 2016h|1|another tzctl is running
- while a reader locks the directory||exec {lock}<$s; flock -s $lock; ctl install 2016h|0|adopts|
    d d h b d e f g h
- a lock that leads elsewhere|ln -s /x $s/.tzctl.lock|ctl install 2016h|1|.tzctl.lock
use||ctl use 2016f|0|Current now: update 2016f.|f f f b d e f g
- it is kept|ctl use 2016f|told .next_start.decision|0|keep
- the system's own data|ctl use system|told .next_start.decision|0|keep|zoneinfo.default none none b d e f g
- what is older||ctl use 2016b|1|2016c.1.0 (the system's own data) is newer than 2016b.
- another schema||ctl use 2016e|1|2016e has ICU schema 44b
- nothing||ctl use 2016h|1|tzctl: 2016h: not installed
- what is elsewhere||ctl use ../tz/2016f|1|not installed
- a link|ln -s 2016g $s/tz/2016i|ctl use 2016i|1|not installed
- no zones|rm -r $s/tz/2016f/zoneinfo|ctl use 2016f|1|holds no zone
- beside a legacy link to nowhere|ln -s /nowhere root/var/db/icutz; ctl use 2016g|
    ctl use 2016f; ls root/var/db|0|timezone|f f f b d e f g
- a directory in a link's place|rm $s/icutz; mkdir -p $s/icutz/x|ctl use 2016f|1|root/var/db/timezone/icutz: 
- a file in a link's place|rm $s/tz_latest; touch $s/tz_latest|
    disturbed ?rename,?renameat,renameat2:error=EIO:when=2 use 2016f|1|root/var/db/timezone/
- where renaming has no flags||disturbed renameat2:error=EINVAL use 2016f|0|2016f|f f f b d e f g
- and a link cannot be replaced|rm $s/tz_latest; touch $s/tz_latest|
    for n in {1..6}; do disturbed "renameat2:error=EINVAL -e inject=?rename,renameat:error=EIO:when=$n" use 2016f; done|
    1|output error
- and none can be restored|rm $s/tz_latest|
    disturbed "renameat2:error=EINVAL -e inject=?rename,renameat:error=EIO:when=2+" use 2016f; ctl cleanup|0|2016d|
    f f f f
- links that cannot be written to the disk||disturbed ?sync,syncfs,fsync:error=EIO use 2016f|1|Input/output error
- unfinished|ln -s 2016f $s/.tzctl.use.0|told .findings[]|0|tzctl use 2016f
- unfinished, then cleanup|ln -s 2016f $s/.tzctl.use.0; link @f/zoneinfo zoneinfo|ctl cleanup|0|2016d|f f f f
- unfinished, and a failure again|ln -s 2016f $s/.tzctl.use.0|
    disturbed ?rename,?renameat,renameat2:error=EIO:when=1 cleanup|1|output error|d d f b d e f g .tzctl.use.0
- unfinished, then cleanup as a rehearsal|ln -s 2016f $s/.tzctl.use.0|ctl cleanup --dry-run|1|was interrupted
- unfinished, but refused by now|ln -s 2016e $s/.tzctl.use.0|ctl cleanup|0|
    cannot complete "use 2016e": 2016e: the next start would not keep it: 2016e has ICU schema|d d f d f
cleanup||ctl cleanup|0|Deleted update 2016g|d d f d f
- nothing|ctl cleanup|ctl cleanup|0|no update
- as a rehearsal||ctl cleanup --dry-run|0|Would delete update 2016b
- as a rehearsal beside a link in the place of the updates|mv $s/tz root/; ln -s /tz $s/tz|ctl cleanup --dry-run|1|
    not a directory
- how much it frees|head -c 3000000 /dev/zero >$s/tz/2016b/x; ln $s/tz/2016b/{x,y}|ctl cleanup --dry-run|0|b: 3.0 MB
- what is no update|mkdir $s/tz/{lost+found,.snapshot,2016z.partial,.make-dataset.x}|ctl cleanup|0|2016g|
    d d f .make-dataset.x .snapshot d f lost+found z.partial
- what its owner must not write to|chmod 555 $s/tz/2016b/zoneinfo|ctl cleanup|0|Deleted update 2016b|d d f d f
- a local-time link that leads to itself|link localtime localtime|ctl cleanup --dry-run|0|Would delete update 2016b
- an update that a link passes|link @g/../2016d/icutz icutz|ctl cleanup|0|2016b|
    d /var/db/timezone/tz/2016g/../2016d/icutz f d f g
- a link to an update|mv $s/tz/2016b root/; ln -s ../../../../2016b $s/tz/2016b|
    ctl cleanup; cat root/2016b/zoneinfo/Europe/Paris|0|TZif|d d f b d f
- an update that a linked one passes|rm -r $s/tz/2016d; ln -s 2016g $s/tz/2016d; link tz/2016d/../2016b tz_latest|
    ctl cleanup|0|2016e|d d tz/2016d/../2016b b d g
- a local-time link with too long a target|link $(printf %0300d 0) localtime|ctl cleanup --dry-run|0|update 2016b
- a current link to nowhere|link nowhere zoneinfo|ctl cleanup|1|root/var/db/timezone/zoneinfo: names no dataset
- no latest link that can be read|rm $s/tz_latest; touch $s/tz_latest|ctl cleanup|1|root/var/db/timezone/tz_latest:
- an interruption||disturbed ?rename,?renameat,renameat2:signal=TERM:when=1 cleanup|143||d d f d e f g
- an update with a mount point in it, and others|mkdir $s/tz/2016b/x|mounted root/usr/share $s/tz/2016b/x rw cleanup|1|
    tzctl: root/var/db/timezone/tz/|d d f .tzctl.* d f
- a mount point|cp -r root/usr/share/icu root/x; mkdir $s/tz/2016b/x|
    mounted root/x $s/tz/2016b/x rw cleanup; ls root/x|0|icutzformat.txt|d d f .tzctl.* d f
- a mount point, without openat2|mkdir $s/tz/2016b/x|
    before="strace -fqqo /dev/null -e inject=openat2:error=ENOSYS" mounted root/usr/share $s/tz/2016b/x rw cleanup|1|
    /x: a mount point|d d f .tzctl.* d f
- what cannot be read||disturbed getdents64:error=EIO:when=1+ cleanup|1|root/var/db/timezone
status, in order||in_order|0|fits
- coloured|script -c true /dev/null|coloured_lines NO_COLOR=|0|4
- not coloured|script -c true /dev/null|coloured_lines NO_COLOR=1|1|0
- of the latest update||ctl|0|yes        yes   latest
- of what is not in use||ctl|0|yes        no    may be removed
- printed to nowhere||ctl status >/dev/full|1|standard output
- at the end, local time by a link that the next start sets|rm $s/localtime|ctl|0|
    The next start sets the local-time link to the zone America/Los_Angeles. Other
- by another link than that|rm $s/localtime; mkdir root/etc;
    ln -s /usr/share/zoneinfo.default/UTC root/etc/localtime|ctl|0|Local time, UTC, does not change: it is not
- by a file|mkdir root/etc; cp root/usr/share/zoneinfo.default/UTC root/etc/localtime|ctl|0|
    Local time: no link names the local zone.
- by a path with two slashes|rm $s/localtime; mkdir root/etc; ln -s /var/db/timezone/zoneinfo root/usr/share;
    ln -s /usr/share/zoneinfo//Europe/Paris root/etc/localtime|ctl|0|Local time, Europe/Paris, 
- where a file is in the place of the zones|rm -r $s/tz/2016d/zoneinfo; touch $s/tz/2016d/zoneinfo|ctl|0|
    Local time cannot be compared
- and that it cannot be compared|link nowhere zoneinfo|ctl|0|Local time cannot be compared: root/var/db/timezone/zo
- what a start writes|link nowhere zoneinfo|told .next_start.warnings[0]|0|Bad zoneinfo link nowhere
- a verdict|link @e tz_latest|told '[.next_start["current", "latest"]]'|0|["fits","other schema"]
- a reason that the start changes|rm -r $s/tz/2016g/icutz; ln -s ../../icutz $s/tz/2016g/icutz; link @g tz_latest|
    ctl|0|2016g is compatible and newer than 2016d.
- no updates|rm -r $s/tz/*; echo 9999999999a >root/usr/share/zoneinfo.default/+VERSION|ctl|0|  icutz     -> /var
- what a start cannot replace|rm $s/localtime; touch $s/localtime|
    mounted root/usr/share/icu/icutzformat.txt $s/localtime rw status|0|create_symlink: from /var/db/timezone/localtime
- a state directory that cannot be written to||mounted $s $s ro status|0|zoneinfo: Read-only file system
- what chattr forbids to replace|chattr +i $s|ctl; chattr -i $s|0|zoneinfo: Operation not permitted
- what chattr forbids to remove only|chattr +a $s|ctl; chattr -a $s|0|zoneinfo: File exists
- a finding|rm $s/icutz|ctl|0|Problems
- what is no update|touch $s/tz/note; mkdir $s/tz/.tzctl $s/tz/x; ln -s 2016g $s/tz/2016i|told '.installed[5]'|0|null
- too large a number|mv $s/tz/{2016g,9999999999a}|
    told '[.installed[4]["version", "newer_than_system"], .findings[0]]'|0|
    ["9999999999a",false,"9999999999a is a version with a number beyond 2147483647."]
- too large a number of the system's|echo 9999999999a >root/usr/share/zoneinfo.default/+VERSION|
    told '[.system, .current.newer_than_system, .findings[0]]'|0|[null,false,"No start can use the system's own data
- no zones of the system's|rm root/usr/share/zoneinfo.default/UTC|told .findings[]|0|
    There is no zone file in /usr/share/zoneinfo.default.
- links|rm $s/icutz $s/tz_latest; mkdir $s/icutz; link nowhere localtime|told '[.links[].state]'|0|
    ["ok","not a link","missing","dangling"]
- marker and record|touch $s/needs_cleanup; printf 2016c_2016d >$s/TZVersionDiffRecord|
    told '[.format, .marker, .record]'|0|[1,true,"2016c_2016d"]
- a record elsewhere|ln -s /usr/share/icu/icutzformat.txt $s/TZVersionDiffRecord|told .record|0|null
- a FIFO, whose writer goes on waiting|mkfifo $s/TZVersionDiffRecord; (: >$s/TZVersionDiffRecord; touch released) &|
    told .record; ls released; cat $s/TZVersionDiffRecord|0|cannot access 'released'
- a release elsewhere|ln -sf /usr/share/icu/icutzformat.txt $s/tz/2016g/zoneinfo/+VERSION|
    told .installed[0].release|0|null
- a release without end|printf %09999d 0 >$s/tz/2016g/zoneinfo/+VERSION|
    told '.installed[0].release[5000:] == ""'|0|true
- a current link that names no dataset|link nowhere zoneinfo|told '[.findings[][:8]]'|0|"The loca","Bad zone"]
- a current link with too long a target|link $(printf %0300d 0) zoneinfo|ctl check|2|TZDATA CRITICAL
- a latest link to nowhere|link nowhere tz_latest|told .findings[]|0|The latest link leads nowhere.
- an ICU link left behind|ctl use system; ln -s x $s/icutz|told .findings[]|0|The ICU link is left
- the order of versions||told '.installed[0].version + .installed[4].version + .system.version'|0|2016g2016b2016c.1.0
- bytes in a name|link "$(printf 'a\377b\033')" localtime|told .links.localtime.target|0|a\xffb
- a backslash in a name|link 'a\xff' localtime|told .links.localtime.target|0|a\x5cxff
- controls on a terminal|link "$(printf 'a\377b\033\302\233\177\342\200\256\303\251')" localtime|ctl|0|
    a\xffb\x1b\xc2\x9b\x7f\xe2\x80\xaeé
- controls in an argument||ctl "$(printf '\033\342\200\256')"|2|\x1b\xe2\x80\xae
- no ICU link|rm $s/icutz|told .findings[]|0|The ICU link does not lead into the current update
- no zone|link /var/db/timezone/zoneinfo/Europe localtime|told .findings[]|0|The local-time link leads to no compiled
- a zone with a slash at the end|link /var/db/timezone/zoneinfo/Europe/Paris/ localtime|
    told .links.localtime.state|0|dangling
- a zone that the next start removes|rm $s/tz/2016f/zoneinfo/Europe/Paris|told .findings[]|0|lacks the local zone
- what cannot be read||disturbed getdents64:error=EIO status|1|Input/output error
- what cannot be opened||disturbed openat:error=EMFILE:when=40+ status|1|: Too many open files
- ICU data that cannot be read once||disturbed "newfstatat:error=EIO:when=2 -P/var/db/timezone/tz/2016e/icutz" status|1|
    root/var/db/timezone/tz/2016e/icutz: Input/output error
- what is only needed for clocks||disturbed memfd_create:error=EMFILE status|1|Too many open files
- no local-time link|rm $s/localtime|told .findings[]|0|the next start makes it lead to /var/db/timezone/zoneinfo/Am
- what only root can read|chmod 700 $s/tz/2016d|told .findings[2]|0|Only root can read what /var/db/timezone/loc
- no compiled zone|echo x >$s/tz/2016d/zoneinfo/Europe/Paris|told .findings[]|0|leads to no compiled zone file: local
- a broken local-time link that /etc/localtime does not use|mkdir root/etc;
    ln -s /usr/share/zoneinfo.default/UTC root/etc/localtime; rm $s/zoneinfo|told .findings|0|
    leads to no compiled zone file."
- what programs read|mkdir root/etc; ln -s /var/db/timezone/localtime root/etc;
    ln -s /var/db/timezone/zoneinfo root/usr/share|told '[.local_zone, .readers[]["path", "follows"]]'|0|
    ["Europe/Paris","/usr/share/zoneinfo","/etc/localtime",true,true]
- local time that leads nowhere|mkdir root/etc; ln -s nowhere root/etc/localtime|told .findings|0|"/etc/localtime leads
- local time that the next start breaks|mkdir root/etc; printf TZif2 >$s/tz/2016d/zoneinfo/UTC;
    ln -s /var/db/timezone/zoneinfo/UTC root/etc/localtime|told .findings|0|lacks the local zone
- an update without zones that is kept|rm -r $s/tz/2016d/zoneinfo; link @d tz_latest|told '[.findings[][:22]]'|0|
    ["The current link leads","The local-time link le"]
- an update that only root will be able to read|chmod 700 $s/tz/2016f|told .findings|0|that the next start makes
- a link in the place of the updates|mv $s/tz root/; ln -s /tz $s/tz|told .findings[0]|0|tz is a symbolic link
- no state directory|rm -r $s|told .findings[0]|0|systemd-tmpfiles or the builder
- older than the system's own data|link @b/zoneinfo zoneinfo|
    told .findings[]|0|"tzctl use system" makes that current
- a line that every start writes|link @d tz_latest|ctl|0|This is usual
- as JSON||ctl --json|0|"format": 1
check||ctl check|0|TZDATA OK - update 2016d is current, the next start adopts update 2016f
- findings|rm $s/icutz $s/localtime|ctl check|1|
    TZDATA WARNING - The ICU link does not lead into the current update: "tzctl use" corrects that (and 1 more)
- old data|link @b/zoneinfo zoneinfo; link @b/icutz icutz|ctl check|1|TZDATA WARNING - The current update is older
- a start that fails|rm $s/{icutz,localtime}; mkdir -p $s/localtime/x|ctl check|2|TZDATA CRITICAL - The next start fails
- printed to nowhere||ctl check >&-|3|standard output
- no zones in the latest update|rm -r $s/tz/2016f/zoneinfo|ctl check|1|will show UTC
- no zones|rm -r $s/tz/2016d/zoneinfo|ctl check|2|TZDATA CRITICAL - The current link leads to no zone file
- what cannot be read||disturbed openat:error=EMFILE:when=40+ check|3|TZDATA UNKNOWN - 
- an empty word for the image||ctl check --root=|3|TZDATA UNKNOWN - --root
- no image||"$tzctl" --root nowhere check|3|TZDATA UNKNOWN - nowhere: No such file
- wrong usage||ctl check --verbose|3|TZDATA UNKNOWN - 
--help||ctl --help|0|Delete updates
--version, printed to nowhere||ctl --version >&-|1|standard output
no operand||ctl use|2|tzctl: VERSION
no image||"$tzctl" --root "" cleanup|2|--root
- and no word for it||"$tzctl" --root= cleanup|2|--root: an empty text
- one that is not there||"$tzctl" --root nowhere cleanup|1|tzctl: nowhere: No such file
no verb||ctl frobnicate|2|frobnicate
an option of another verb||ctl install --json 2016h|2|--json
two verbs||ctl status cleanup|2|cleanup
make||"$tzctl" make frobnicate|2|usage: tzctl make update
- with its operands and no others||MALLOC_PERTURB_=1 "$tzctl" make update a b c|1|a: not a readable file
- with an image||ctl make update|2|--root
- where its script is not|mkdir -p a/b tools; cp "$tzctl" a/b; echo echo run >tools/make-dataset; chmod +x tools/*|
    a/b/tzctl make update a b c|1|make-dataset: No such file
END
)
[ $failures -eq 0 ] || { echo "$failures failures" >&2 && exit 1; }
