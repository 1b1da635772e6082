"""Interrupts, closed pipes, full disks, killed writers, concurrent readers."""
import os
import random
import resource
import signal
import subprocess
import threading
import time

import pytest

from conftest import TESSEL, some_paths

# Moments at which a writer is killed; more of them find rarer ones.
KILLED_WRITERS = int(os.environ.get("KILLED_WRITERS", "50"))

MANY = b"\n".join(some_paths(400000)) + b"\n"


def wait_for_leftover(tessel, run):
    while not tessel.leftovers():
        assert run.poll() is None
        time.sleep(0.001)


@pytest.mark.parametrize("closed", [[0], [1], [2], [0, 1], [1, 2], [0, 1, 2]])
def test_closed_descriptors_are_told(tessel, closed):
    tessel.pack([b"a/b", b"c/d"])  # eight bytes, which an eventfd would take

    def run(*words):
        done = tessel.start(*words, stderr=subprocess.PIPE,
                            stdout=subprocess.PIPE, stdin=subprocess.DEVNULL,
                            preexec_fn=lambda: [os.close(c) for c in closed])
        output, errors = done.communicate(timeout=60)
        return done.returncode, output, errors

    status, _, errors = run("list", "a.tessel")
    assert status == (5 if 1 in closed else 0)
    if 1 in closed and 2 not in closed:
        assert errors == b"tessel: standard output: Bad file descriptor\n"
    status, _, errors = run("pack", "-", "-o", "b.tessel", "-q")
    assert status == (5 if 0 in closed else 0)
    if 0 in closed and 2 not in closed:
        assert errors == b"tessel: standard input: Bad file descriptor\n"
    run("pack", "a.tessel", "-o", "c.tessel")
    assert tessel.list("c.tessel") == [b"a/b", b"c/d"]


@pytest.mark.parametrize("number,status", [
    (signal.SIGINT, 130), (signal.SIGTERM, 143), (signal.SIGHUP, 129)])
@pytest.mark.parametrize("flag", ["-f", "--append"])
def test_a_signal_leaves_the_old_file(tessel, number, status, flag):
    tessel.pack([b"old"])
    run = tessel.start("pack", "-", "-o", "a.tessel", flag,
                       stdin=subprocess.PIPE, stderr=subprocess.PIPE)
    wait_for_leftover(tessel, run)
    run.stdin.write(MANY)
    run.stdin.flush()
    run.send_signal(number)  # while it waits for more
    assert run.wait() == status
    assert run.stderr.read() == b""
    run.stdin.close()
    run.stderr.close()
    assert tessel.list() == [b"old"]
    assert tessel.leftovers() == []


def test_an_interrupt_while_it_packs(tessel):
    (tessel.folder / "list").write_bytes(MANY * 4)
    tessel.pack([b"old"])
    for delay in [0.2, 0.6, 1.2]:
        run = tessel.start("pack", "list", "-o", "a.tessel", "-f", "--level",
                           "best", stdout=subprocess.DEVNULL)
        wait_for_leftover(tessel, run)
        time.sleep(delay)
        run.send_signal(signal.SIGINT)
        assert run.wait() == 130
        assert tessel.list() == [b"old"]
        assert tessel.leftovers() == []


def test_an_interrupt_while_it_writes_to_a_stuck_pipe(tessel):
    (tessel.folder / "list").write_bytes(MANY)
    tessel("pack", "list", "-o", "a.tessel")
    run = tessel.start("list", "a.tessel", stdout=subprocess.PIPE)
    run.stdout.read(1)
    time.sleep(0.2)
    run.send_signal(signal.SIGINT)
    assert run.wait() == 130
    run.stdout.close()


@pytest.mark.parametrize("words", [["list", "a.tessel"],
                                   ["find", "a.tessel", "e"],
                                   ["get", "a.tessel", "0--1"],
                                   ["diff", "a.tessel", "b.tessel"]])
def test_a_closed_pipe_ends_quietly(tessel, words):
    (tessel.folder / "list").write_bytes(MANY)
    tessel("pack", "list", "-o", "a.tessel")
    tessel.pack([], "b.tessel")
    run = tessel.start(*words, stdout=subprocess.PIPE, stderr=subprocess.PIPE)
    run.stdout.read(10)
    run.stdout.close()
    assert run.wait() == -signal.SIGPIPE
    assert run.stderr.read() == b""
    run.stderr.close()


def test_a_closed_pipe_as_a_shell_sees_it(tessel):
    (tessel.folder / "list").write_bytes(MANY)
    tessel("pack", "list", "-o", "a.tessel")
    done = subprocess.run(
        ["bash", "-c", f"{TESSEL} list a.tessel | head -n 1 >/dev/null; "
         "echo ${PIPESTATUS[0]}"],
        cwd=tessel.folder, stdout=subprocess.PIPE, check=True)
    assert done.stdout == b"141\n"


