"""Packing shards on a cluster: two worker processes on this machine."""

import json
import os
import pathlib
import pickle
import signal

import lists
import pytest
from qztessel import PathList, ShardedPathList
from qztessel import dask as packing

distributed = pytest.importorskip("distributed")

LISTINGS = [lists.tree(500, 1), lists.NASTY[:10], [], lists.shuffled(lists.tree(700))]


@pytest.fixture(scope="module")
def cluster():
    with distributed.LocalCluster(
        n_workers=2,
        threads_per_worker=1,
        host="127.0.0.1",
        dashboard_address="127.0.0.1:0",
    ) as cluster:
        yield cluster


@pytest.fixture
def client(cluster):
    with distributed.Client(cluster) as client:
        client.wait_for_workers(2)
        yield client


@pytest.fixture
def listings(tmp_path):
    """Files of NUL-separated paths."""
    files = []
    for i, paths in enumerate(LISTINGS):
        files.append(tmp_path / f"listing {i}")
        files[-1].write_bytes(b"".join(path + b"\0" for path in paths))
    return files


@pytest.fixture
def wanted():
    return [path for paths in LISTINGS for path in paths]


def states(folder):
    """What tells whether a shard was replaced."""
    return {file.name: file.stat().st_ino for file in folder.glob("*.tessel")}


def test_shards_are_the_listings(client, listings, wanted, tmp_path):
    ready = []
    folder = tmp_path / "made/shards"
    paths = packing.pack_shards(
        listings, folder, client, as_bytes=True, progress=lambda *n: ready.append(n)
    )
    assert list(paths) == wanted
    assert ready == [(i + 1, 4) for i in range(4)]
    assert paths.file == str(folder / "manifest.json")
    manifest = json.loads(pathlib.Path(paths.file).read_text())
    names = [shard["shard"] for shard in manifest["shards"]]
    assert names == [f"0000{i}.tessel" for i in range(4)]
    assert list(ShardedPathList.open(paths.file, as_bytes=True)) == wanted
    assert not list(folder.glob("*.tmp")) and not list(folder.glob(".*"))


def test_no_listings(client, tmp_path):
    assert list(packing.pack_shards([], tmp_path, client)) == []


def test_one_name_is_no_list_of_names(client, tmp_path):
    with pytest.raises(TypeError, match="put the one into a list"):
        packing.pack_shards("listing", tmp_path, client)


def test_wrong_options_are_told_before_anything_is_packed(client, tmp_path):
    listing = tmp_path / "listing"
    listing.write_text("a\n")
    with pytest.raises(ValueError, match="^level 'most' is none of"):
        packing.pack_shards([listing], tmp_path / "shards", client, level="most")
    with pytest.raises(TypeError, match="^progress 7 cannot be called"):
        packing.pack_shards([listing], tmp_path / "shards", client, progress=7)
    assert not (tmp_path / "shards").exists()


def test_a_listing_that_is_a_shard_to_be(client, tmp_path):
    for name, paths in ("00000.tessel", ["a"]), ("00001.tessel", ["b"]):
        PathList.pack(paths, tmp_path / name)
    kept = {file: file.read_bytes() for file in tmp_path.iterdir()}
    with pytest.raises(ValueError, match="0000..tessel' would be replaced"):
        packing.pack_shards(sorted(kept, reverse=True), tmp_path, client)
    assert {file: file.read_bytes() for file in tmp_path.iterdir()} == kept


def test_folders_and_archives(client, tmp_path, monkeypatch):
    monkeypatch.chdir(tmp_path)
    (tmp_path / "tree/a").mkdir(parents=True)
    (tmp_path / "tree/a/file").touch()
    PathList.pack(["x", "y"], "xy.tessel")
    (tmp_path / "lines").write_text("one\ntwo\n")
    sources = ["tree", "xy.tessel", "lines"]
    paths = packing.pack_shards(sources, "shards", client)
    assert list(paths) == [f"{tmp_path}/tree/a/file", "x", "y", "one", "two"]
    (tmp_path / "tree/a/other").touch()
    paths = packing.pack_shards(sources, "shards", client)
    assert list(paths)[:2] == [f"{tmp_path}/tree/a/file", f"{tmp_path}/tree/a/other"]


