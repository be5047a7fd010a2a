#!/usr/bin/env python3
# SPDX-License-Identifier: BSD-2-Clause
"""Compares what tzctl predicts with what a start then does, on random states of the disk.

usage: prediction_test.py BUILD-DIRECTORY [STATES [SEED]]

The states are laid out in a root directory of its own, which this process enters.
"""
import json
import os
import random
import re
import shutil
import subprocess
import sys
import tempfile

system = "/usr/share/zoneinfo.default"
updates = ["2016a", "2016b.1", "2016c.1.0", "2016d", "2016e.1.0", "x", "9999999999a"]

# What may lie at a path: None for nothing, "->" and a link's target, "=" and a file's text, "/" for
# a directory, "/x" for one that is not empty, "|" for a FIFO, "-" for a file that only root may
# read. In a target "@" is the directory of some update, "~/" the state directory, "?" a few bytes.
oddities = [None, "=", "/", "/x", "|", "->nowhere", "->?", "->/", "->~/zoneinfo", "->~/localtime"]
menu = {
    system + "/+VERSION": ["=2016c"] * 20 + ["= \n2016d x", "=2016C", "=9999999999a", *oddities],
    system + "/Europe/Paris": ["=", None],
    "/usr/share/icu/icutzformat.txt": ["=44l"] * 20 + ["=44b", "=?", *oddities],
    "~/zoneinfo": ["->@/zoneinfo"] * 20 + ["->" + system] * 9 + ["->@", "->~/tz//zoneinfo",
                   "->../timezone/tz/2016d/zoneinfo", "->@/../2016e.1.0/zoneinfo", "->@?/zoneinfo",
                   *oddities],
    "~/icutz": ["->@/icutz"] * 9 + [None] * 9 + oddities,
    "~/tz_latest": ["->@"] * 30 + [None] * 9 + ["->@/", "->~/tz/", "->@/../2016d", "->@?", *oddities],
    "~/localtime": ["->~/zoneinfo/Europe/Paris"] * 9 + ["->/usr/share/zoneinfo/Europe/Paris",
                    "->/usr/share/zoneinfo/x", "->/usr/share/zoneinfo?", *oddities],
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


def some_bytes(chance):
    """A few bytes, many of them odd in a text; none ends a name or a line."""
    likely = b"\\x5c\\\xff\xe9\xed\xa0\x80\x1b\xe2\x80\xae\x7f"
    some = [chance.choice(likely) if chance.random() < 0.7 else chance.randrange(1, 256)
            for _ in range(chance.randrange(1, 6))]
    return os.fsdecode(bytes(some).translate(None, b"/\n") or b"\\")


def lay(path, choices, chance):
    """Puts one of the choices at a path, unless something there is in the way."""
    def spelt(text):
        some_update = "~/tz/" + chance.choice(updates)
        text = text.replace("@", some_update).replace("~", "/var/db/timezone")
        return text.replace("?", some_bytes(chance)) if "?" in text else text

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
            file.write(os.fsencode(spelt(what[1:])))
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
        for update in updates + [chance.choice(updates) + "?"]:
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
    """Inode, mode, size and modification time of every entry."""
    return {path: (status.st_ino, status.st_mode, status.st_size, status.st_mtime_ns)
            for top in ("/data", "/usr", "/var") for directory, _, names in os.walk(top)
            for path in [directory] + [directory + "/" + name for name in names]
            for status in [os.lstat(path)]}


def what_happened(before, status, said):
    """What a start did, in the keys of tzctl: concluded from its links and its warnings."""
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


def as_on_disk(told):
    """The output of tzctl, with each text as the bytes that it stands for."""
    if isinstance(told, dict):
        return {key: as_on_disk(value) for key, value in told.items()}
    if isinstance(told, list):
        return [as_on_disk(value) for value in told]
    return told if not isinstance(told, str) else os.fsdecode(
        re.sub(rb"\\x([0-9a-f]{2})", lambda byte: bytes([int(byte[1], 16)]), told.encode()))


def agree(decision, current, latest):
    """Whether these verdicts on the two links can lead to this decision."""
    if decision == "keep":
        return current == "fits" and latest not in ("fits", "failed")
    if decision == "drop":
        return current in ("other schema", "not newer") and latest not in ("fits", "failed")
    return decision != "adopt" or latest == "fits"


def run_in_turn(build, root, leave_root):
    """Two functions: one runs tzctl's status from outside of the root directory; the other runs a
    start: inside, if the program is static and so needs no libraries there."""
    def run(leave, *command):
        return subprocess.run(command, capture_output=True, timeout=60, check=False,
                              preexec_fn=leave_root if leave else None)

    tzctl, start = os.path.abspath(build + "/tzctl"), os.path.abspath(build + "/tests/tzreconcile")
    static = not os.path.exists(start)
    if static:
        shutil.copy(build + "/tzreconcile", root)
    return (lambda: run(True, tzctl, "--root", root, "status", "--json"),
            lambda: run(False, "/tzreconcile") if static else run(True, start, root))


def check(number, foretell, start_up):
    """Lays out one state, predicts the start, and runs it; returns the decision."""
    lay_out(random.Random(number))
    before, disk = links(), everything()
    looked = foretell()
    assert (looked.returncode, looked.stderr) == (0, b""), f"{number}: {looked}"
    assert everything() == disk, f"{number}: looking has changed the disk"
    told = as_on_disk(json.loads(looked.stdout))
    foretold = told["next_start"]
    shown = [told["links"][name]["target"] for name in ("zoneinfo", "icutz", "localtime")]
    assert shown == before, f"{number}: showed {shown} instead of {before}"
    reason, warnings = foretold.pop("reason"), foretold.pop("warnings")
    current, latest = foretold.pop("current"), foretold.pop("latest")
    start = start_up()
    said = [line.partition(": ")[2] for line in os.fsdecode(start.stderr).split("\n")[:-1]]
    happened = what_happened(before, start.returncode, "\n".join(said))
    assert foretold == happened, f"{number}:\nforetold {foretold}\nhappened {happened}\n{said}"
    assert agree(foretold["decision"], current, latest) and reason, (
        f"{number}: {foretold['decision']}, though current {current}, latest {latest}: {reason}")
    assert len(said) == len(warnings) and all(
        (line + ": ").startswith(line_said.rpartition(": ")[0] + ": ")
        for line, line_said in zip(warnings, said)), f"{number}:\ntold {warnings}\nsaid {said}"
    return happened["decision"]


def main(build, states="300", seed="0"):
    if os.geteuid() != 0:
        print("Not root, so this needs user namespaces, which a chroot does not allow.",
              file=sys.stderr, flush=True)
        os.execvp("unshare", ["unshare", "--map-root-user", sys.executable, *sys.argv])
    os.environ["ASAN_OPTIONS"] = "detect_leaks=0"  # which cannot be done in another root
    outside = os.open("/", os.O_RDONLY)

    def leave_root():
        os.fchdir(outside)
        os.chroot(".")

    with tempfile.TemporaryDirectory() as root:
        programs = run_in_turn(build, root, leave_root)
        os.chroot(root)
        os.chdir("/")
        try:
            decisions = [check(number, *programs)
                         for number in range(int(seed), int(seed) + int(states))]
        finally:
            leave_root()
    missing = {"keep", "adopt", "drop", "reset", "fail"} - set(decisions)
    assert not missing, f"no state led to {missing}"
    print(f"{len(decisions)} states foretold")


main(*sys.argv[1:])
