"""What a worker of torch's DataLoader takes for the paths of its dataset.

Usage: worker_memory.py LIST KIND METHOD

LIST is a file with one path per line, KIND one of KINDS, METHOD "fork" or
"spawn". Runs one shuffled epoch with two workers, checks that each path of a
PathList came exactly once, and prints the memory of a worker that waits for the
next epoch as JSON: the mean of both, in bytes. Of what is no PathList, it reads
a quarter, which touches all of its pages, too. Each run has a process of its
own, because a worker shares pages with the process that it comes from.
"""

from __future__ import annotations

import json
import multiprocessing
import os
import pathlib
import subprocess
import sys
import tempfile
from collections.abc import Callable
from typing import Any

WORKERS = 2
BATCH = 1000

# What /proc/PID/smaps calls them. Pages that several processes have mapped are
# divided among them; the rest is private.
FIGURES = {"total": ["Pss"], "private": ["Private_Clean", "Private_Dirty"]}


class Paths:
    """A dataset. Its items are batches: the paths at some indices.

    paths  a PathList, a list, an array; or the number of paths of a dataset
           that makes them up, and so has none
    """

    def __init__(self, paths: Any) -> None:
        self.paths = paths

    def __len__(self) -> int:
        return self.paths if isinstance(self.paths, int) else len(self.paths)

    def __getitem__(self, indices: list[int]) -> list[Any]:
        if isinstance(self.paths, int):
            return [f"folder/of/a/path/that/is/about/as/long/{i}" for i in indices]
        if isinstance(self.paths, list):
            return [self.paths[i] for i in indices]
        if hasattr(self.paths, "dtype"):
            return list(self.paths[indices].tolist())
        return list(self.paths.take(indices))


def lines(file: pathlib.Path) -> list[str]:
    return file.read_text(errors="surrogateescape").split("\n")[:-1]


# Packs in another process, because packing leaves memory behind. That process
# also caches the package's compiled modules, as an installed package has them:
# a worker that compiles them keeps a megabyte.
def packed(file: pathlib.Path, folder: pathlib.Path) -> Any:
    archive = folder / "list.tessel"
    code = "import sys; from qztessel import PathList; PathList.pack(*sys.argv[1:])"
    caching = {k: v for k, v in os.environ.items() if k != "PYTHONDONTWRITEBYTECODE"}
    words: list[str | pathlib.Path] = [sys.executable, "-c", code, file, archive]
    subprocess.run(words, check=True, env=caching)

    from qztessel import PathList

    return PathList.open(archive)


def array(file: pathlib.Path, _: pathlib.Path) -> Any:
    import numpy as np

    return np.array(file.read_bytes().split(b"\n")[:-1], dtype="S")


def empty(file: pathlib.Path, _: pathlib.Path) -> Any:
    return file.read_bytes().count(b"\n")


KINDS: dict[str, Callable[[pathlib.Path, pathlib.Path], Any]] = {
    "empty": empty,
    "PathList": packed,
    "list of str": lambda file, _: lines(file),
    "NumPy S array": array,
}


def memory_of(pid: int) -> dict[str, int]:
    """The memory of a process, without the system's libraries: how their pages
    are divided depends on what else runs on the machine."""
    sums = dict.fromkeys(FIGURES, 0)
    counts = True
    for line in pathlib.Path(f"/proc/{pid}/smaps").read_text().splitlines():
        name, *words = line.split()
        if "-" in name:  # a range of addresses, and at the end a file
            counts = not words[-1].startswith("/usr/")
        elif counts:
            for figure, names in FIGURES.items():
                if name.rstrip(":") in names:
                    sums[figure] += 1024 * int(words[0])
    return {**sums, "shared": sums["total"] - sums["private"]}


def run(file: pathlib.Path, kind: str, method: str) -> dict[str, int]:
    from torch.utils.data import BatchSampler, DataLoader, RandomSampler

    with tempfile.TemporaryDirectory() as folder:
        dataset = Paths(KINDS[kind](file, pathlib.Path(folder)))
        wanted = len(dataset) if kind == "PathList" else len(dataset) // 4
        order = RandomSampler(dataset, num_samples=wanted)
        loader: Any = DataLoader(
            dataset,  # type: ignore[arg-type]
            sampler=BatchSampler(order, BATCH, drop_last=False),
            batch_size=None,
            num_workers=WORKERS,
            multiprocessing_context=method,
            persistent_workers=True,
            collate_fn=list,
        )
        came = [path for batch in loader for path in batch]
        workers = [
            memory_of(child.pid)
            for child in multiprocessing.active_children()
            if child.pid is not None
        ]
    if len(came) != wanted:
        sys.exit(f"{len(came)} paths instead of {wanted}")
    if kind == "PathList" and sorted(came) != sorted(lines(file)):
        sys.exit("the epoch had other paths than the list")
    if len(workers) != WORKERS:
        sys.exit(f"{len(workers)} workers instead of {WORKERS}")
    return {name: sum(w[name] for w in workers) // WORKERS for name in workers[0]}


def main() -> int:
    if len(sys.argv) != 4:
        print(__doc__)
        return 2
    print(json.dumps(run(pathlib.Path(sys.argv[1]), sys.argv[2], sys.argv[3])))
    return 0


if __name__ == "__main__":
    sys.exit(main())
