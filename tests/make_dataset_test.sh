#!/bin/sh
# SPDX-License-Identifier: BSD-2-Clause
# Has make-dataset refuse all that it must, and make a dataset of each kind under hostile modes.
set -eu
tool=$(cd "$(dirname "$0")/.." && pwd)/tools/make-dataset
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
cd "$work"
make() { "$tool" "$@"; }
fail() { echo "$*" >&2 && exit 1; }

mkdir -p one none two misnamed out dying deb/usr/share/zoneinfo
touch one/icutz44l.dat one/notes two/icutz44l.dat two/icutz44b.dat misnamed/icutz44x.dat
for release in 2016b 2016B 2147483648b; do echo "# version $release" >$release; done
(cat 2016b && echo Z A/B nonsense) >nonsense
(cat 2016b && echo Z A/B 0 - UTC) >deb/usr/share/zoneinfo/tzdata.zi
# shellcheck disable=SC2016 # expanded by what is written
printf '#!/bin/sh\nmkdir "$4"; kill $PPID; echo dying' >dying/zic && chmod +x dying/zic
sed 's/ zic / no-zic /' "$tool" >without-zic
ln -s nowhere out/2016b.9

while IFS='|' read -r command message; do
    if (eval "$command") >said 2>&1; then fail "not refused: $command"; fi
    grep -qF "$message" said || fail "$command: $(cat said)"
    [ "$(ls -A out)" = 2016b.9 ] || fail "$command: left $(ls -A out)"
done <<'END'
make update deb one|usage: make-dataset update|system TZDATA ICU DIRECTORY
make upgrade deb one out/2016b.1|usage: make-dataset update|system TZDATA ICU DIRECTORY
make update one one out/2016b|one/usr/share/zoneinfo/tzdata.zi: not a file that can be read
make system 2016B one out/share|2016B: its first line is not of the form '# version 2016a'
make system 2147483648b one out/share|2147483648b: holds a number beyond 2147483647
make update deb one out/2016b.1.99999999999999999999|.99999999999999999999: holds a number beyond
make update deb one out/2016b.1.|2016b.1.: not a version such as 2016a.1.0
make update deb one out/2016bb.1|2016bb.1: not a version of release 2016b, such as 2016b.1.0
make update deb one out/2016b.9/|out/2016b.9: exists already
make system deb none out/share|none: holds no ICU data file
make system deb two out/share|two: holds more than one ICU data file
make system deb misnamed out/share|misnamed/icutz44x.dat: not named like icutz44l.dat
sh without-zic update deb one out/2016b|zic: not found
make update deb one none/none/2016b|none/none: cannot be written to
make update 2016b one out/2016b|2016b: holds no zone
make system deb -one out/share|-one: begins with '-' or holds a newline
make update nonsense one out/2016b|nonsense: zic cannot compile it
PATH=dying:$PATH make update deb one out/2016b|dying
END

chmod 700 one/icutz44l.dat
chmod 2700 out
(umask 777 && make update deb one out/2016b.1.0 && make system deb one out/share)
(cd out && find 2016b.1.0 share -type f -perm 644 -o -type d ! -perm 755 | sort &&
    cat share/icu/*.txt ./*/zoneinfo*/+VERSION) | xargs -n 3 | diff /dev/fd/3 - 3<<'END'
2016b.1.0/icutz/icutz44l.dat 2016b.1.0/zoneinfo/+VERSION 2016b.1.0/zoneinfo/A/B
share/icu/icutz44l.dat share/icu/icutzformat.txt share/zoneinfo.default/+VERSION
share/zoneinfo.default/A/B 44l 2016b
2016b
END
