"""Disks that fail: each call to the system fails once, one after the other."""
import errno
import os
import subprocess

import pytest

from conftest import TESSEL, Tessel, some_paths
from failing_calls import ERRORS

FAILING_CALLS = os.environ.get("FAILING_CALLS")

pytestmark = pytest.mark.skipif(not FAILING_CALLS,
                                reason="FAILING_CALLS names no library")

OLD = some_paths(400, 1)
NEW = some_paths(400, 2)

def runs_with_failures(tessel, words, prepare, all_errors=ERRORS):
    """Runs the command with the first, second ... call of every kind failing
    until no call is left to fail. Yields what failed and the result."""
    disk = tessel.folder / "disk"
    disk.mkdir()
    mark = tessel.folder / "mark"
    for kind, errors in all_errors.items():
        for error in errors:
            number = 0
            mark.touch()
            while mark.exists():
                number += 1
                assert number < 200, (kind, error)
                mark.unlink()
                prepare(disk)
                done = subprocess.run(
                    [TESSEL, *words], cwd=tessel.folder, timeout=60,
                    stdout=subprocess.PIPE, stderr=subprocess.PIPE,
                    check=False, env={
                        **os.environ, "LD_PRELOAD": FAILING_CALLS,
                        "FAIL_FOLDER": str(disk), "FAIL_MARK": str(mark),
                        "FAIL_CALL": f"{kind} {number} {error}"})
                if mark.exists():
                    yield (kind, number, errno.errorcode.get(error)), done


def check_end(what, done, told=b""):
    """Success, which tells this much, or one line and the documented status."""
    if done.returncode == 0:
        assert done.stderr == told, what
    else:
        assert done.returncode == 5, (what, done.stderr)
        assert done.stderr.startswith(b"tessel: "), (what, done.stderr)
        assert done.stderr.count(b"\n") == 1, (what, done.stderr)
        assert len(done.stderr) > 20, (what, done.stderr)


@pytest.mark.parametrize("words,old,new", [
    (["-f"], OLD, NEW),
    (["--append"], OLD, OLD + NEW),
    ([], None, NEW),
], ids=["replace", "append", "create"])
def test_packing(tessel, words, old, new):
    before = tessel.folder / "before"
    if old is not None:
        tessel.pack(old, "before")

    def prepare(disk):
        for left in disk.iterdir():
            left.unlink()
        (disk / "list").write_bytes(b"\0".join(NEW) + b"\0")
        # What a killed writer left, for the calls that remove it.
        (disk / ".a.tessel.tessel-abc123.tmp").write_bytes(b"left")
        if old is not None:
            (disk / "a.tessel").write_bytes(before.read_bytes())
            os.chmod(disk / "a.tessel", 0o600)

    outcomes = set()
    for what, done in runs_with_failures(
            tessel, ["pack", "-0", str(tessel.folder / "disk/list"), "-o",
                     str(tessel.folder / "disk/a.tessel"), *words], prepare):
        check_end(what, done)
        outcomes.add(done.returncode)
        left = set(os.listdir(tessel.folder / "disk")) - {"list"}
        if done.returncode == 0:
            assert tessel.list("disk/a.tessel") == new, what
        elif old is not None:
            assert tessel.list("disk/a.tessel") == old, what
        # Only what this run did not write may stay.
        left -= {".a.tessel.tessel-abc123.tmp"}
        assert left == ({"a.tessel"} if done.returncode == 0 or old is not None
                        else set()), what
        if old is not None:
            mode = os.stat(tessel.folder / "disk/a.tessel").st_mode
            assert mode & 0o777 == 0o600 or what[0] == "fchmod", what
    assert outcomes == {0, 5}


@pytest.mark.parametrize("words", [
    ["list"], ["find", "{}", "lib"], ["get", "{}", "0--1"], ["info"],
    ["number", "{}", os.fsdecode(OLD[0])], ["verify"],
    ["list", "{}", "--salvage"]], ids=lambda words: words[-1])
