"""Shards: archives whose paths, one after the other, make one list.

A manifest says which they are. It is a file of JSON beside them:

    {"format": "qztessel shards", "version": 1, "paths": 3, "shards": [
      {"shard": "00000.tessel", "first": 0, "count": 2, "bytes": 338,
       "sum": "0123456789abcdef"},
      {"shard": "00001.tessel", "first": 2, "count": 1, "bytes": 329,
       "sum": "fedcba9876543210"}]}

shard  the archive's file name, in the folder of the manifest
first  the number of its first path, that is, how many the shards before have
count  its paths
bytes  the size of its file
sum    the archive's checksum, in 16 hexadecimal digits
"""

from __future__ import annotations

import errno
import functools
import hashlib
import json
import os
import re
from bisect import bisect_right
from collections.abc import Iterable, Iterator
from dataclasses import dataclass
from typing import Any

import numpy as np

from . import _core

# Shards that a list keeps mapped: far fewer than the mappings that Linux allows
# a process (65,530), and far more than most lists have.
_MAPPED = 1024

_FORMAT = "qztessel shards"
_VERSION = 1
_FIELDS: dict[str, type] = {
    "shard": str,
    "first": int,
    "count": int,
    "bytes": int,
    "sum": str,
}


@dataclass(frozen=True)
class Facts:
    """What a manifest says of an archive."""

    count: int
    nbytes: int
    sum: int

    @classmethod
    def of(cls, paths: _core.PathSequence) -> Facts:
        return cls(len(paths), paths.stored.nbytes, paths.stored.sum)


@dataclass(frozen=True)
class Shard:
    """An archive whose paths have the numbers of a list from `first` on."""

    file: str
    first: int
    facts: Facts

    @property
    def end(self) -> int:
        return self.first + self.facts.count


def open_shard(shard: Shard) -> _core.PathSequence:
    """Open a shard's archive, in a millisecond, and check its facts.

    Raises `FileNotFoundError` for a missing shard and `ValueError` for one that
    is not what the manifest says; both name it.
    """
    try:
        paths = _core.PathSequence(_core.open(os.fsencode(shard.file)))
    except FileNotFoundError:
        raise FileNotFoundError(
            errno.ENOENT, "A shard is missing; pack the shards again", shard.file
        ) from None
    facts = Facts.of(paths)
    if facts != shard.facts:
        raise ValueError(
            f"shard {shard.file!r} is not the one of the manifest: it has "
            f"{_described(facts)}, not {_described(shard.facts)}; "
            "pack the shards again"
        )
    return paths


def _described(facts: Facts) -> str:
    return f"{facts.count} paths, {facts.nbytes} bytes and sum {facts.sum:016x}"


class Shards:
    """The shards of a manifest. Each is opened when it is first needed.

    manifest  the manifest's file
    digest    of the manifest's bytes
    opened    a shard's paths; keeps those of the last 1024 shards mapped. Any
              number of threads may call it.
    """

    def __init__(self, manifest: str) -> None:
        with open(manifest, "rb") as file:
            text = file.read()
        self.manifest = manifest
        self.digest = hashlib.sha256(text).hexdigest()
        self.shards = _parsed(manifest, text)
        self._ends = [shard.end for shard in self.shards]
        self._end_array = np.array(self._ends, dtype=np.int64)
        self.opened = functools.lru_cache(_MAPPED)(open_shard)

    @property
    def count(self) -> int:
        return self._ends[-1] if self._ends else 0

    @property
    def largest(self) -> int:
        """Paths of the largest shard."""
        return max((shard.facts.count for shard in self.shards), default=0)

    def owner(self, number: int) -> Shard:
        """The shard that has this number."""
        return self.shards[bisect_right(self._ends, number)]

    def owners(self, numbers: Any) -> Any:
        """The positions of the shards that have these numbers."""
        return np.searchsorted(self._end_array, numbers, side="right")

    def overlapping(self, first: int, last: int) -> Iterator[Shard]:
        """The shards that have numbers from first up to, but without, last."""
        for shard in self.shards[bisect_right(self._ends, first) :]:
            if shard.first >= last:
                return
            if shard.facts.count:
                yield shard


# ---- Manifests ----


def write_manifest(file: str, shards: Iterable[tuple[str, Facts]]) -> None:
    """Write a manifest of these archives, which are in its folder."""
    entries: list[dict[str, object]] = []
    first = 0
    for name, facts in shards:
        sizes = {"first": first, "count": facts.count, "bytes": facts.nbytes}
        entries.append({"shard": name, **sizes, "sum": f"{facts.sum:016x}"})
        first += facts.count
    head = {"format": _FORMAT, "version": _VERSION, "paths": first}
    replace_json(file, dict(head, shards=entries))


def replace_json(file: str, value: object) -> None:
    """Replace a file by a value's JSON, as a whole or not at all.

    The new file is a hidden one beside it at first. If the process is killed
    meanwhile, the next replacement of the same file removes that.
    """
    text = json.dumps(value, indent=1) + "\n"
    _core.replace_file(os.fsencode(file), text.encode("ascii"))


def _parsed(file: str, text: bytes) -> list[Shard]:
    try:
        return list(_shards(os.path.dirname(file), json.loads(text)))
    except (ValueError, RecursionError) as error:
        raise ValueError(
            f"{file!r} is no manifest of shards: {error}; pack the shards again"
        ) from None


def _shards(folder: str, manifest: Any) -> Iterator[Shard]:
    if type(manifest) is not dict or manifest.get("format") != _FORMAT:
        raise ValueError(f"it does not say that its format is {_FORMAT!r}")
    version = manifest.get("version")
    if type(version) is not int or version != _VERSION:
        raise ValueError(f"its version is {version!r}, not {_VERSION}")
    entries = manifest.get("shards")
    if type(entries) is not list:
        raise ValueError("it has no list of shards")
    first = 0
    for position, entry in enumerate(entries):
        shard = _shard(folder, position, entry)
        if shard.first != first:
            raise ValueError(f"shard {position} starts at {shard.first}, not {first}")
        first = shard.end
        yield shard
    paths = manifest.get("paths")
    if type(paths) is not int or paths != first or first >= 2**63:
        raise ValueError(f"its shards have {first} paths, not {paths!r}")


def _shard(folder: str, position: int, entry: Any) -> Shard:
    if type(entry) is not dict:
        raise ValueError(f"shard {position} is no object")
    for field, kind in _FIELDS.items():
        value = entry.get(field)
        if type(value) is not kind or (isinstance(value, int) and value < 0):
            raise ValueError(f"shard {position} has {value!r} as its {field!r}")
    name = entry["shard"]
    if name in ("", ".", "..") or "/" in name or "\0" in name:
        raise ValueError(f"shard {position} is {name!r}, which is no file name")
    if not re.fullmatch("[0-9a-f]{16}", entry["sum"]):
        raise ValueError(f"shard {position} has {entry['sum']!r} as its 'sum'")
    facts = Facts(entry["count"], entry["bytes"], int(entry["sum"], 16))
    return Shard(os.path.join(folder, name), entry["first"], facts)
