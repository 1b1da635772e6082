"""Bulk reading and searching, beside plain lists."""

import fnmatch
import os
import pathlib
import random
import re
import signal
import threading

import lists
import numpy as np
import pytest
from qztessel import DamagedArchiveError, PathList


@pytest.fixture(params=["whole", "reversed", "shuffled", "small", "repeated"])
def view(request, plain, packed):
    """The same view of a PathList and, as a list, of a plain list."""
    kind = request.param
    if kind == "reversed":
        packed = packed[::-1]
    elif kind == "shuffled":
        packed = packed.shuffled(6)
    elif kind == "small":
        packed = packed[len(plain) // 3 : len(plain) // 2]
    elif kind == "repeated":
        packed = packed.select(list(range(len(plain))) * 2)
    return packed, list(packed)


def test_take(view):
    packed, plain = view
    choose = random.Random(1)
    size = len(plain)
    for count in (0, 1, 5, 4000):
        chosen = [choose.randrange(-size, size) for _ in range(count) if size]
        wanted = [plain[i] for i in chosen]
        assert packed.take(chosen) == wanted
        assert list(packed.take(chosen, as_array="O")) == wanted
        assert list(packed.take(np.array(chosen, np.int16), as_array="S")) == wanted
        text = packed.take(chosen, as_array="U")
        assert [os.fsencode(str(path)) for path in text] == wanted


def test_take_of_text():
    packed = PathList.pack(lists.NASTY)
    wanted = [os.fsdecode(path) for path in lists.NASTY]
    everything = range(len(wanted))
    assert packed.take(everything) == wanted
    assert packed.take(everything, as_array="U").tolist() == wanted
    assert packed.take(everything, as_array="O").tolist() == wanted
    assert packed.take(everything, as_array="S").tolist() == lists.NASTY


def test_kinds_of_arrays():
    packed = PathList.pack(["a/ä", "bcd"])
    assert packed.take([0, 1], as_array="S").dtype == "S4"
    assert packed.take([0, 1], as_array="U").dtype == "U3"
    assert packed.take([], as_array="S").shape == (0,)
    assert packed.take([], as_array="O").dtype == object
    with pytest.raises(ValueError, match="'X' is none of"):
        packed.take([0], as_array="X")
    for wrong in ([2], [-3], [2**63], [0, 2**63], [-1, 2**64 - 1], [0, -(2**70)]):
        with pytest.raises(IndexError, match="out of range for 2 paths"):
            packed.take(wrong)
    with pytest.raises(TypeError):
        packed.take([0.5])
    assert packed.take(np.array([1, -2], dtype=object)) == ["bcd", "a/ä"]
    assert packed.take(np.array([np.int8(1)], dtype=object)) == ["bcd"]
    for no_indices in ([True, False], [0, 0.5], [0, None], ["0"]):
        for dtype in (None, object):
            with pytest.raises(TypeError, match="expected integers as indices"):
                packed.take(np.array(no_indices, dtype=dtype))


def test_numbers(view):
    packed, plain = view
    first = {}
    for i, path in enumerate(plain):
        first.setdefault(path, i)
    choose = random.Random(2)
    for count in (0, 1, 20, 300, 3000):
        asked = [choose.choice(plain) for _ in range(count) if plain]
        asked += [b"", b"missing", b"a\0", b"missing/file"]
        choose.shuffle(asked)
        found = packed.numbers(asked)
        assert found.dtype == np.int64
        assert found.tolist() == [first.get(path, -1) for path in asked]


def test_numbers_of_one_path():
    packed = PathList.pack(["a/b"])
    for one in "a/b", b"a/b", pathlib.Path("a/b"):
        with pytest.raises(TypeError, match="put the one into a list"):
            packed.numbers(one)
    with pytest.raises(TypeError, match="^'int' object is not iterable$"):
        packed.numbers(5)


def test_numbers_of_any_kind():
    packed = PathList.pack(["a/ä", b"\xff"])
    asked = ("a/ä", pathlib.Path("a/ä"), b"\xff", "\udcff", "b")
    assert packed.numbers(iter(asked)).tolist() == [0, 0, 1, 1, -1]
    with pytest.raises(TypeError):
        packed.numbers(["a", 5])
    with pytest.raises(TypeError):
        packed.numbers(5)


def indices(plain, holds):
    return [i for i, path in enumerate(plain) if holds(path)]


def test_find_texts(view):
    packed, plain = view
    for texts in ([], [b"a"], [b"lib/", b"1"], [b"\xc3"], [b"no such text"], [b"/"]):
        wanted = indices(plain, lambda path: all(text in path for text in texts))
        found = packed.find(*texts)
        assert found.dtype == np.int64
        assert found.tolist() == wanted
    assert packed.find("größe").tolist() == packed.find("größe".encode()).tolist()


def test_find_in_folders(view):
    packed, plain = view
    for folder in (b"lib", b"lib/", b"share/doc", b"a", b"a/", b"/", b"none", b"d/d"):
        start = folder if folder.endswith(b"/") else folder + b"/"
        wanted = indices(plain, lambda path: path.startswith(start))
        assert packed.find(folder=folder).tolist() == wanted
        wanted = indices(plain, lambda p: p.startswith(start) and b"3" in p)
        assert packed.find("3", folder=os.fsdecode(folder)).tolist() == wanted
    assert packed.find(folder="").tolist() == list(range(len(plain)))


def test_find_by_pattern(view):
    packed, plain = view
    for pattern in ("*lib*/*1.txt", "a/*", "?/[ab]"):
        rule = re.compile(os.fsencode(fnmatch.translate(pattern)))
        assert packed.find(glob=pattern).tolist() == indices(plain, rule.match)
    for pattern in (r"^lib/.*\d{3}\.txt$", "a$", "(?i)MAN-1"):
        rule = re.compile(pattern.encode(), re.S)
        assert packed.find(regex=pattern).tolist() == indices(plain, rule.search)
    rule = re.compile(rb"man-1.*\.txt$", re.I | re.S)
    both = indices(plain, lambda p: rule.search(p) and p.startswith(b"lib/") and b"2" in p)
    found = packed.find("2", regex=r"MAN-1.*\.TXT$", folder="lib", ignore_case=True)
    assert found.tolist() == both


def test_wrong_patterns():
    packed = PathList.pack(["a"])
    with pytest.raises(ValueError, match=r"pattern 'a\(': missing \)"):
        packed.find(regex="a(")
    with pytest.raises(ValueError, match="exclude each other"):
        packed.find(regex="a", glob="a")
    with pytest.raises(TypeError):
        packed.find(5)


def folder_of(path):
    head, slash, _ = path.rpartition(b"/")
    return head or slash


def test_folders(view):
    packed, plain = view
    assert packed.folders() == sorted(set(map(folder_of, plain)))
    for folder in packed.folders()[::25]:
        wanted = [p for p in plain if folder_of(p) == folder]
        below = packed.take(packed.find(folder=folder))
        assert set(wanted) <= set(below)


def test_damage_is_told_by_every_bulk_call(tmp_path):
    file = tmp_path / "x.tessel"
    plain = lists.shuffled(lists.tree(5000))
    PathList.pack(plain, file)
    damaged = bytearray(file.read_bytes())
    middle = len(damaged) // 2
    damaged[middle : middle + 4096] = bytes(4096)
    file.write_bytes(damaged)
    packed = PathList.open(file)
    everything = range(len(packed))
    for read in (
        lambda: packed.take(everything),
        lambda: packed.take(everything, as_array="S"),
        lambda: packed.numbers(plain),
        lambda: packed.find("no such text", regex="."),
        lambda: packed[:1000].find("x"),
        packed.folders,
    ):
        with pytest.raises(DamagedArchiveError, match="x.tessel' is damaged at byte"):
            read()


@pytest.mark.parametrize("call", ["take", "numbers", "find", "folders", "equal"])
def test_interrupt_ends_bulk_calls(call):
    plain = lists.shuffled(lists.tree(200_000))
    packed = PathList.pack(plain).shuffled(1)
    work = {
        "take": lambda: packed.take(range(len(packed))),
        "numbers": lambda: packed.numbers(plain[:1000]),
        "find": lambda: packed.find(regex="(a|b|c)*x"),
        "folders": packed.folders,
        "equal": lambda: packed == packed[:],
    }[call]
    timer = threading.Timer(0.3, os.kill, (os.getpid(), signal.SIGINT))
    timer.start()
    with pytest.raises(KeyboardInterrupt):
        while True:
            work()
    timer.join()
    assert len(packed.take([0, -1])) == 2  # and the list still works


def mapped_bytes(file):
    """How much of a file is in this process's memory."""
    with open("/proc/self/smaps") as lines:
        for line in lines:
            if line.rstrip().endswith(file):
                next(lines), next(lines), next(lines)
                return 1024 * int(next(lines).split()[1])
    raise FileNotFoundError(file)


def test_bulk_calls_give_pages_back(tmp_path):
    choose = random.Random(5)
    plain = [f"{i // 100}/{choose.getrandbits(64):016x}" for i in range(200_000)]
    packed = PathList.open(PathList.pack(plain, tmp_path / "x.tessel").file)
    some = list(range(0, len(plain), 500))
    for read in (
        lambda: packed.take(some),
        lambda: packed.take(some, as_array="S"),
        lambda: sum(1 for _ in packed),
        lambda: packed.numbers(plain[:100_000]),
        lambda: packed.find("no such text"),
        lambda: packed[:1000].find("x"),
        packed.folders,
        lambda: packed == packed[:],
    ):
        for i in some:
            packed[i]
        before = mapped_bytes(packed.file)
        assert before > packed.nbytes / 4
        read()
        assert mapped_bytes(packed.file) < before / 4
    assert packed.take(some) == [plain[i] for i in some]  # and come again


def test_other_threads_run_meanwhile():
    packed = PathList.pack(lists.tree(100_000)).shuffled(1)
    turns = 0
    done = threading.Event()

    def count():
        nonlocal turns
        while not done.is_set():
            turns += 1
            done.wait(0.001)

    thread = threading.Thread(target=count)
    thread.start()
    for _ in range(3):
        packed.find(regex="(a|b|c)*x")
    done.set()
    thread.join()
    assert turns > 5
