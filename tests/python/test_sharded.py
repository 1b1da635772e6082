"""Lists in several archives, beside plain lists and lists in one archive."""

import concurrent.futures
import gc
import json
import os
import pickle
import random
import re
import signal
import sys
import threading

import lists
import numpy as np
import pytest
from qztessel import PathList, ShardedPathList


def join(plain, folder, sizes, **options):
    """Packs the paths into shards of these sizes, and opens them as a list."""
    files = []
    first = 0
    for i, size in enumerate(sizes):
        files.append(folder / f"{i}.tessel")
        PathList.pack(plain[first : first + size], files[-1])
        first += size
    assert first == len(plain)
    return ShardedPathList.join(files, folder / "all.json", **options)


def random_sizes(choose, total):
    """Sizes of up to six shards, some of them empty."""
    cuts = sorted(choose.randint(0, total) for _ in range(choose.randrange(6)))
    ends = [0, *cuts, total]
    sizes = [b - a for a, b in zip(ends, ends[1:])]
    sizes.insert(choose.randrange(len(sizes) + 1), 0)
    return sizes


@pytest.fixture(params=range(3))
def both(request, plain, tmp_path):
    """The same paths in shards, and in one archive."""
    sizes = random_sizes(random.Random(request.param), len(plain))
    sharded = join(plain, tmp_path, sizes, as_bytes=True)
    return sharded, PathList.pack(plain, as_bytes=True)


