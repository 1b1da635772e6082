"""Memory that runs out: each request fails, one run after the other."""
import os
import subprocess

import pytest

from conftest import TESSEL, some_paths

FAILING_MEMORY = os.environ.get("FAILING_MEMORY")

pytestmark = pytest.mark.skipif(not FAILING_MEMORY,
                                reason="FAILING_MEMORY names no library")

OLD = some_paths(60, 1)
NEW = some_paths(60, 2)

# After so many requests, only each of so many fails: packing makes thousands.
ALL_UP_TO = 100
STEP = 97

# What the user is told: without its memory, the system refuses a thread, too.
REFUSALS = (b"tessel: memory is used up; close other programs or raise the "
            b"limit\n", b"tessel: cannot start a thread: ")


def runs_without_memory(tessel, words, prepare=lambda: None):
    """Runs the command with its first, second ... request for memory refused,
    and all later ones or that one alone, until it needs no more. Yields the
    result, which is a success or one line and the documented status."""
    mark = tessel.folder / "mark"
    for plan in "{}", "{0}-{0}":
        number = 0
        mark.touch()
        while mark.exists():
            number += 1 if number < ALL_UP_TO else STEP
            assert number < 30000
            mark.unlink()
            prepare()
            done = subprocess.run(
                [TESSEL, *words], cwd=tessel.folder, timeout=60,
                stdout=subprocess.PIPE, stderr=subprocess.PIPE, check=False,
                env={**os.environ, "LD_PRELOAD": FAILING_MEMORY,
                     "FAIL_MARK": str(mark),
                     "FAIL_MEMORY": plan.format(number)})
            what = (plan, number, done.returncode, done.stderr)
            assert done.returncode in (0, 5), what
            if done.returncode == 5:
                assert done.stderr.startswith(REFUSALS), what
                assert done.stderr.count(b"\n") == 1, what
            yield what, done
        assert number > 3, "nothing was allocated"


@pytest.mark.parametrize("words,old,new", [
    (["-f"], OLD, NEW),
    (["--append", "-j", "3"], OLD, OLD + NEW),
    ([], None, NEW),
], ids=["replace", "append", "create"])
def test_packing(tessel, words, old, new):
    (tessel.folder / "list").write_bytes(b"\n".join(NEW) + b"\n")
    file = tessel.folder / "a.tessel"
    before = None
    if old is not None:
        tessel.pack(old)
        before = file.read_bytes()

    def prepare():
        if before is None:
            file.unlink(missing_ok=True)
        else:
            file.write_bytes(before)

    after = None
    for what, done in runs_without_memory(
            tessel, ["pack", "list", "-o", "a.tessel", *words], prepare):
        held = file.read_bytes() if file.exists() else None
        if done.returncode == 0 and after is None:
            assert tessel.list() == new, what
            after = held
        # It fails after the archive is in place if the line that tells so
        # cannot be written.
        assert held in (before, after) or tessel.list() == new, what
        assert held == after or done.returncode == 5, what
        assert tessel.leftovers() == [], what


@pytest.mark.parametrize("words", [
    ["list", "a.tessel"], ["list", "a.tessel", "--salvage"],
    # Not find --glob and info --json: where memory runs out in RE2's first use
    # or in the JSON library's destructors, these end the process.
    ["find", "a.tessel", "lib", "-j", "3"],
    ["get", "a.tessel", "0--1"], ["info", "a.tessel"],
    ["number", "a.tessel", os.fsdecode(OLD[0])],
    ["verify", "a.tessel", "-j", "3"], ["diff", "a.tessel", "a.tessel"],
    ["--help"], ["pack", "--help"]], ids=lambda words: "-".join(words))
def test_reading(tessel, words):
    tessel.pack(OLD)
    right = tessel(*words)
    for what, done in runs_without_memory(tessel, words):
        if done.returncode == 0:
            assert done.stdout == right.out, what
            assert done.stderr == right.err, what


def test_exporting(tessel):
    tessel.pack(OLD)
    tessel("export", "a.tessel", "-o", "right.store")
    right = (tessel.folder / "right.store").read_bytes()
    store = tessel.folder / "a.store"
    for what, done in runs_without_memory(
            tessel, ["export", "a.tessel", "-f", "-o", "a.store"],
            lambda: store.write_bytes(b"old")):
        held = store.read_bytes()
        assert held in (right, b"old"), what
        assert held == right or done.returncode == 5, what
        assert tessel.leftovers() == [], what
