"""The wheel, built from a source distribution, as it is installed."""

import os
import pathlib
import shutil
import subprocess
import sys
import zipfile

import qztessel

ROOT = pathlib.Path(__file__).resolve().parents[2]
EXAMPLE = """
import qztessel
assert qztessel.__file__.startswith({folder!r}), qztessel.__file__
paths = qztessel.PathList.pack(["a/b", "c"])
assert list(paths[::-1]) == ["c", "a/b"]
assert qztessel.load_plugin().startswith({folder!r}), qztessel.load_plugin()
kept = qztessel.HuffmanPaths("files", ["/", ["a"]])
kept.add_paths([["/"]], [["a"]])
assert kept.get_paths([1], "/") == ["/a"]
try:
    kept.add_paths([], [["a"]])
except qztessel.HostError as error:
    assert str(error).startswith("The number of folders "), error
"""


def run(*words, cwd, **environment):
    subprocess.run(
        [sys.executable, *words],
        check=True,
        cwd=cwd,
        env={**os.environ, **environment},
    )


def test_wheel(tmp_path):
    source, wheels, folder = (tmp_path / name for name in ("in", "out", "installed"))
    left_out = shutil.ignore_patterns(".git", ".cache", "build", "tests", "bench")
    shutil.copytree(ROOT, source, ignore=left_out)
    # The modules are those that are tested here: to build them takes minutes.
    module = pathlib.Path(qztessel.__file__).parents[3]
    words = ["-m", "build", "--no-isolation", "--outdir", str(wheels)]
    run(*words, cwd=source, QZTESSEL_PYTHON_BUILD=str(module))
    (wheel,) = wheels.glob("*.whl")
    zipfile.ZipFile(wheel).extractall(folder)
    run("-c", EXAMPLE.format(folder=str(folder)), cwd=tmp_path, PYTHONPATH=str(folder))
    names = set(os.listdir(folder / "qztessel"))
    assert {"__init__.py", "_path_list.py", "_core.pyi", "py.typed"} <= names
    assert {"_huffman_paths.py", "_plugin.py", "_host.pyi"} <= names
    assert {"dask.py", "_shards.py", "_sharded_path_list.py"} <= names
