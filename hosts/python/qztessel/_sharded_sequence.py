"""The paths of many shards, as `_core.PathSequence` is those of one archive.

`ShardedSequence` has the methods of `_core.PathSequence`, so that what is built
on one works on the other, too. Numbers are those of the whole list; indices are
those of a view.
"""

from __future__ import annotations

import functools
import os
from collections.abc import Callable, Iterable, Iterator
from concurrent.futures import Executor, ThreadPoolExecutor
from dataclasses import dataclass
from typing import Any, SupportsIndex, Union

import numpy as np
import numpy.typing as npt

from . import _core
from ._path_list import PathList, with_steps
from ._shards import Shard, Shards, open_shard

Integers = npt.NDArray[np.int64]
Opener = Callable[[Shard], _core.PathSequence]

# Shards that local threads ask at a time. Each question uses all cores by
# itself; a second one works while the first waits for the disk.
_ASKED_AT_A_TIME = 2

# Paths that are compared at a time: a megabyte or two.
_COMPARED = 16384

_GIVE_INDICES = ("find", "numbers", "indices_of")


# ---- Parts of a view: its paths that are in one shard ----


@dataclass(frozen=True)
class Run:
    """Consecutive paths of a shard, at consecutive indices.

    first, last  their places in the shard; last is the one after
    index        the view's index of the first one
    """

    shard: Shard
    first: int
    last: int
    index: int

    def paths(self, opened: Opener) -> _core.PathSequence:
        return opened(self.shard).slice(self.first, 1, self.last - self.first)

    def indices(self, found: Integers) -> Integers:
        return found + self.index


@dataclass(frozen=True)
class Choice:
    """Any paths of a shard: their places in it, and their indices, ascending."""

    shard: Shard
    places: Integers
    at: Integers

    def paths(self, opened: Opener) -> _core.PathSequence:
        return opened(self.shard).select(self.places)

    def indices(self, found: Integers) -> Integers:
        return self.at[found]


@dataclass(frozen=True)
class Share:
    """What a view has of a shard, still to be found out: see `choice`."""

    shard: Shard
    domain: int
    steps: list[tuple[Any, ...]]

    def choice(self) -> Choice:
        """Takes 24 bytes and some 100 nanoseconds per path of the shard."""
        view: _core.View = with_steps(_core.View(self.domain), self.steps)
        at = view.indices_of(np.arange(self.shard.first, self.shard.end))
        return Choice(self.shard, view.numbers(at) - self.shard.first, at)


Part = Union[Run, Choice, Share]


def _answer(
    part: Part, method: str, arguments: tuple[Any, ...], opened: Opener = open_shard
) -> Any:
    """Ask a part, and give its answer in indices of the view."""
    if isinstance(part, Share):
        part = part.choice()
    answer = getattr(part.paths(opened), method)(*arguments)
    if method not in _GIVE_INDICES:
        return answer
    indices = np.array(answer, dtype=np.int64)
    found = indices >= 0
    indices[found] = part.indices(indices[found])
    return indices


@functools.cache
def _no_paths() -> _core.PathSequence:
    return PathList.pack(())._paths


def _in_threads(ask: Callable[[Part], Any], parts: list[Part]) -> Iterator[Any]:
    threads = ThreadPoolExecutor(_ASKED_AT_A_TIME)
    try:
        yield from threads.map(ask, parts)
    finally:
        threads.shutdown(wait=False, cancel_futures=True)


