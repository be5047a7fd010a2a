#!/usr/bin/env python3
# SPDX-License-Identifier: BSD-2-Clause
"""Holds what tzctl foretells against what a start then does, on random states of the disk.

usage: prediction_test.py BUILD-DIRECTORY [STATES [SEED]]

All happens in a root directory of its own, in which the programs are all that runs.
"""
import json
import os
import random
import shutil
import subprocess
import sys
import tempfile

system = "/usr/share/zoneinfo.default"
updates = ["2016a", "2016b.1", "2016c.1.0", "2016d", "2016e.1.0", "x", "9999999999a"]

# What may lie at a path: None for nothing, "->" and a link's target, "=" and a file's text, "/" for
# a directory, "/x" for one that is not empty, "|" for a FIFO, "-" for a file that only root may
# read. In a target "@" is the directory of some update, "~/" the state directory.
oddities = [None, "=", "/", "/x", "|", "->nowhere", "->/", "->~/zoneinfo", "->~/localtime"]
menu = {
    system + "/+VERSION": ["=2016c"] * 20 + ["= \n2016d x", "=2016C", "=9999999999a", *oddities],
    system + "/Europe/Paris": ["=", None],
    "/usr/share/icu/icutzformat.txt": ["=44l"] * 20 + ["=44b", *oddities],
    "~/zoneinfo": ["->@/zoneinfo"] * 20 + ["->" + system] * 9 + ["->@", "->~/tz//zoneinfo",
                   "->../timezone/tz/2016d/zoneinfo", "->@/../2016e.1.0/zoneinfo", *oddities],
    "~/icutz": ["->@/icutz"] * 9 + [None] * 9 + oddities,
    "~/tz_latest": ["->@"] * 30 + [None] * 9 + ["->@/", "->~/tz/", "->@/../2016d", *oddities],
    "~/localtime": ["->~/zoneinfo/Europe/Paris"] * 9 + ["->/usr/share/zoneinfo/Europe/Paris",
                    "->/usr/share/zoneinfo/x", "->/usr/share/zoneinfo", *oddities],
    "~/needs_cleanup": ["->@/icutz/icutz44l.dat", *oddities],
    "~/TZVersionDiffRecord": ["->@/zoneinfo/Europe/Paris", *oddities],
    "/var/db/icutz": [None] * 9 + ["->@/icutz", "->~/icutz", "->/usr", *oddities],
    "/var/db/icu": oddities,
}
update_icu = {
    "/icutz/icutz44l.dat": ["="] * 30 + ["-", "/", "|", "->/usr/share/icu/icutzformat.txt"],
    "/icutz/icutz44b.dat": [None] * 9 + ["="],
    "/zoneinfo/Europe/Paris": ["=", "=", None],
}
linked_icu = {"/icutz": ["->@/icutz", "->~/icutz", "->/var/db/icutz", *oddities]}


def lay(path, choices, chance):
    """Puts one of the choices at a path, unless something there is in the way."""
    def spelt(text):
        some_update = "~/tz/" + chance.choice(updates)
        return text.replace("@", some_update).replace("~", "/var/db/timezone")

    path, what = spelt(path), chance.choice(choices)
    if what is None or os.path.lexists(path):
        return
    os.makedirs(os.path.dirname(path), exist_ok=True)
    if what.startswith("->"):
        os.symlink(spelt(what[2:]), path)
    elif what[0] == "/":
        os.makedirs(path + what)
    elif what == "|":
        os.mkfifo(path)
    else:
        with open(path, "wb") as file:
            file.write(what[1:].encode())
        os.chmod(path, 0o600 if what == "-" else 0o644)


def lay_out(chance):
    """Makes a random state, in which much is as it should be."""
    for name in ("data", "usr", "var"):
        shutil.rmtree("/" + name, ignore_errors=True)
    os.makedirs("/data")
    os.makedirs("/var/db")
    if chance.random() < 0.1:
        lay(chance.choice(["~", "~/tz"]), ["->/data", "->/var/db/icu", "->/var/db/icutz"], chance)
    try:
        for update in updates:
            for name, choices in (update_icu if chance.random() < 0.9 else linked_icu).items():
                lay("~/tz/" + update + name, choices, chance)
        for path, choices in menu.items():
            lay(path, choices, chance)
    except OSError:
        pass  # a link in the way leads nowhere: odd enough as it is


def target(path):
    return os.readlink(path) if os.path.islink(path) else None


def links():
    return [target("/var/db/timezone/" + name) for name in ("zoneinfo", "icutz", "localtime")]


def everything():
    """All that can be told of the disk without looking into it; access times do not count."""
    return {path: (status.st_ino, status.st_mode, status.st_size, status.st_mtime_ns)
            for top in ("/data", "/usr", "/var") for directory, _, names in os.walk(top)
            for path in [directory] + [directory + "/" + name for name in names]
            for status in [os.lstat(path)]}


def run(*command):
    return subprocess.run(command, capture_output=True, timeout=20, check=False)


def what_happened(before, status, said):
    """In the words of tzctl, judged by what a start has left behind and said."""
    zoneinfo, icutz, localtime = links()
    in_update = (zoneinfo or "").startswith("/var/db/timezone/tz/")
    if status != 0:
        decision = "fail"
    elif "Unable to locate data" in said:
        decision = "reset"
    elif in_update and zoneinfo != before[0]:
        decision = "adopt"
    elif "Invalid current symlinks" in said:
        decision = "reset"
    else:
        decision = "drop" if "Symlink points at data" in said else "keep"
    dataset = zoneinfo.rsplit("/", 1)[0] if in_update else ""
    return {"decision": decision, "dataset": None if status else dataset, "icutz": icutz,
            "localtime": localtime, "changes": links() != before}


def check(number):
    """Lays out one state, and has it foretold and started; returns the decision."""
    lay_out(random.Random(number))
    before, disk = links(), everything()
    looked = run("/tzctl", "status", "--json")
    assert (looked.returncode, looked.stderr) == (0, b""), looked
    assert everything() == disk, "looking has changed the disk"
    foretold = json.loads(looked.stdout)["next_start"]
    assert foretold.pop("reason")
    told = run("/tzctl").stdout.decode().partition("It will say")[2].partition("\n\n")[0]
    start = run("/tzreconcile")
    said = start.stderr.decode().replace("tzreconcile: ", "")
    happened = what_happened(before, start.returncode, said)
    assert foretold == happened, f"{number}:\nforetold {foretold}\nhappened {happened}\n{said}"
    for line in said.splitlines():
        message = " ".join(line.rpartition(": ")[0].split())
        assert message in " ".join(told.split()), f"{number}:\ntold {told}\nsaid {said}"
    return happened["decision"]


def main(build, states="300", seed="0"):
    if os.geteuid() != 0:
        os.execvp("unshare", ["unshare", "--map-root-user", sys.executable, *sys.argv])
    with tempfile.TemporaryDirectory() as root:
        for program in ("tzctl", "tzreconcile"):
            shutil.copy(f"{build}/{program}", root)
        outside = os.open("/", os.O_RDONLY)
        os.chroot(root)
        os.chdir("/")
        try:
            decisions = [check(number) for number in range(int(seed), int(seed) + int(states))]
        finally:
            os.fchdir(outside)
            os.chroot(".")
    missing = {"keep", "adopt", "drop", "reset", "fail"} - set(decisions)
    assert not missing, f"no state led to {missing}"
    print(f"{len(decisions)} states foretold")


main(*sys.argv[1:])
