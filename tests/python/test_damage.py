"""Archives that are no longer what was written."""

import random

import lists
import pytest
from qztessel import DamagedArchiveError, PathList


def test_no_archives(tmp_path):
    for text in (b"", b"a\nb\n", b"\x89TSL\r\n\x1a\n", bytes(1000)):
        file = tmp_path / "x.tessel"
        file.write_bytes(text)
        with pytest.raises(DamagedArchiveError, match="x.tessel' is damaged at byte"):
            PathList.open(file)


def test_no_file(tmp_path):
    with pytest.raises(FileNotFoundError) as caught:
        PathList.open(tmp_path / "missing")
    assert caught.value.filename == str(tmp_path / "missing")
    with pytest.raises(OSError):
        PathList.open(tmp_path)


def test_a_cut_file(tmp_path):
    file = tmp_path / "x.tessel"
    PathList.pack(lists.tree(1000), file)
    whole = file.read_bytes()
    for size in (10, 64, len(whole) // 2, len(whole) - 1):
        file.write_bytes(whole[:size])
        with pytest.raises(DamagedArchiveError):
            PathList.open(file)


def test_flipped_bytes_never_give_wrong_paths(tmp_path):
    file = tmp_path / "x.tessel"
    plain = lists.tree(2000)
    PathList.pack(plain, file)
    whole = file.read_bytes()
    choose = random.Random(5)
    refusals = 0
    for _ in range(60):
        changed = bytearray(whole)
        changed[choose.randrange(len(whole))] ^= 1 << choose.randrange(8)
        damaged = tmp_path / "damaged.tessel"
        damaged.unlink(missing_ok=True)
        damaged.write_bytes(changed)
        try:
            assert list(PathList.open(damaged, as_bytes=True)) == plain
        except (DamagedArchiveError, ValueError):
            refusals += 1
    assert refusals > 40


def test_every_reading_method_says_which_file(tmp_path):
    file = tmp_path / "x.tessel"
    PathList.pack(lists.shuffled(lists.tree(5000)), file)
    damaged = bytearray(file.read_bytes())
    middle = len(damaged) // 2
    damaged[middle : middle + 4096] = bytes(4096)
    file.write_bytes(damaged)
    packed = PathList.open(file)
    for read in (list, lambda p: [p[i] for i in range(len(p))], lambda p: p == p[:]):
        with pytest.raises(DamagedArchiveError, match="x.tessel' is damaged at byte"):
            read(packed)
    assert issubclass(DamagedArchiveError, ValueError)
    assert DamagedArchiveError.__module__ == "qztessel"