class ShardedSequence:
    """Paths of shards by index: those that a view shows.

    client  None: questions are asked by threads of this process; otherwise an
            executor of concurrent.futures or a client of dask.distributed
    """

    __slots__ = ("client", "shards", "view")

    def __init__(self, shards: Shards, view: _core.View, client: Any = None) -> None:
        self.shards = shards
        self.view = view
        self.client = client

    def __len__(self) -> int:
        return len(self.view)

    # ---- Views ----

    def slice(self, first: int, step: int, count: int) -> ShardedSequence:
        return self._with(self.view.slice(first, step, count))

    def shuffled(self, seed: int) -> ShardedSequence:
        return self._with(self.view.shuffled(seed))

    def select(self, indices: Integers) -> ShardedSequence:
        return self._with(self.view.select(indices))

    def steps(self) -> list[tuple[Any, ...]]:
        return self.view.steps()

    def _with(self, view: _core.View) -> ShardedSequence:
        return ShardedSequence(self.shards, view, self.client)

    # ---- Reading ----

    def at(self, index: SupportsIndex, as_bytes: bool) -> Any:
        number = self.view.number(index)
        shard = self.shards.owner(number)
        return self.shards.opened(shard).at(number - shard.first, as_bytes)

    def block(self, first: int, last: int, as_bytes: bool) -> list[Any]:
        if self.view.start is None:
            return self.take_list(np.arange(first, last), as_bytes)
        paths = []
        for run in self._runs(first, last):
            shard = self.shards.opened(run.shard)
            paths += shard.block(run.first, run.last, as_bytes)
        return paths

    def take_list(self, indices: Integers, as_bytes: bool) -> list[Any]:
        taken = np.empty(len(indices), dtype=object)
        for part in self._choices(indices):
            shard = self.shards.opened(part.shard)
            taken[part.at] = shard.take_list(part.places, as_bytes)
        paths: list[Any] = taken.tolist()
        return paths

    def take_array(self, indices: Integers, as_bytes: bool) -> npt.NDArray[Any]:
        taken = np.zeros(len(indices), "S1" if as_bytes else "U1")
        for part in self._choices(indices):
            paths = self.shards.opened(part.shard).take_array(part.places, as_bytes)
            if paths.dtype.itemsize > taken.dtype.itemsize:
                taken = taken.astype(paths.dtype)
            taken[part.at] = paths
        return taken

    def equals(self, other: ShardedSequence | _core.PathSequence) -> bool:
        size = len(self)
        if len(other) != size:
            return False
        blocks = ((i, min(i + _COMPARED, size)) for i in range(0, size, _COMPARED))
        return all(self.block(*b, True) == other.block(*b, True) for b in blocks)

    # ---- Searching ----

    def find(self, *query: Any) -> Integers:
        # A wrong query is refused here, whether or not a shard is asked.
        found = [_no_paths().find(*query), *self._ask("find", *query)]
        indices: Integers = np.concatenate(found)
        if self.view.start is None:
            indices.sort()
        return indices

    def indices_of(self, path: Any) -> list[int]:
        found = self._ask("indices_of", os.fsencode(path))
        return sorted(index for indices in found for index in indices.tolist())

    def contains(self, path: Any) -> bool:
        return any(self._ask("contains", os.fsencode(path)))

    def numbers(self, paths: Iterable[Any]) -> Integers:
        asked = [os.fsencode(path) for path in paths]
        first = np.full(len(asked), -1)
        for indices in self._ask("numbers", self._sent(asked)):
            better = (indices >= 0) & ((first < 0) | (indices < first))
            first[better] = indices[better]
        return first

    def folders(self, as_bytes: bool) -> list[Any]:
        folders: set[bytes] = set().union(*self._ask("folders", True))
        ordered = sorted(folders)
        if as_bytes:
            return ordered
        return [os.fsdecode(folder) for folder in ordered]

    def _ask(self, method: str, *arguments: Any) -> Iterator[Any]:
        """The answers of all parts, in the order of their shards."""
        parts = self._parts()
        if self.client is not None:
            every = [method] * len(parts), [arguments] * len(parts)
            answers: Iterator[Any] = self._executor().map(_answer, parts, *every)
            return answers
        known = {"method": method, "arguments": arguments}
        ask = functools.partial(_answer, **known, opened=self.shards.opened)
        return map(ask, parts) if len(parts) < 2 else _in_threads(ask, parts)

    def _executor(self) -> Executor:
        if hasattr(self.client, "get_executor"):
            return self.client.get_executor(pure=False)  # type: ignore[no-any-return]
        return self.client  # type: ignore[no-any-return]

    def _sent(self, value: object) -> object:
        """The value, or where it is: at all workers, if there are some."""
        if not hasattr(self.client, "scatter"):
            return value
        return self.client.scatter([value], broadcast=True, hash=False)[0]

    # ---- Parts ----

    def _parts(self) -> list[Part]:
        if self.view.start is not None:
            return list(self._runs(0, len(self)))
        shards = self.shards.shards
        # Neither way takes more memory than the largest shard demands.
        if len(self) <= self.shards.largest:
            return list(self._choices(np.arange(len(self))))
        domain, steps = self.view.domain, self.view.steps()
        return [Share(shard, domain, steps) for shard in shards if shard.facts.count]

    def _runs(self, first: int, last: int) -> Iterator[Run]:
        """The parts of a view of consecutive numbers, between two indices."""
        start = self.view.start or 0
        for shard in self.shards.overlapping(start + first, start + last):
            begin = max(start + first, shard.first)
            end = min(start + last, shard.end)
            yield Run(shard, begin - shard.first, end - shard.first, begin - start)

    def _choices(self, indices: Integers) -> Iterator[Choice]:
        """The paths at these indices, by shard; `at` is positions in `indices`."""
        numbers = self.view.numbers(indices)
        owners = self.shards.owners(numbers)
        order = np.argsort(owners, kind="stable")
        present, starts = np.unique(owners[order], return_index=True)
        for owner, at in zip(present.tolist(), np.split(order, starts[1:])):
            shard = self.shards.shards[owner]
            yield Choice(shard, numbers[at] - shard.first, at)
