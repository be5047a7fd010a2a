#!/usr/bin/env python3
# SPDX-License-Identifier: BSD-2-Clause
"""Checks how tzctl compares the system's zones with an edited copy, against Python's zoneinfo.

usage: zones_test.py TZCTL
"""
import bisect
import datetime
import json
import os
import pathlib
import re
import struct
import subprocess
import sys
import tempfile
import time
import zoneinfo

YEAR = time.gmtime().tm_year
OWN_ZONES = f"""
Z Own/Abbreviation 1 - [AAA|BBB]
Z Own/Flag [2 -|1 1] AAA
Z Own/Week 1 - AAA {YEAR + 3} Jul 1 12:34:56
[1|2] - AAA {YEAR + 3} Jul 8 12:34:56
1 - AAA
""" + "".join(f"""
Z Own/Day{day} 1 - AAA {YEAR + 9} Jul {day} 0:{day}
2 - BBB {YEAR + 9} Jul {day + 1} 0:{day}:[1|2]
3 - CCC
""" for day in range(1, 15))


def small_zone(changes_to=0, rule=b"ABC0"):
    """A compiled zone with one local type and a change, long ago, to the type of that number."""
    header = b"TZif2" + bytes(15) + struct.pack(">6I", 0, 0, 0, 1, 1, 4)
    types = bytes([changes_to]) + struct.pack(">iBB4s", 0, 0, 0, b"ABC")
    return header + bytes(4) + types + header + bytes(8) + types + b"\n" + rule + b"\n"


def link(target):
    return lambda path: path.symlink_to(target)


ZONE = small_zone()
UNREADABLE = {"text": b"text", "type": small_zone(changes_to=1), "rule": small_zone(rule=b"A"),
              "large": small_zone(rule=b"ABC0" + b" " * 70000),
              "outside": link("../../zoneinfo/UTC"), "circle": link("circle"),
              "directory": pathlib.Path.mkdir, "fifo": os.mkfifo,
              **{f"cut at {size}": ZONE[:size] for size in range(len(ZONE))}}
DEEP = "1/2/3/4/5/6/7/8/"
ODD_FILES = [  # name, what lies there in each directory, where it is reported
    *((f"odd/{name}", ZONE, odd, "unreadable_to") for name, odd in UNREADABLE.items()),
    ("odd/before", b"text", ZONE, "unreadable_from"),
    ("odd/new", None, ZONE[:-1], "unreadable_to"),
    ("first_version", ZONE, ZONE[:59].replace(b"TZif2", b"TZif\0"), None),
    ("gone", ZONE, None, "removed"),
    ("dangling", ZONE, link("nowhere"), "removed"),
    ("new", None, ZONE, "added"),
    ("link/up", None, link("../new"), "added"),
    (DEEP + "9", None, ZONE, "added"),
    (DEEP * 3 + "too_deep", None, ZONE, None),
    ("+VERSION", b"1", b"2", None),
    *((name, ZONE, None, None) for name in ("posix/gone", "right/gone", "posixrules")),
]


def lay_out(old, new):
    text = pathlib.Path("/usr/share/zoneinfo/tzdata.zi").read_text(encoding="utf-8") + OWN_ZONES
    later = re.sub(r"^(R E \d+ ma - .*) 1u ", r"\1 2u ", text, flags=re.M)  # by an hour, in Europe
    for top, form, choice, rules in ((old, "fat", r"\1", text), (new, "slim", r"\2", later)):
        subprocess.run(["zic", "-b", form, "-d", top, "-"], check=True, text=True,
                       input=re.sub(r"\[(.*)\|(.*)\]", choice, rules),
                       env={"PATH": os.environ["PATH"] + ":/usr/sbin"})
    for name, before, after, _ in ODD_FILES:
        for path, what in ((old / name, before), (new / name, after)):
            path.parent.mkdir(parents=True, exist_ok=True)
            if callable(what):
                what(path)
            elif what is not None:
                path.write_bytes(what)


def zones(top):
    """The contents of a directory's zones, by name."""
    found = {path: path.read_bytes() for path in top.rglob("*") if path.is_file()}
    return {str(path.relative_to(top)): contents for path, contents in found.items()
            if contents.startswith(b"TZif")}


def local_types(path, start, end):
    """The local type from each moment on; periods of less than five days may be missing."""
    with path.open("rb") as file:
        zone = zoneinfo.ZoneInfo.from_file(file)
    os.environ["TZ"] = f":{path}"
    time.tzset()

    def at(moment):
        local = datetime.datetime.fromtimestamp(moment, zone)
        return {"offset": int(local.utcoffset().total_seconds()), "abbreviation": local.tzname(),
                "dst": time.localtime(moment).tm_isdst == 1}  # zoneinfo has no such flag

    found = {start: (now := at(start))}
    for low in range(start, end - 1, 5 * 86400):
        high = min(low + 5 * 86400, end - 1)
        while at(high) != now:
            low += bisect.bisect_left(range(low, high), True, key=lambda moment: at(moment) != now)
            found[low] = now = at(low)
    return found


