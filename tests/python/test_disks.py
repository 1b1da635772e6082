"""Disks that fail, and files that change while they are open."""

import ctypes
import errno
import os
import random
import signal
import subprocess
import sys
import threading
import time

import lists
import pytest
from failing_calls import ERRORS
from qztessel import DamagedArchiveError, PathList, ShardedPathList

# What lets calls fail is loaded before the C library.
CALLS = os.environ.get("LD_PRELOAD")

OLD = lists.tree(300, 1)
NEW = lists.tree(300, 2)

# Moments at which a writer is killed; more of them find rarer ones.
KILLED_WRITERS = int(os.environ.get("KILLED_WRITERS", "20"))


def each_failure(folder, prepare, work, check):
    """Do work with the first, second ... call of every kind failing until none
    is left, and check whether it was done. Return how often it was not."""
    calls = ctypes.CDLL(CALLS)
    refused = 0
    for kind, errors in ERRORS.items():
        for error in errors:
            for number in range(1, 100):
                prepare()
                calls.failCall(
                    os.fsencode(folder), kind.encode(), ctypes.c_long(number), error
                )
                try:
                    work()
                    done = True
                except OSError as refusal:
                    done = False
                    refused += 1
                    assert refusal.errno == error, (kind, number)
                    assert str(folder) in str(refusal.filename), (kind, number)
                is_over = not calls.hasFailed()
                calls.failCall(b"", b"", 0, 0)
                check(done, (kind, number, error))
                if is_over:
                    break
            else:
                pytest.fail("calls without end")
    return refused


needs_calls = pytest.mark.skipif(not CALLS, reason="LD_PRELOAD names no library")


@needs_calls
@pytest.mark.parametrize("how", ["pack", "save", "append"])
def test_writing_leaves_the_old_file_or_the_new_one(tmp_path, how):
    file = tmp_path / "disk" / "a.tessel"
    file.parent.mkdir()
    old = PathList.pack(OLD, tmp_path / "old", as_bytes=True)
    new = PathList.pack(NEW, as_bytes=True)
    expected = OLD + NEW if how == "append" else NEW

    def prepare():
        file.unlink(missing_ok=True)
        file.write_bytes((tmp_path / "old").read_bytes())

    def work():
        if how == "pack":
            PathList.pack(NEW, file)
        elif how == "save":
            new.save(file)
        else:
            PathList.open(file).append(NEW)

    def check(done, what):
        assert os.listdir(file.parent) == ["a.tessel"], what
        held = list(PathList.open(file, as_bytes=True))
        # A file that is in place already may fail to open again.
        assert held == expected or (not done and held == OLD), what

    assert each_failure(file.parent, prepare, work, check) > 15
    assert list(old) == OLD


@needs_calls
def test_reading_gives_the_paths_or_an_error(tmp_path):
    file = tmp_path / "a.tessel"
    PathList.pack(OLD, file)
    held = []

    def work():
        held[:] = PathList.open(file, as_bytes=True)

    def check(done, what):
        assert held == (OLD if done else []), what

    assert each_failure(tmp_path, held.clear, work, check) >= 3


# ---- Killed processes ----


@pytest.mark.parametrize("how", ["pack", "append"])
def test_a_killed_process_leaves_the_old_file_or_the_new_one(tmp_path, how):
    file = tmp_path / "a.tessel"
    draw = random.Random(5)
    parts = [lists.tree(3000, 1), lists.tree(3000, 2)]
    written = 0

    def started(part):
        child = os.fork()
        if child == 0:
            if how == "pack":
                PathList.pack(part, file)
            else:
                PathList.open(file).append(part)
            os._exit(0)
        return child

    PathList.pack(parts[0], file)
    began = time.monotonic()
    os.waitpid(started(parts[1]), 0)
    usual = time.monotonic() - began
    for moment in range(KILLED_WRITERS):
        if moment % 10 == 0:
            before = list(PathList.pack(parts[0], file, as_bytes=True))
            assert os.listdir(tmp_path) == ["a.tessel"]
        part = parts[moment % 2]
        child = started(part)
        time.sleep(draw.random() * usual * 1.5)
        os.kill(child, signal.SIGKILL)
        os.waitpid(child, 0)
        after = list(PathList.open(file, as_bytes=True))
        new = part if how == "pack" else before + part
        assert after in (before, new)
        written += after == new
        before = after
        assert len(os.listdir(tmp_path)) <= 2
    PathList.pack(parts[0], file)
    assert os.listdir(tmp_path) == ["a.tessel"]
    assert 0 < written < KILLED_WRITERS