def test_reading(tessel, words):
    tessel.pack(OLD, "before")
    file = str(tessel.folder / "disk/a.tessel")
    words = [word.format(file) for word in words]
    if file not in words:
        words.append(file)

    def prepare(disk):
        (disk / "a.tessel").write_bytes(
            (tessel.folder / "before").read_bytes())

    right = None
    for what, done in runs_with_failures(tessel, words, prepare):
        if right is None:
            right = tessel(*words)
        check_end(what, done, right.err)
        if done.returncode == 0:
            assert done.stdout == right.out, what


@pytest.mark.parametrize("words", [
    ["pack", "list", "-f", "-j", "4", "-o", "disk/a.tessel"],
    ["list", "a.tessel"], ["find", "a.tessel", "e", "-j", "4"],
    ["verify", "a.tessel", "-j", "4"]], ids=lambda words: words[0])
def test_threads_that_cannot_start(tessel, words):
    paths = some_paths(50000)
    (tessel.folder / "list").write_bytes(b"\n".join(paths) + b"\n")
    tessel("pack", "list", "-o", "a.tessel")
    right = tessel(*words) if words[0] != "pack" else None
    failures = 0
    for what, done in runs_with_failures(
            tessel, words, lambda disk: None, {"pthread_create": [errno.EAGAIN]}):
        failures += 1
        check_end(what, done)
        assert done.returncode == (5 if what[1] == 1 else 0), what
        if done.returncode == 0 and right:
            assert done.stdout == right.out, what
        elif done.returncode == 0:
            assert ((tessel.folder / "disk/a.tessel").read_bytes() ==
                    (tessel.folder / "a.tessel").read_bytes())
    assert failures > 1


@pytest.fixture(scope="module")
def many(tmp_path_factory):
    """More paths than the command decodes ahead, and their archive."""
    tessel = Tessel(tmp_path_factory.mktemp("many"))
    paths = some_paths(300000)
    tessel.pack(paths)
    return paths, (tessel.folder / "a.tessel").read_bytes()


@pytest.mark.parametrize("size", [0, 5000])
@pytest.mark.parametrize("words", [["list", "a.tessel"],
                                   ["find", "a.tessel", "e"],
                                   ["diff", "a.tessel", "none.tessel"],
                                   ["list", "a.tessel", "--salvage"]])
def test_a_file_that_is_cut_while_it_is_read(tessel, many, words, size):
    paths, archive = many
    (tessel.folder / "a.tessel").write_bytes(archive)
    tessel.pack([], "none.tessel")
    run = tessel.start(*words, stdout=subprocess.PIPE, stderr=subprocess.PIPE,
                       bufsize=0)
    first = run.stdout.read(10)  # now it waits for the pipe's reader
    os.truncate(tessel.folder / "a.tessel", size)
    output, errors = run.communicate(timeout=60)
    if words[0] == "list":
        told = (first + output).split(b"\n")[:-1]
        assert told == paths[:len(told)]
        assert (len(told) == len(paths)) == (run.returncode == 0)
    if run.returncode == 0:
        assert os.cpu_count() > 16, "so many cores decode everything ahead"
        return
    assert run.returncode == 4
    assert errors.startswith(
        b"tessel: a.tessel: The archive is damaged at byte "
        if "--salvage" not in words else b"tessel: a.tessel: ")
    assert errors.count(b"\n") == 1


def test_exporting(tessel):
    tessel.pack(OLD, "before.tessel")
    tessel("export", "before.tessel", "-o", "old.store")

    def prepare(disk):
        (disk / "a.tessel").write_bytes(
            (tessel.folder / "before.tessel").read_bytes())
        (disk / "a.store").write_bytes(b"old")

    for what, done in runs_with_failures(
            tessel, ["export", str(tessel.folder / "disk/a.tessel"), "-f", "-o",
                     str(tessel.folder / "disk/a.store")], prepare):
        check_end(what, done)
        store = (tessel.folder / "disk/a.store").read_bytes()
        assert store == ((tessel.folder / "old.store").read_bytes()
                         if done.returncode == 0 else b"old"), what
        assert sorted(os.listdir(tessel.folder / "disk")) == [
            "a.store", "a.tessel"], what
