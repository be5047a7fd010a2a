#!/bin/sh
# SPDX-License-Identifier: BSD-2-Clause
# Tests which input make-dataset refuses, and which datasets it makes from every form of input. The
# ICU data is real: that of this machine's ICU library.
set -eu
PATH=$PATH:/usr/sbin:/sbin # where icupkg is, for an ordinary user
project=$(cd "$(dirname "$0")/.." && pwd)
tool=$project/tools/make-dataset
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
cd "$work"
make() { "$tool" "$@"; }
fail() { echo "$*" >&2 && exit 1; }

export TMPDIR="$work/tmp"
mkdir -p tmp none two misnamed out dying deb/usr/share/zoneinfo table/zone.tab cut
touch two/icutz44l.dat two/icutz44b.dat misnamed/icutz44x.dat
for release in 2016b 2016B 2147483648b; do echo "# version $release" >$release; done
(cat 2016b && echo Z A/B nonsense) >nonsense
hostile=$(printf '\033[31m\2331m\\033')
cp nonsense "$hostile"
for place in deb/usr/share/zoneinfo table cut; do
    (cat 2016b && echo Z A/B 0 - UTC) >$place/tzdata.zi
done
printf '# XX\n\t\tA/B\n\t\tC/D\n' >cut/zone1970.tab
echo AB >deb/usr/share/zoneinfo/zone.tab
(echo '# version 9999a' && echo Z A/B 0 - UTC) >9999a.zi
# shellcheck disable=SC2016 # for the script that is written here
printf '#!/bin/sh\nmkdir "$4"; kill $PPID; echo dying >said' >dying/zic && chmod +x dying/zic
for command in zic icupkg; do sed "s/ $command / no-$command /" "$tool" >without-$command; done
ln -s nowhere out/2016b.9

# ICU's data in every form.
"$project/demo/icu-data" .
mv 44l one
touch one/notes
echo metaZones.res timezoneTypes.res windowsZones.res zoneinfo64.res >items.txt
for letter in l b e; do
    icupkg --auto_toc_prefix -t$letter one/icutz44l.dat icutz44$letter.dat
    mkdir -p 44/${letter}e
    icupkg --auto_toc_prefix -d 44/${letter}e -x items.txt icutz44$letter.dat
done
mkdir 9 && cp -R 44/ee 9
echo 'fr:table { key { "depends on a root.res that is not there" } }' >fr.txt
genrb --quiet fr.txt
icupkg --ignore-deps --toc_prefix icudt99l -a fr.res icutz44l.dat icudtl.dat 2>/dev/null

# Broken ICU data.
for number in 1 2 3 4 5 6 7; do mkdir $number && cp -R 44/le $number/le; done
mv 1/le 1/named
rm 2/le/metaZones.res
touch 3/le/root.res
cp 44/be/timezoneTypes.res 4/le
echo text >5/le/windowsZones.res
head -c 9999 44/le/zoneinfo64.res >6/le/zoneinfo64.res
cp 44/le/metaZones.res 7/le/zoneinfo64.res
mkdir 8 && cp -R 44/ee 8/be
cp icutz44b.dat icutz45l.dat
echo text >icudt1l.dat
icupkg --auto_toc_prefix -r zoneinfo64.res icutz44l.dat icutz46l.dat

while IFS='|' read -r command message; do
    if (eval "$command") >said 2>&1; then fail "not refused: $command"; fi
    grep -qF "$message" said || fail "$command: $(cat said)"
    if LC_ALL=C grep -q '[^ -~]' said; then fail "$command: unprintable: $(cat said)"; fi
    left=$(find out tmp -mindepth 1)
    [ "$left" = out/2016b.9 ] || fail "$command: left $left"
