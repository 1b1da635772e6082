"""A PathList beside a plain list: everything that a sequence can."""

import os
import pathlib
import random
import sys

import lists
import pytest
from qztessel import PathList


def test_length_and_items(plain, packed):
    assert len(packed) == len(plain)
    for i in range(-len(plain), len(plain)):
        assert packed[i] == plain[i]


def test_index_out_of_range(plain, packed):
    for i in (len(plain), -len(plain) - 1, 10**15):
        with pytest.raises(IndexError, match=f"index {i} is out of range"):
            packed[i]
    for i in (10**30, -(10**30)):
        with pytest.raises(IndexError):
            packed[i]


def test_index_of_another_kind():
    for index in ("0", 1.0, None):
        with pytest.raises(TypeError):
            PathList.pack(["a", "b"])[index]


def test_iteration(plain, packed):
    assert list(packed) == plain
    assert list(packed) == plain  # a second time
    assert list(reversed(packed)) == plain[::-1]


def test_iterators_are_independent(plain, packed):
    assert list(zip(packed, packed[1:])) == list(zip(plain, plain[1:]))


def test_random_slices(plain, packed):
    choose = random.Random(7)
    size = len(plain)
    bounds = [None, 0, 1, -1, size, -size, size + 5, 10**30]
    bounds += [choose.randint(-size - 1, size + 1) for _ in range(10)]
    for _ in range(300):
        start, stop = choose.choice(bounds), choose.choice(bounds)
        step = choose.choice([None, 1, 2, 3, 7, -1, -2, -5, 10**30, -(10**15)])
        wanted = plain[start:stop:step]
        assert list(packed[start:stop:step]) == wanted, (start, stop, step)


def test_membership(plain, packed):
    for path in plain[:50]:
        assert path in packed
        assert path + b"-" not in packed
    for other in (b"", b"\0", 5, None, "\ud800", "nothing/like/it"):
        assert other not in packed


def test_index_and_count(plain, packed):
    for path in plain[:20]:
        assert packed.index(path) == plain.index(path)
        assert packed.count(path) == plain.count(path)
    assert packed.count(b"missing") == packed.count(b"") == packed.count(5) == 0
    with pytest.raises(ValueError, match="'missing' is not in the list"):
        packed.index("missing")


def test_index_within_bounds():
    plain = ["a", "b", "a", "c", "a"]
    packed = PathList.pack(plain)
    for start in range(-6, 7):
        for stop in range(-6, 7):
            try:
                wanted = plain.index("a", start, stop)
            except ValueError:
                with pytest.raises(ValueError):
                    packed.index("a", start, stop)
            else:
                assert packed.index("a", start, stop) == wanted


def test_index_in_views(plain, packed):
    choose = random.Random(3)
    for _ in range(10):
        view = packed[choose.randrange(3) :: choose.choice([1, 2, -1, -3])].shuffled(5)
        copy = list(view)
        for path in copy[:10] + plain[:10]:
            assert (path in view) == (path in copy)
            assert view.count(path) == copy.count(path)
            if path in copy:
                assert view.index(path) == copy.index(path)


def test_equality(plain, packed):
    assert packed == PathList.pack(plain, as_bytes=True)
    assert packed == packed[::-1][::-1]
    assert packed != PathList.pack([*plain, b"z"], as_bytes=True)
    if len(set(plain)) > 1:
        assert packed != packed[::-1] and packed != packed[:-1]
        assert packed != PathList.pack([b"q", *plain[1:]], as_bytes=True)
    assert packed != plain
    with pytest.raises(TypeError):
        hash(packed)


def test_text_and_bytes(plain):
    text = PathList.pack(plain)
    assert list(text) == [os.fsdecode(path) for path in plain]
    assert [text[i] for i in range(len(plain))] == list(text)
    assert PathList.pack(list(text), as_bytes=True) == PathList.pack(plain, as_bytes=True)
    assert (text == PathList.pack(plain, as_bytes=True)) == (not plain)


def test_any_kind_of_path_is_found():
    packed = PathList.pack(["a/ä", b"a/\xff"])
    for path in ("a/ä", "a/ä".encode(), pathlib.Path("a/ä"), "a/\udcff", b"a/\xff"):
        assert path in packed


def test_repr_shows_the_ends():
    packed = PathList.pack(["a", "b", "c", "d"])
    assert repr(packed) == "<PathList of 4 paths from memory: ['a', 'b', ..., 'd']>"
    view = packed[1:].shuffled(9)[:1].select([0])
    assert repr(view).startswith(
        "<PathList of 1 path from memory[1:4].shuffled(9)[0:1].select(1 indices): ["
    )
    assert repr(PathList.pack([])) == "<PathList of 0 paths from memory: []>"
    assert "from memory[3::-1]:" in repr(packed[::-1])


def test_sizes(tmp_path):
    paths = lists.tree(20000)
    memory = PathList.pack(paths)
    file = PathList.pack(paths, tmp_path / "x.tessel")
    size = (tmp_path / "x.tessel").stat().st_size
    assert memory.nbytes == file.nbytes == size
    assert sys.getsizeof(memory) > size
    assert sys.getsizeof(file) < 1000
    assert sys.getsizeof(file.shuffled(1)[5:]) < 1000
    assert sys.getsizeof(file.select(range(10000))) > 80000
    assert file.file == str(tmp_path / "x.tessel") and memory.file is None
    assert not file.as_bytes


def test_lists_are_opened_or_packed():
    for wrong in (), (["a"],):
        with pytest.raises(TypeError, match="PathList.open or PathList.pack"):
            PathList(*wrong)