def test_an_ignored_pipe_signal_stays_a_status(tessel):
    (tessel.folder / "list").write_bytes(MANY)
    tessel("pack", "list", "-o", "a.tessel")
    run = tessel.start("list", "a.tessel", stdout=subprocess.PIPE,
                       stderr=subprocess.PIPE, restore_signals=False)
    run.stdout.read(10)
    run.stdout.close()
    assert run.wait() == 141
    assert run.stderr.read() == b""
    run.stderr.close()


@pytest.mark.parametrize("flag", ["-f", "--append"])
def test_a_full_disk_leaves_the_old_file(tessel, flag):
    # A limit on the size of files refuses as a full disk does.
    tessel.pack([b"old"])
    (tessel.folder / "list").write_bytes(MANY)

    def limit():
        signal.signal(signal.SIGXFSZ, signal.SIG_IGN)
        resource.setrlimit(resource.RLIMIT_FSIZE, (65536, 65536))

    done = tessel("pack", "list", "-o", "a.tessel", flag, expect=5,
                  preexec_fn=limit)
    assert b"File too large" in done.err
    assert tessel.list() == [b"old"]
    assert tessel.leftovers() == []


@pytest.mark.skipif(os.geteuid() != 0, reason="mounts a file system")
def test_a_full_file_system(tessel):
    disk = tessel.folder / "disk"
    disk.mkdir()
    if subprocess.run(["mount", "-t", "tmpfs", "-o", "size=256k", "tmpfs",
                       str(disk)], check=False,
                      stderr=subprocess.DEVNULL).returncode != 0:
        pytest.skip("cannot mount here")
    try:
        tessel.pack([b"old"], "disk/a.tessel")
        (tessel.folder / "list").write_bytes(MANY)
        for flag in ["-f", "--append"]:
            done = tessel("pack", "list", "-o", "disk/a.tessel", flag, expect=5)
            assert b"No space left" in done.err
            assert tessel.list("disk/a.tessel") == [b"old"]
            assert os.listdir(disk) == ["a.tessel"]
    finally:
        subprocess.run(["umount", str(disk)], check=True)


@pytest.mark.parametrize("flag", ["-f", "--append"])
def test_a_killed_writer_leaves_a_readable_file(tessel, flag):
    draw = random.Random(11)
    parts = [some_paths(3000, 1), some_paths(3000, 2)]
    for turn in range(2):
        (tessel.folder / f"list{turn}").write_bytes(b"\0".join(parts[turn]))
    began = time.monotonic()
    tessel("pack", "-0", "list0", "-f", "-o", "a.tessel")
    usual = time.monotonic() - began
    written = 0
    for moment in range(KILLED_WRITERS):
        if moment % 10 == 0:  # the next run tidies up
            tessel("pack", "-0", "list0", "-f", "-o", "a.tessel")
            assert tessel.leftovers() == []
            before = parts[0]
        part = parts[moment % 2]
        run = tessel.start("pack", "-0", f"list{moment % 2}", flag, "-o",
                           "a.tessel", stdout=subprocess.DEVNULL)
        time.sleep(draw.random() * usual * 1.3)
        run.kill()
        run.wait()
        after = tessel.list()
        new = before + part if flag == "--append" else part
        assert after in (before, new)
        written += after == new
        before = after
        assert len(tessel.leftovers()) <= 1
    tessel("pack", "-0", "list0", "-f", "-o", "a.tessel")
    assert tessel.leftovers() == []
    assert 0 < written < KILLED_WRITERS


def test_a_writer_leaves_the_files_of_a_living_one(tessel):
    run = tessel.start("pack", "-", "-o", "a.tessel", stdin=subprocess.PIPE,
                       stdout=subprocess.DEVNULL)
    wait_for_leftover(tessel, run)
    tessel.pack([b"quick"])
    assert len(tessel.leftovers()) == 1
    run.stdin.write(b"slow\n")
    run.stdin.close()
    assert run.wait() == 0
    assert tessel.list() == [b"slow"]


def test_readers_see_one_list_or_the_other(tessel):
    parts = [some_paths(300, seed) for seed in range(25)]
    tessel.pack(parts[0])
    whole = [[p for part in parts[:end] for p in part]
             for end in range(1, len(parts) + 1)]
    failures = []
    done = threading.Event()

    def read():
        while not done.is_set():
            try:
                if tessel.list() not in whole:
                    failures.append("a mixture")
            except AssertionError as failure:
                failures.append(failure)

    readers = [threading.Thread(target=read) for _ in range(3)]
    for reader in readers:
        reader.start()
    for part in parts[1:]:
        tessel.pack(part, "a.tessel", "--append")
    done.set()
    for reader in readers:
        reader.join()
    assert failures == []
    assert tessel.list() == whole[-1]


def test_the_new_file_keeps_permissions_and_links(tessel):
    tessel.pack([b"a"])
    os.chmod(tessel.folder / "a.tessel", 0o640)
    os.symlink("a.tessel", tessel.folder / "link")
    tessel.pack([b"b"], "link", "-f")
    assert os.path.islink(tessel.folder / "link")
    assert tessel.list() == [b"b"]
    assert os.stat(tessel.folder / "a.tessel").st_mode & 0o777 == 0o640