done <<'END'
make update deb one|usage: make-dataset update|system TZDATA ICU DIRECTORY
make upgrade deb one out/2016b.1|usage: make-dataset update|system TZDATA ICU DIRECTORY
make update one one out/2016b|one/usr/share/zoneinfo/tzdata.zi: not a readable file
make system 2016B one out/share|2016B: first line is not of the form '# version 2016a'
make system 2147483648b one out/share|2147483648b: contains a number greater than 2147483647
make system table/tzdata.zi one out/share|table/zone.tab: not a readable file
make update deb one out/2016b.1.99999999999999999999|.99999999999999999999: contains a number greater
make update deb one out/2016b.1.|2016b.1.: not a version such as 2016a.1.0
make update deb one out/2016bb.1|2016bb.1: not a version of release 2016b, such as 2016b.1.1
make update deb one out/2016b.9/|out/2016b.9/: already exists
make system deb nowhere out/share|nowhere: not a readable file
make system deb none out/share|none: contains no ICU data file
make system deb two out/share|two: contains more than one ICU data file
make system deb misnamed out/share|misnamed/icutz44x.dat: name is not like icutz44l.dat
make system deb 1/named out/share|1/named: name is not like icutz44l.dat, icudt72l.dat or 44/le
make system deb 2/le out/share|2/le: contains no metaZones.res
make system deb 3/le out/share|3/le/root.res: not one of
make system deb 4/le out/share|4/le: timezoneTypes.res is not of schema 4l
make system deb 5/le out/share|5/le: windowsZones.res is not ICU data
make system deb 6/le out/share|6/le: icupkg cannot pack it
make system deb 7/le out/share|7/le: zoneinfo64.res contains no release
make system deb 8/be out/share|8/be: zoneinfo64.res is not of schema 8b
make system deb icutz45l.dat out/share|icutz45l.dat: zoneinfo64.res is not of schema 45l
make system deb icutz46l.dat out/share|icutz46l.dat: contains no zoneinfo64.res
make system deb icudt1l.dat out/share|icudt1l.dat: icupkg cannot unpack it
sh without-zic update deb one out/2016b|zic: not found
sh without-icupkg update deb one out/2016b|icupkg: not found
make update deb one none/none/2016b|none/none: No such file or directory
make update 2016b one out/2016b|2016b: contains no zone
make update cut/tzdata.zi one out/2016b|cut/tzdata.zi: contains no C/D, which zone1970.tab lists
make system deb -one out/share|-one: begins with '-' or contains a newline
make update nonsense one out/2016b|nonsense: zic cannot compile it
PATH=dying:$PATH make update deb one out/2016b|dying
make system "$hostile" one out/share|\x1b[31m\x9b1m\033: zic cannot compile it
END

# Whatever the input's modes and the umask, the dataset is complete and everybody can read it.
chmod 700 one/icutz44l.dat 44/le/*.res
chmod 2700 out
(
    umask 777
    make update deb one out/2016b.1.0
    make system deb/usr/share/zoneinfo/tzdata.zi 44/le out/share
) >said 2>&1
[ ! -s said ] || fail "said: $(cat said)"
[ "$(grep -chx '2[0-9]*[a-z]*' out/2016b.1.0/icutz/+VERSION out/share/icu/+VERSION)" = '1
1' ] || fail "the release of ICU's data is missing"
rm out/*/icu*/+VERSION
(cd out && find 2016b.1.0 share -type f -perm 644 -o -type d ! -perm 755 | sort &&
    cat share/icu/*.txt ./*/zoneinfo*/+VERSION ./*/zoneinfo*/zone.tab) | xargs -n 3 | diff /dev/fd/3 - 3<<'END'
2016b.1.0/icutz/icutz44l.dat 2016b.1.0/icutz/metaZones.res 2016b.1.0/icutz/timezoneTypes.res
2016b.1.0/icutz/windowsZones.res 2016b.1.0/icutz/zoneinfo64.res 2016b.1.0/zoneinfo/+VERSION
2016b.1.0/zoneinfo/A/B 2016b.1.0/zoneinfo/tzdata.zi 2016b.1.0/zoneinfo/zone.tab
share/icu/icutz44l.dat share/icu/icutzformat.txt share/icu/metaZones.res
share/icu/timezoneTypes.res share/icu/windowsZones.res share/icu/zoneinfo64.res
share/zoneinfo.default/+VERSION share/zoneinfo.default/A/B share/zoneinfo.default/tzdata.zi
share/zoneinfo.default/zone.tab 44l 2016b
2016b AB AB
END

# Every form gives the same items, one by one and packed, and older data is reported.
while read -r icu schema reference; do
    make update 9999a.zi "$icu" out/9999a >said 2>&1
    grep -q "$icu.*: release 2[0-9]*[a-z] is older than 9999a" said || fail "$(cat said)"
    rm out/9999a/icutz/+VERSION
    icupkg --auto_toc_prefix -d tmp -x items.txt "out/9999a/icutz/icutz$schema.dat"
    rm "out/9999a/icutz/icutz$schema.dat"
    diff -r tmp "$reference"
    diff -r out/9999a/icutz "$reference"
    rm -r tmp/* out/9999a
done <<'END'
one 44l 44/le
icudtl.dat 44l 44/le
icutz44b.dat 44b 44/be
44/be 44b 44/be
9/ee 9e 44/ee
END
