"""Packing, saving and appending."""

import os
import pathlib
import signal
import threading

import lists
import pytest
from qztessel import PathList


def generator():
    yield "a"
    yield b"b/\xff"
    yield pathlib.PurePosixPath("c/d")


def test_any_iterable():
    wanted = ["a", "b/\udcff", "c/d"]
    assert list(PathList.pack(generator())) == wanted
    assert list(PathList.pack(tuple(wanted))) == wanted
    assert list(PathList.pack(dict.fromkeys(wanted))) == wanted
    assert list(PathList.pack(PathList.pack(wanted)[::-1])) == wanted[::-1]


def test_more_paths_than_a_batch():
    paths = [f"folder{i % 7}/file{i}" for i in range(40000)]
    packed = PathList.pack(iter(paths))
    assert list(packed) == paths


def test_list_files(tmp_path):
    (tmp_path / "lines").write_bytes(b"a/b\nc\xff\nd")
    assert list(PathList.pack(tmp_path / "lines", as_bytes=True)) == [b"a/b", b"c\xff", b"d"]
    (tmp_path / "records").write_bytes(b"a\nb\0c\0")
    assert list(PathList.pack(str(tmp_path / "records"))) == ["a\nb", "c"]
    (tmp_path / "nothing").write_bytes(b"")
    assert list(PathList.pack(os.fsencode(tmp_path / "nothing"))) == []
    (tmp_path / "gap").write_bytes(b"a\n\nb\n")
    with pytest.raises(ValueError, match="line 2: an empty path"):
        PathList.pack(tmp_path / "gap")


def test_an_archive_as_a_list_file(plain, tmp_path):
    PathList.pack(plain, tmp_path / "x.tessel")
    assert list(PathList.pack(tmp_path / "x.tessel", as_bytes=True)) == plain


def test_folder(tmp_path):
    top = tmp_path / "top"
    for name in ("b/x", "b/a/y", "c"):
        (top / name).parent.mkdir(parents=True, exist_ok=True)
        (top / name).touch()
    wanted = [f"{top}/{name}" for name in ("c", "b/x", "b/a/y")]
    assert list(PathList.pack(top)) == wanted


@pytest.mark.skipif(os.geteuid() == 0, reason="root reads every folder")
def test_folder_that_cannot_be_read(tmp_path):
    (tmp_path / "top/closed").mkdir(parents=True)
    (tmp_path / "top/closed").chmod(0)
    with pytest.warns(UserWarning, match="left out 1 folders.*closed"):
        assert list(PathList.pack(tmp_path / "top")) == []


def test_missing_source(tmp_path):
    with pytest.raises(FileNotFoundError):
        PathList.pack(tmp_path / "missing")


@pytest.mark.parametrize(
    ("paths", "error", "message"),
    [
        (["a", ""], ValueError, "path 1 is empty"),
        (["a", "b", "c\0d"], ValueError, "path 2 holds a NUL"),
        ([b"x" * 2**21], ValueError, "path 0 is longer than 1 MiB"),
        (["a", 5], TypeError, "path 1 is no path"),
        ([None], TypeError, "path 0 is no path"),
        (["\ud800"], ValueError, "path 0 is no path"),
        ([*(["a"] * 20000), ""], ValueError, "path 20000 is empty"),
    ],
)
def test_what_is_no_path(paths, error, message, tmp_path):
    file = tmp_path / "list.tessel"
    PathList.pack(["old"], file)
    with pytest.raises(error, match=message):
        PathList.pack(paths, file)
    assert list(PathList.open(file)) == ["old"]
    assert os.listdir(tmp_path) == ["list.tessel"]


def test_no_iterable():
    for use in PathList.pack, PathList.pack([]).append:
        with pytest.raises(TypeError, match="^'int' object is not iterable$"):
            use(5)


@pytest.mark.parametrize("error", [KeyboardInterrupt, MemoryError, OSError])
def test_errors_of_a_path_come_through(error, tmp_path):
    class Failing:
        def __fspath__(self):
            raise error

    with pytest.raises(error):
        PathList.pack(["a", Failing()], tmp_path / "x.tessel")
    assert os.listdir(tmp_path) == []


def test_names_of_files_with_nul(tmp_path):
    PathList.pack(["a"], tmp_path / "x")
    wrong = f"{tmp_path}/x\0y"
    for use in PathList.open, PathList.pack(["b"]).save, PathList.pack:
        with pytest.raises(ValueError, match="null byte|holds a NUL"):
            use(wrong)
    with pytest.raises(ValueError, match="holds a NUL"):
        PathList.pack(["b"], wrong)
    assert list(PathList.open(tmp_path / "x")) == ["a"]


def test_errors_of_the_iterable_come_through(tmp_path):
    def failing():
        yield "a"
        raise KeyError("mine")

    with pytest.raises(KeyError, match="mine"):
        PathList.pack(failing(), tmp_path / "x.tessel")
    assert os.listdir(tmp_path) == []