def views(paths, choose):
    """Views of every kind. The same ones for the same seed and size."""
    size = len(paths)
    chosen = [choose.randrange(size) for _ in range(2 * size)]
    few = [choose.randrange(size) for _ in range(size // 7)]
    cut = choose.randint(0, size)
    return [
        paths,
        paths[cut:],
        paths[:cut],
        paths[cut // 2 : cut],
        paths[::-1],
        paths[cut::-3],
        paths.shuffled(cut),
        paths.shuffled(cut)[1:][::2],
        paths.sample(size // 5, seed=cut),
        paths.split(3)[1],
        paths.select(chosen),
        paths.select(few),
        paths.select(few).shuffled(3),
        paths.select(chosen)[5:-5].shuffled(9)[::-2],
    ]


def view_pairs(both, seed=1):
    sharded, one = both
    return zip(views(sharded, random.Random(seed)), views(one, random.Random(seed)))


def test_reading(both):
    for view, wanted in view_pairs(both):
        assert type(view) is ShardedPathList and view.as_bytes
        plain = list(wanted)
        assert len(view) == len(plain) and list(view) == plain
        assert [view[i] for i in range(len(plain))] == plain
        assert [view[-i - 1] for i in range(len(plain))] == plain[::-1]
        assert list(reversed(view)) == plain[::-1]
        for wrong in (len(plain), -len(plain) - 1):
            with pytest.raises(IndexError, match=f"range for {len(plain)} paths"):
                view[wrong]


def test_take(both):
    choose = random.Random(1)
    for view, wanted in view_pairs(both):
        size = len(wanted)
        for count in (0, 1, 500):
            chosen = [choose.randrange(-size, size) for _ in range(count) if size]
            assert view.take(chosen) == wanted.take(chosen)
            for kind in "SUO":
                taken = view.take(chosen, as_array=kind)
                same = wanted.take(chosen, as_array=kind)
                assert taken.dtype == same.dtype and taken.tolist() == same.tolist()
        with pytest.raises(IndexError):
            view.take([size])


def test_numbers(both):
    choose = random.Random(2)
    for view, wanted in view_pairs(both):
        for count in (0, 1, 20, 400):
            asked = [choose.choice(both[1]) for _ in range(count) if len(both[1])]
            asked += [b"", b"missing", b"a\0", "a/ä"]
            found = view.numbers(iter(asked))
            assert found.dtype == np.int64
            assert found.tolist() == wanted.numbers(asked).tolist()
        with pytest.raises(TypeError):
            view.numbers([b"a", 5])


def test_find(both):
    for view, wanted in view_pairs(both):
        for texts, query in (
            ((), {}),
            ((b"a",), {}),
            (("lib/", "1"), {}),
            (("no such text",), {}),
            ((), {"glob": "*lib*/*1.txt"}),
            (("2",), {"regex": "MAN-1.*TXT$", "folder": "lib", "ignore_case": True}),
            ((), {"folder": b"share/doc"}),
        ):
            found = view.find(*texts, **query)
            assert found.dtype == np.int64
            assert found.tolist() == wanted.find(*texts, **query).tolist()
        with pytest.raises(ValueError, match="missing"):
            view.find(regex="a(")


def test_folders(both):
    for view, wanted in view_pairs(both):
        assert view.folders() == wanted.folders()


def test_one_path(both):
    choose = random.Random(3)
    for view, wanted in view_pairs(both):
        asked = [choose.choice(both[1]) for _ in range(3) if len(both[1])]
        for path in [*asked, b"", b"none", b"a\0b", 5, None, "\ud800"]:
            assert (path in view) == (path in wanted)
            assert view.count(path) == wanted.count(path)
            if path in wanted:
                assert view.index(path) == wanted.index(path)
            else:
                with pytest.raises(ValueError, match="is not in the list"):
                    view.index(path)


def test_equality(both):
    for view, wanted in view_pairs(both):
        assert view == wanted and wanted == view
        assert view == view[:]
        if len(view):
            assert view != wanted[1:] and wanted[1:] != view
    assert both[0] != list(both[0])
    if len(set(both[1])) > 1:
        assert both[0] != both[1][::-1] and both[1][::-1] != both[0]
    with pytest.raises(TypeError):
        hash(both[0])


def test_pickle(both):
    for view, wanted in view_pairs(both):
        copied = pickle.loads(pickle.dumps(view))
        assert copied == wanted and repr(copied) == repr(view)
    assert len(pickle.dumps(both[0].shuffled(1))) < 1000


def test_save(both, tmp_path):
    sharded, one = both
    saved = sharded[::-1].save(tmp_path / "saved.tessel", level="fast")
    assert type(saved) is PathList and saved == one[::-1]
    assert PathList.pack(sharded, as_bytes=True) == one


def test_text(plain, tmp_path):
    paths = join(plain, tmp_path, [len(plain)])
    assert list(paths) == [os.fsdecode(path) for path in plain]
    assert list(paths.shuffled(1)) == list(PathList.pack(plain).shuffled(1))
    assert paths.folders() == PathList.pack(plain).folders()
    everything = range(len(plain))
    assert paths.take(everything) == list(paths)


def test_facts(tmp_path):
    paths = join(list("abc"), tmp_path, [2, 0, 1])
    file = str(tmp_path / "all.json")
    assert paths.file == file
    sizes = [os.stat(tmp_path / f"{i}.tessel").st_size for i in range(3)]
    assert paths.nbytes == sum(sizes)
    assert sys.getsizeof(paths.shuffled(1)) < 1000
    assert sys.getsizeof(paths.select([0] * 10000)) > 80000
    shown = f"<ShardedPathList of 2 paths from {file!r}[1:3]: ['b', 'c']>"
    assert repr(paths[1:]) == shown


def test_what_shards_cannot(tmp_path):
    paths = join(list("abc"), tmp_path, [2, 1])
    with pytest.raises(ValueError, match="pack one more and join"):
        paths.append(["d"])
    with pytest.raises(TypeError, match="pack each shard"):
        ShardedPathList.pack(["a"])
    (tmp_path / "other").mkdir()
    with pytest.raises(ValueError, match="is not in the folder of"):
        ShardedPathList.join([tmp_path / "0.tessel"], tmp_path / "other/all.json")
    with pytest.raises(ValueError, match="would be replaced by the manifest"):
        ShardedPathList.join([tmp_path / "0.tessel"], tmp_path / "0.tessel")
    assert len(PathList.open(tmp_path / "0.tessel")) == 2
    with pytest.raises(TypeError, match="put the one into a list"):
        ShardedPathList.join(str(tmp_path / "0.tessel"), tmp_path / "all.json")


def test_shards_are_opened_when_needed(tmp_path):
    join(list("abcdef"), tmp_path, [2, 2, 2])
    paths = ShardedPathList.open(tmp_path / "all.json")
    for name in ("0.tessel", "2.tessel"):
        (tmp_path / name).rename(tmp_path / f"{name}.away")
    assert len(paths) == 6 and paths[2] == "c"
    assert list(paths[2:4]) == ["c", "d"] and paths[2:4].numbers(["d"])[0] == 1
    assert paths.select([3, 2]).find("d").tolist() == [0]
    for read in (
        lambda: paths[0],
        lambda: list(paths),
        lambda: paths.take([0, 2]),
        lambda: paths.find("a"),
        lambda: paths.shuffled(1).find("a"),
        lambda: paths.numbers(["a"]),
        paths.folders,
        lambda: "a" in paths,
        lambda: paths == PathList.pack(list("abcdef")),
    ):
        message = "A shard is missing; pack the shards again: '.*0.tessel'"
        with pytest.raises(FileNotFoundError, match=message) as raised:
            read()
        assert "\n" not in str(raised.value)
    assert re.search("of 6 paths .* cannot be read, .*0.tessel", repr(paths))
    (tmp_path / "0.tessel.away").rename(tmp_path / "0.tessel")
    assert paths[0] == "a"


@pytest.mark.parametrize("changed", [["a", "c"], ["a", "b", "c"]])
def test_a_changed_shard(changed, tmp_path):
    join(list("abcd"), tmp_path, [2, 2])
    PathList.pack(changed, tmp_path / "0.tessel")
    paths = ShardedPathList.open(tmp_path / "all.json")
    assert paths[2] == "c"
    for read in (lambda: paths[0], lambda: paths.find("a")):
        message = "shard '.*0.tessel' is not the one of the manifest"
        with pytest.raises(ValueError, match=message) as raised:
            read()
        assert "\n" not in str(raised.value)


def test_a_cut_shard(tmp_path):
    join(lists.tree(3000), tmp_path, [1000, 2000])
    file = tmp_path / "1.tessel"
    file.write_bytes(file.read_bytes()[:-100])
    paths = ShardedPathList.open(tmp_path / "all.json")
    with pytest.raises(ValueError, match="1.tessel'"):
        paths[1500]


def wrong(field, value):
    """A change of the second shard's entry."""
    return lambda manifest: manifest["shards"][1].__setitem__(field, value)


WRONG_MANIFESTS = {
    "format": (lambda m: m.update(format="x"), "does not say that its format"),
    "version": (lambda m: m.update(version=2), "version is 2, not 1"),
    "true version": (lambda m: m.update(version=True), "version is True, not 1"),
    "fraction of paths": (lambda m: m.update(paths=4.0), "have 4 paths, not 4.0"),
    "no shards": (lambda m: m.pop("shards"), "has no list of shards"),
    "shards": (lambda m: m.update(shards={}), "has no list of shards"),
    "paths": (lambda m: m.update(paths=5), "have 4 paths, not 5"),
    "no object": (lambda m: m["shards"].insert(1, 5), "shard 1 is no object"),
    "lost": (lambda m: m["shards"].pop(0), "shard 0 starts at 2, not 0"),
    "swapped": (lambda m: m["shards"].reverse(), "shard 0 starts at 2, not 0"),
    "no name": (wrong("shard", None), "shard 1 has None as its 'shard'"),
    "folder": (wrong("shard", "../x"), "which is no file name"),
    "NUL": (wrong("shard", "x\0"), "which is no file name"),
    "dots": (wrong("shard", ".."), "which is no file name"),
    "first": (wrong("first", 1), "shard 1 starts at 1, not 2"),
    "fraction": (wrong("first", 2.0), "shard 1 has 2.0 as its 'first'"),
    "negative": (wrong("count", -1), "shard 1 has -1 as its 'count'"),
    "truth": (wrong("count", True), "shard 1 has True as its 'count'"),
    "huge": (wrong("count", 2**63), "shards have"),
    "sum": (wrong("sum", "0x12"), "shard 1 has '0x12' as its 'sum'"),
}


@pytest.mark.parametrize("kind", WRONG_MANIFESTS)
def test_a_wrong_manifest(kind, tmp_path):
    change, message = WRONG_MANIFESTS[kind]
    join(list("abcd"), tmp_path, [2, 2])
    file = tmp_path / "all.json"
    manifest = json.loads(file.read_text())
    change(manifest)
    file.write_text(json.dumps(manifest))
    message = "all.json' is no manifest of shards.*" + message
    with pytest.raises(ValueError, match=message) as raised:
        ShardedPathList.open(file)
    assert "\n" not in str(raised.value)


def test_a_manifest_cut_anywhere(tmp_path):
    join(list("abcd"), tmp_path, [2, 2])
    file = tmp_path / "all.json"
    text = file.read_bytes().rstrip()
    for end in range(len(text)):
        file.write_bytes(text[:end])
        with pytest.raises(ValueError, match="is no manifest of shards"):
            ShardedPathList.open(file)
    for text in (b"[" * 100_000, b"\xff\xfe", b"5", b"null"):
        file.write_bytes(text)
        with pytest.raises(ValueError, match="is no manifest of shards"):
            ShardedPathList.open(file)


def test_pickle_of_another_manifest(tmp_path):
    paths = join(list("abcd"), tmp_path, [2, 2])
    data = pickle.dumps(paths)
    join(list("abce"), tmp_path, [2, 2])
    with pytest.raises(ValueError, match="is not the manifest that was pickled"):
        pickle.loads(data)
    (tmp_path / "all.json").unlink()
    with pytest.raises(FileNotFoundError):
        pickle.loads(data)


def test_a_manifest_is_replaced_as_a_whole(tmp_path):
    join(list("ab"), tmp_path, [1, 1])
    before = sorted(os.listdir(tmp_path))
    files = [tmp_path / "0.tessel", tmp_path / "none"]
    with pytest.raises(FileNotFoundError):
        ShardedPathList.join(files, tmp_path / "all.json")
    assert list(ShardedPathList.open(tmp_path / "all.json")) == ["a", "b"]
    assert sorted(os.listdir(tmp_path)) == before


@pytest.mark.parametrize("kind", ["threads", "processes"])
def test_executors(kind, plain, tmp_path):
    size = len(plain)
    paths = join(plain, tmp_path, [size // 3, 0, size - size // 3], as_bytes=True)
    pool = {
        "threads": concurrent.futures.ThreadPoolExecutor,
        "processes": concurrent.futures.ProcessPoolExecutor,
    }[kind]
    with pool(2) as executor:
        for view, wanted in view_pairs((paths.on(executor), paths), seed=4):
            assert view.find("a").tolist() == wanted.find("a").tolist()
            asked = [*plain[:5], b"none"]
            assert view.numbers(asked).tolist() == wanted.numbers(asked).tolist()
            assert view.folders() == wanted.folders()
            assert (b"a" in view) == (b"a" in wanted)
    assert paths.on(executor).on(None).find("a").tolist() == paths.find("a").tolist()


def test_threads_share_a_list(tmp_path):
    plain = lists.shuffled(lists.tree(6000))
    paths = join(plain, tmp_path, [1000] * 6, as_bytes=True)

    def work(seed):
        view = paths.shuffled(seed)
        assert sorted(view) == sorted(plain)
        assert [paths[i] for i in range(seed, 6000, 97)] == plain[seed::97]
        assert view.find("lib").size == sum(b"lib" in path for path in plain)

    with concurrent.futures.ThreadPoolExecutor(4) as threads:
        list(threads.map(work, range(8)))


def test_more_shards_than_are_kept_mapped(tmp_path, monkeypatch):
    monkeypatch.setattr("qztessel._shards._MAPPED", 3)
    plain = [str(i) for i in range(20)]
    paths = join(plain, tmp_path, [2] * 10)
    assert list(paths) == plain and paths[::-1].take(range(20)) == plain[::-1]

    def mapped():
        gc.collect()
        with open("/proc/self/maps") as maps:
            return sum(str(tmp_path) in line for line in maps)

    assert 0 < mapped() <= 3
    del paths
    assert mapped() == 0


@pytest.mark.parametrize("call", ["take", "numbers", "find", "folders"])
def test_interrupt(call, tmp_path):
    plain = lists.shuffled(lists.tree(100_000))
    paths = join(plain, tmp_path, [50_000] * 2).shuffled(1)
    work = {
        "take": lambda: paths.take(range(len(paths))),
        "numbers": lambda: paths.numbers(plain[:1000]),
        "find": lambda: paths.find(regex="(a|b|c)*x"),
        "folders": paths.folders,
    }[call]
    timer = threading.Timer(0.3, os.kill, (os.getpid(), signal.SIGINT))
    timer.start()
    with pytest.raises(KeyboardInterrupt):
        while True:
            work()
    timer.join()
    assert len(paths.take([0, -1])) == 2  # and the list still works