def test_a_second_call_packs_what_changed(client, listings, wanted, tmp_path):
    folder = tmp_path / "shards"
    packing.pack_shards(listings, folder, client)
    first = states(folder)
    packing.pack_shards(listings, folder, client)
    assert states(folder) == first

    listings[1].write_bytes(b"new\0")
    paths = packing.pack_shards(listings, folder, client, as_bytes=True)
    second = states(folder)
    assert [name for name in first if first[name] != second[name]] == ["00001.tessel"]
    assert list(paths) == LISTINGS[0] + [b"new"] + LISTINGS[3]

    packing.pack_shards(listings, folder, client, level="fast")
    assert not set(states(folder).items()) & set(second.items())


def spoil_half(file):
    file.write_bytes(file.read_bytes()[: file.stat().st_size // 2])


def spoil_other(file):
    PathList.pack(["other"], file)


def spoil_record(file):
    file.with_name(file.name + ".json").write_text("{")


@pytest.mark.parametrize("spoil", [spoil_half, spoil_other, spoil_record, os.unlink])
def test_a_spoilt_shard_is_packed_again(spoil, client, listings, wanted, tmp_path):
    folder = tmp_path / "shards"
    packing.pack_shards(listings, folder, client)
    first = states(folder)
    spoil(folder / "00003.tessel")
    paths = packing.pack_shards(listings, folder, client, as_bytes=True)
    assert list(paths) == wanted
    kept = [name for name in first if first[name] == states(folder)[name]]
    assert set(kept) >= {f"0000{i}.tessel" for i in range(3)}


def test_a_missing_listing(client, listings, tmp_path):
    folder = tmp_path / "shards"
    missing = str(tmp_path / "none")
    with pytest.raises(FileNotFoundError, match=f"cannot pack '{missing}'") as raised:
        packing.pack_shards([*listings, missing], folder, client)
    assert "\n" not in str(raised.value)
    assert not (folder / "manifest.json").exists()


def test_a_listing_that_cannot_be_packed(client, listings, tmp_path):
    folder = tmp_path / "shards"
    packing.pack_shards(listings, folder, client)
    listings[2].write_bytes(b"a\0\0b\0" + b"n" * 2**21 + b"\0")
    with pytest.raises(ValueError, match=f"cannot pack '{listings[2]}'") as raised:
        packing.pack_shards(listings, folder, client)
    assert "\n" not in str(raised.value)
    assert not (folder / "manifest.json").exists()  # it told of a shard that is away


def test_a_lost_worker(client, listings, wanted, tmp_path):
    """A worker that waits for its listing is killed. Another packs the shard."""
    last = listings[-1]
    ready = tmp_path / "ready"
    last.rename(ready)
    os.mkfifo(last)  # whoever opens it waits, as nobody writes
    processes = client.run(os.getpid)
    killed = []

    def kill(done, count):
        if done < count - 1 or killed:
            return
        (worker,) = (name for name, tasks in client.processing().items() if tasks)
        ready.rename(last)
        os.kill(processes[worker], signal.SIGKILL)
        killed.append(worker)

    folder = tmp_path / "shards"
    paths = packing.pack_shards(listings, folder, client, as_bytes=True, progress=kill)
    assert killed and list(paths) == wanted


def test_interrupt_cancels(client, listings, tmp_path):
    folder = tmp_path / "shards"

    def interrupt(ready, count):
        raise KeyboardInterrupt

    with pytest.raises(KeyboardInterrupt):
        packing.pack_shards(listings, folder, client, progress=interrupt)
    assert not (folder / "manifest.json").exists()
    assert len(packing.pack_shards(listings, folder, client)) == sum(map(len, LISTINGS))


def test_searching_on_the_cluster(client, listings, wanted, tmp_path):
    paths = packing.pack_shards(listings, tmp_path / "shards", client, as_bytes=True)
    here = PathList.pack(wanted, as_bytes=True)
    there = paths.on(client)
    asked = [*wanted[::50], b"none"]
    views = (lambda p: p, lambda p: p[9:-9], lambda p: p.shuffled(1), lambda p: p[::7])
    for view in views:
        assert view(there).find("lib").tolist() == view(here).find("lib").tolist()
        assert view(there).numbers(asked).tolist() == view(here).numbers(asked).tolist()
        assert view(there).folders() == view(here).folders()
        assert (wanted[0] in view(there)) == (wanted[0] in view(here))
        assert b"none" not in view(there)
    assert pickle.loads(pickle.dumps(there)) == here
    (tmp_path / "shards/00003.tessel").unlink()
    with pytest.raises(FileNotFoundError, match="A shard is missing.*00003.tessel'"):
        there.find("lib")