def test_files_that_cannot_be_written(tmp_path):
    with pytest.raises(FileNotFoundError) as caught:
        PathList.pack(["a"], tmp_path / "no/x.tessel")
    assert caught.value.filename == str(tmp_path / "no/x.tessel")
    with pytest.raises(OSError):
        PathList.pack(["a"], tmp_path)


def test_an_index(plain, tmp_path):
    packed = PathList.pack(plain, index=True, as_bytes=True)
    assert list(packed) == plain
    first = {path: i for i, path in reversed(list(enumerate(plain)))}
    assert all(packed.index(path) == i for path, i in first.items())
    assert all(path in packed for path in plain)
    assert packed.numbers([*plain, b"x/y/z"]).tolist() == [*map(first.get, plain), -1]
    assert list(packed.save(tmp_path / "x.tessel", index=True)) == plain


def test_what_is_appended_to_an_index_has_one():
    paths = lists.shuffled(lists.tree(5000))
    sizes = {}
    for index in (False, True):
        packed = PathList.pack(paths[:2500], index=index, as_bytes=True)
        longer = packed.append(paths[2500:])
        assert list(longer) == paths
        sizes[index] = longer.nbytes
    # 13 bits number 5000 paths.
    assert sizes[True] - sizes[False] >= 5000 * 12 / 8


def test_levels(plain):
    for level in ("fast", "normal", "best"):
        assert list(PathList.pack(plain, level=level, as_bytes=True)) == plain
    with pytest.raises(ValueError, match="'most' is none of"):
        PathList.pack(plain, level="most")


def test_progress_ends_with_everything(plain):
    told = []
    PathList.pack(plain, progress=lambda done, total: told.append((done, total)))
    assert told[-1] == (len(plain), len(plain))
    assert all(done <= total for done, total in told)


def test_progress_that_cannot_be_called(tmp_path):
    PathList.pack(["old"], tmp_path / "x.tessel")
    old = PathList.open(tmp_path / "x.tessel")
    for use in old.append, lambda paths, **options: old[:0].save(old.file, **options):
        with pytest.raises(TypeError, match="progress 5 cannot be called"):
            use(["new"], progress=5)
    assert list(PathList.open(tmp_path / "x.tessel")) == ["old"]


def test_progress_can_end_the_packing(tmp_path):
    class Enough(Exception):
        pass

    def progress(done, total):
        if total == 300_000:  # all are added: the archive is being built
            raise Enough

    paths = lists.tree(300_000)
    with pytest.raises(Enough):
        PathList.pack(paths, tmp_path / "x.tessel", level="best", progress=progress)
    assert os.listdir(tmp_path) == []


def test_save_and_append(plain, packed, tmp_path):
    file = tmp_path / "saved.tessel"
    saved = packed.save(file)
    assert saved == packed == PathList.open(file, as_bytes=True)
    longer = saved.append(["x", "y"])
    assert list(longer) == [*plain, b"x", b"y"]
    assert list(saved) == plain  # it keeps the old file
    assert longer == PathList.open(file, as_bytes=True)
    assert longer.append([]) == longer
    with pytest.raises(ValueError, match=f"path {len(longer) + 1} is empty"):
        longer.append(["z", ""])
    assert longer == PathList.open(file, as_bytes=True)


@pytest.mark.parametrize("change", ["append", "replace", "remove"])
def test_append_to_a_file_that_changed(change, tmp_path):
    file = tmp_path / "x.tessel"
    old = PathList.pack(["a", "b"], file)
    if change == "append":
        old.append(["c"])
    elif change == "replace":
        PathList.pack(["b", "a"], file)
    else:
        file.unlink()
    kept = file.read_bytes() if file.exists() else None
    with pytest.raises((ValueError, FileNotFoundError), match="x.tessel"):
        old.append(["d"])
    assert list(old) == ["a", "b"]
    assert (file.read_bytes() if file.exists() else None) == kept


def test_append_in_memory(plain):
    packed = PathList.pack(plain, as_bytes=True)
    assert list(packed.append(packed)) == plain + plain
    assert list(packed) == plain


def test_views_are_saved_but_not_appended_to(plain, packed, tmp_path):
    view = packed[::-1]
    assert list(view.save(tmp_path / "view.tessel")) == plain[::-1]
    if len(plain) > 1:
        with pytest.raises(ValueError, match="cannot append to a view"):
            view.append(["a"])


def test_a_list_saved_over_its_own_file(tmp_path):
    file = tmp_path / "x.tessel"
    packed = PathList.pack(["a", "b", "c"], file)
    assert list(packed[::-1].save(file)) == ["c", "b", "a"]
    assert list(packed) == ["a", "b", "c"]


def test_interrupt_ends_packing(tmp_path):
    paths = lists.shuffled(lists.tree(400_000))
    timer = threading.Timer(0.2, os.kill, (os.getpid(), signal.SIGINT))
    timer.start()
    with pytest.raises(KeyboardInterrupt):
        while True:
            PathList.pack(paths, tmp_path / "x.tessel", level="best")
    timer.join()
    assert all(name == "x.tessel" for name in os.listdir(tmp_path))
