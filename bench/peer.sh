#!/bin/sh
# SPDX-License-Identifier: BSD-2-Clause
# What an administrator would write instead of tzreconcile, with the tools at hand. It takes the
# same decisions in the ordinary states; it does not mend damaged links as carefully, and whatever
# fails on the way may leave the system without a current link. script/bench measures against it.

state=/var/db/timezone
updates=$state/tz
system=/usr/share/zoneinfo.default

warn() { echo "${0##*/}: $*" >&2; }

# The schema in the name of the first data file in a directory that everybody can read.
schema_in() {
    find "$1" -maxdepth 1 -type f -perm -o=r |
        sed -n '/.*\/icutz\([0-9][0-9]*[lbe]\)\.dat$/ { s//\1/p; q; }'
}

newer() { [ "$1" != "$2" ] && printf '%s\n' "$2" "$1" | sort -V -C; }

make_current() { # ZONEINFO-DIRECTORY [ICU-DIRECTORY]
    rm -f $state/zoneinfo $state/icutz /var/db/icutz
    ln -s "$1" $state/zoneinfo
    if [ $# -eq 2 ]; then ln -s "$2" $state/icutz; fi
}

if [ -e /var/db/icutz ]; then
    [ -e $state/icutz ] || ln -s "$(readlink /var/db/icutz)" $state/icutz
    rm /var/db/icutz
fi
rm -fd $state/needs_cleanup /var/db/icu

read -r release _ <$system/+VERSION
read -r schema _ </usr/share/icu/icutzformat.txt
latest=$(readlink $state/tz_latest)
link=$(readlink $state/zoneinfo)

effective=system
case $link in
$updates/?*/?*)
    current=${link%/*}
    version=${current#"$updates"/}
    if [ "$(schema_in "$current/icutz")" = "$schema" ] && ! newer "$release.1.0" "$version"; then
        effective=update
    else
        warn "Dropping $version"
        make_current $system
        : >$state/needs_cleanup
    fi
    ;;
"$system")
    version=$release.1.0
    ;;
*)
    warn "Bad current link '$link'"
    version=$release.1.0
    make_current $system
    ;;
esac

if [ -n "$latest" ]; then
    offered=${latest#"$updates"/}
    if [ "$(schema_in "$latest/icutz")" = "$schema" ] && newer "$offered" "$version"; then
        make_current "$latest/zoneinfo" "$latest/icutz"
        if [ $effective = update ]; then
            : >$state/needs_cleanup
            replaced=$version
        else
            replaced=$release.1.0
        fi
        printf '%s_%s' "$replaced" "$offered" >$state/TZVersionDiffRecord
    else
        warn "New update not compatible or older version: $offered vs. $version"
    fi
fi

zone=$(readlink $state/localtime)
case $zone in
$state/zoneinfo*) exit ;;
/usr/share/zoneinfo*) zone=$state/zoneinfo${zone#/usr/share/zoneinfo} ;;
*) zone= ;;
esac
[ -n "$zone" ] && [ -e "$zone" ] || zone=$state/zoneinfo/America/Los_Angeles
warn "Local time is now $zone"
ln -sfn "$zone" $state/localtime
