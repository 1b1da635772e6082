"""Lists with the libraries that people use them with."""

import json
import pathlib
import random
import re
import subprocess
import sys

import lists
import numpy as np
import pytest
from qztessel import PathList

HERE = pathlib.Path(__file__).resolve().parent


def library(name, package=None):
    """A library, or a skip that names Debian's package."""
    return pytest.importorskip(name, reason=f"needs python3-{package or name}")


# ---- fsspec ----


def test_fsspec_lists_are_packed(tmp_path):
    fsspec = library("fsspec")
    names = [f"{folder}/{i}.bin" for folder in ("a", "b/c") for i in range(50)]
    for protocol, root in (("memory", "/bucket"), ("file", str(tmp_path))):
        system = fsspec.filesystem(protocol)
        for name in names:
            system.makedirs(f"{root}/{name}".rpartition("/")[0], exist_ok=True)
            system.pipe(f"{root}/{name}", name.encode())
        packed = PathList.pack(system.find(root))
        assert sorted(packed) == sorted(f"{root}/{name}" for name in names)
        for path in packed.sample(5, seed=1):
            assert f"{root}/{system.cat(path).decode()}" == path


# ---- pandas ----


def test_pandas_takes_paths_and_gives_indices():
    pandas = library("pandas")
    plain = [path.decode() for path in lists.shuffled(lists.tree(3000))]
    packed = PathList.pack(plain)
    series = pandas.Series(packed.take(range(0, 3000, 7)))
    assert series.tolist() == plain[::7]
    table = pandas.DataFrame({"number": packed.numbers(plain[:100])})
    table["path"] = packed.take(table["number"])
    assert table["path"].tolist() == plain[:100]
    assert packed.select(table["number"][::-1])[0] == plain[99]


# ---- h5py ----


def test_h5py_keeps_an_archive(tmp_path):
    h5py = library("h5py")
    packed = PathList.pack(lists.tree(3000), tmp_path / "x.tessel")
    with h5py.File(tmp_path / "x.h5", "w") as file:
        file["archive"] = np.fromfile(packed.file, np.uint8)
        file["sample"] = packed.take([0, 5], as_array="S")
    with h5py.File(tmp_path / "x.h5") as file:
        file["archive"][:].tofile(tmp_path / "y.tessel")
        assert file["sample"].asstr()[:].tolist() == packed.take([0, 5])
    assert PathList.open(tmp_path / "y.tessel") == packed


# ---- torch ----

METHODS = ["fork", "spawn"]
# Only by fork: a worker that is spawned gets a copy of what is no PathList.
RIVALS = {"fork": ["list of str", "NumPy S array"], "spawn": []}


@pytest.fixture(scope="module")
def two_million(tmp_path_factory):
    """A list file whose archive takes some 4 bytes per path, as real ones do."""
    choose = random.Random(1)
    file = tmp_path_factory.mktemp("list") / "paths.txt"
    with open(file, "w") as out:
        out.writelines(
            f"data/{i // 50_000:02}/{i // 400:04}/{choose.getrandbits(24):06x}.jpg\n"
            for i in range(2_000_000)
        )
    return file


def memory(file, kind, method):
    """Bytes of a worker, see worker_memory.py."""
    words = [sys.executable, HERE / "worker_memory.py", file, kind, method]
    run = subprocess.run(words, check=True, stdout=subprocess.PIPE)
    return json.loads(run.stdout)


@pytest.mark.parametrize("method", METHODS)
def test_torch_workers_share_a_list(two_million, method):
    library("torch")
    empty = memory(two_million, "empty", method)
    extra = {}
    for kind in ["PathList", *RIVALS[method]]:
        used = memory(two_million, kind, method)
        extra[kind] = {name: (used[name] - empty[name]) / 1e6 for name in used}
    print(f"\nMB more per worker than without paths, {method}:")
    for kind, figures in extra.items():
        print(f"{kind:14}", *(f"{name} {mb:6.1f}" for name, mb in figures.items()))
    assert extra["PathList"]["total"] <= 2
    assert all(extra[kind]["total"] > 10 for kind in RIVALS[method])


@pytest.mark.parametrize("method", METHODS)
def test_torch_gets_single_paths(tmp_path, method):
    library("torch")
    from torch.utils.data import DataLoader

    plain = [path.decode() for path in lists.tree(3000)]
    packed = PathList.pack(plain, tmp_path / "x.tessel")
    words = {"num_workers": 2, "multiprocessing_context": method, "shuffle": True}
    for batch_size in (1, 64):
        loader = DataLoader(packed, batch_size=batch_size, **words)
        came = [path for batch in loader for path in batch]
        assert sorted(came) == plain and came != plain


def test_the_program_of_the_page(tmp_path):
    library("torch")
    page = (HERE.parents[1] / "docs" / "python.md").read_text()
    (program,) = re.findall(r"^```python\n(.*?)^```$", page, re.M | re.S)
    assert len(program.splitlines()) <= 20
    (tmp_path / "train.py").write_text(program)
    words = [sys.executable, "train.py"]
    told = subprocess.run(words, check=True, cwd=tmp_path, stdout=subprocess.PIPE)
    assert told.stdout == b"100000 images\n"