def test_a_killed_writer_of_a_manifest_leaves_nothing_for_long(tmp_path):
    shard = tmp_path / "0.tessel"
    manifest = tmp_path / "all.json"
    PathList.pack(["a"], shard)
    ShardedPathList.join([shard], manifest)
    usual = sorted(os.listdir(tmp_path))
    draw = random.Random(6)
    left = 0
    for _ in range(KILLED_WRITERS):
        child = os.fork()
        if child == 0:
            while True:
                ShardedPathList.join([shard], manifest)
        time.sleep(draw.random() * 0.05)
        os.kill(child, signal.SIGKILL)
        os.waitpid(child, 0)
        assert list(ShardedPathList.open(manifest)) == ["a"]
        names = os.listdir(tmp_path)
        assert len(names) <= len(usual) + 1
        left += len(names) > len(usual)
    assert left
    ShardedPathList.join([shard], manifest)
    assert sorted(os.listdir(tmp_path)) == usual


# ---- Changed files ----

READS = {
    "each": lambda paths: [paths[i] for i in range(len(paths))],
    "list": list,
    "take": lambda paths: list(paths.take(range(len(paths)))),
    "in": lambda paths: [OLD[7] in paths],
    "index": lambda paths: [paths.index(OLD[3])],
    "find": lambda paths: list(paths.find("lib")),
    "save": lambda paths: list(paths.save("saved")),
    "append": lambda paths: list(paths.append(["more"])),
}


@pytest.mark.parametrize("read", READS)
@pytest.mark.parametrize("size", [0, 100, 3000, -1])
def test_a_file_that_is_cut_while_it_is_open(tmp_path, monkeypatch, read, size):
    monkeypatch.chdir(tmp_path)
    file = tmp_path / "a.tessel"
    paths = PathList.pack(OLD * 20, file, as_bytes=True)
    READS["list"](paths)
    os.truncate(file, file.stat().st_size - 1 if size < 0 else size)
    with pytest.raises(DamagedArchiveError, match="a.tessel' is damaged at byte"):
        READS[read](paths)
    assert not [name for name in os.listdir(tmp_path) if name != "a.tessel"]


def test_threads_that_read_a_file_that_is_cut(tmp_path):
    file = tmp_path / "a.tessel"
    plain = lists.shuffled(lists.tree(5000))
    paths = PathList.pack(plain, file, as_bytes=True)
    began = threading.Barrier(5)
    ends = []

    def read():
        try:
            assert list(paths) == plain
            began.wait()
            while list(paths) == plain:
                pass
            ends.append("a wrong path")
        except DamagedArchiveError:
            ends.append("told")

    threads = [threading.Thread(target=read) for _ in range(4)]
    for thread in threads:
        thread.start()
    began.wait()
    os.truncate(file, 5000)
    for thread in threads:
        thread.join()
    assert ends == ["told"] * 4


def test_a_replaced_file_goes_on_being_read(tmp_path):
    file = tmp_path / "a.tessel"
    paths = PathList.pack(OLD, file, as_bytes=True)
    PathList.pack(NEW, file)
    assert list(paths) == OLD


@pytest.mark.parametrize("when", ["before", "after"])
def test_another_handler_of_bus_errors(tmp_path, when):
    # faulthandler writes a traceback and ends the process, also after a fault
    # that is none of ours.
    program = f"""
import faulthandler, mmap, os, sys
import qztessel
if {when == "before"}: faulthandler.enable()
paths = qztessel.PathList.pack({["a/%d" % i for i in range(3000)]!r}, "a.tessel")
list(paths)
os.truncate("a.tessel", 0)
try:
    list(paths)
except qztessel.DamagedArchiveError:
    print("told", flush=True)
if {when == "after"}: faulthandler.enable()
with open("other", "wb+") as other:
    other.write(bytes(10000))
    other.flush()
    view = mmap.mmap(other.fileno(), 0)
    other.truncate(0)
    print(view[0])
"""
    done = subprocess.run(
        [sys.executable, "-c", program],
        cwd=tmp_path,
        capture_output=True,
        timeout=60,
        check=False,
    )
    assert done.stdout == b"told\n"
    assert b"Bus error" in done.stderr
    assert done.returncode < 0