def first_change(zone, old, new):
    before = after = None
    for moment in sorted({*old, *new}):
        before, after = old.get(moment, before), new.get(moment, after)
        if before != after:
            return [{"zone": zone, "at": moment, "before": before, "after": after}]
    return []


def lay_out_image(image):
    """An image whose own data differs from that of its latest update."""
    state, share = image / "var/db/timezone", image / "usr/share"
    new = state / "tz/2016d"
    lay_out(share / "zoneinfo.default", new / "zoneinfo")
    for path, text in ((share / "zoneinfo.default/+VERSION", "2016c"),
                       (new / "icutz/icutz44l.dat", ""),
                       (share / "icu/icutzformat.txt", "44l")):
        path.parent.mkdir(exist_ok=True)
        path.write_text(text, encoding="utf-8")
    for path, target in ((state / "zoneinfo", "/usr/share/zoneinfo.default"),
                         (state / "tz_latest", "/var/db/timezone/tz/2016d"),
                         (state / "localtime", "/var/db/timezone/zoneinfo/Europe/Paris"),
                         (image / "etc/localtime", "../var/db/timezone/localtime")):
        path.parent.mkdir(exist_ok=True)
        path.symlink_to(target)
    return share, new


def expected_differences(old, new, span):
    expected = {where: sorted(row[0] for row in ODD_FILES if row[3] == where)
                for where in ("added", "removed", "unreadable_from", "unreadable_to")}
    one, other = zones(old), zones(new)
    both = (one.keys() & other.keys()).difference(*expected.values())
    expected["compared"] = len(both)
    known = {}
    for top, files in ((old, one), (new, other)):
        for zone in both:
            if one[zone] != other[zone] and files[zone] not in known:
                known[files[zone]] = local_types(top / zone, *span)
    expected["changed"] = [
        change for zone in sorted(both) if one[zone] != other[zone]
        for change in first_change(zone, known[one[zone]], known[other[zone]])]
    assert len(expected["changed"]) > 40
    return expected


def main(program):
    os.environ["ASAN_OPTIONS"] = "detect_leaks=0"  # which cannot be done in another root
    with tempfile.TemporaryDirectory() as work:
        image = pathlib.Path(work, "image")
        share, new = lay_out_image(image)

        def tzctl(*words, status=0):
            done = subprocess.run([program, "--root", image, *words], stdout=subprocess.PIPE,
                                  stderr=subprocess.STDOUT, check=False, timeout=60, text=True,
                                  cwd=work)
            assert done.returncode == status, done
            return done.stdout

        def differences(*operands):
            return json.loads(tzctl("diff", "--json", *operands))

        found = differences()
        expected = expected_differences(share / "zoneinfo.default", new / "zoneinfo",
                                        (found["start"], found["end"]))
        expected.update({"format": 1, "from": "2016c.1.0", "to": "2016d",
                         "local_zone": "Europe/Paris"})
        for what, values in expected.items():
            assert found[what] == values, f"{what}:\nexpected {values}\nfound    {found[what]}"

        changed = [change["zone"] for change in found["changed"]]
        for names, *operands in (("2016c.1.0 2016d", "latest"),
                                 ("2016c.1.0 2016d", "system", "2016d"),
                                 ("share zoneinfo", "image/usr/share", f"{new}/zoneinfo/"),
                                 ("2016d 2016c.1.0", "image/var/db/timezone/tz/2016d", "current")):
            other = differences(*operands)
            assert [change["zone"] for change in other["changed"]] == changed, operands
            assert f"{other['from']} {other['to']}" == names, names

        lost = len({*found["removed"], *found["unreadable_to"]} - {*found["unreadable_from"]})
        local_time = image / "etc/localtime"
        local_time.rename(image / "etc/former")
        local_time.symlink_to(f"../var/db/timezone/zoneinfo/{found['removed'][0]}")
        assert f"{found['removed'][0]}, will be UTC: 2016d lacks" in " ".join(tzctl().split())
        (image / "etc/former").rename(local_time)

        effect = f"Other zones that change: {len(changed) - 1}. Zones that become UTC: {lost}."
        for words, status, text in (
                (["status"], 0, "Local time, Europe/Paris, changes at "), (["status"], 0, effect),
                (["diff"], 0, "CET (UTC+01:00) instead of CEST (UTC+02:00, DST)"),
                (["diff", "./nothing"], 1, "./nothing: No such file"),
                (["diff", "image/etc"], 1, "image/etc: holds no zone file"),
                (["diff", "2016z"], 1, "2016z: not an installed version"),
                (["diff", ".."], 1, "..: not an installed version"),
                (["diff", "system", "current", "latest"], 2, "latest"),
                (["use", "2016d"], 0, "Current now"),
                (["diff"], 0, "Local time, Europe/Paris, does not change."),
                (["status"], 0, "does not change. Other zones that change: none.")):
            output = tzctl(*words, status=status)
            assert text in " ".join(output.split()), f"{words}:\n{output}"
    print(f"{len(changed)} of {expected['compared']} zones change")


main(*sys.argv[1:])
