"""Packing lists of paths on many machines, with `dask.distributed`.

Needs Debian's python3-distributed. `pack_shards` makes a `ShardedPathList`,
which needs none; its method `on` takes a client to search on a cluster.
"""

from __future__ import annotations

import contextlib
import json
import os
from collections.abc import Iterable
from dataclasses import asdict, dataclass
from typing import Any, Literal

import distributed

from . import _core
from ._path_list import Path, PathList, Progress, known_callable, known_level
from ._sharded_path_list import ShardedPathList
from ._shards import Facts, replace_json, write_manifest

Level = Literal["fast", "normal", "best"]

_MANIFEST = "manifest.json"


def pack_shards(
    listings: Iterable[Path],
    folder: Path,
    client: distributed.Client,
    *,
    level: Level = "normal",
    progress: Progress | None = None,
    as_bytes: bool = False,
) -> ShardedPathList[Any]:
    """Pack each listing into a shard on a cluster's workers; open all as a list.

    listings  names of list files with one path per line (or separated by NUL),
              of archives, or of folders, for all files below them
    folder    for the shards 00000.tessel, 00001.tessel, ... and manifest.json;
              it is made if it is not there
    client    of the cluster; its workers must have this package, and see the
              listings and the folder under the same paths
    level     as in `PathList.pack`
    progress  called with the shards that are ready and their number
    as_bytes  whether the list gives `bytes`

    The list has the paths of the first listing, then those of the second, and
    so on. A worker reads a list file as a whole and packs on all cores of its
    machine: let it have one thread, and memory for its largest listing.

    If a worker is lost, others pack its shards again. A shard is packed anew
    unless it is there, whole, from a file of the same name, size and time of
    change at the same level; so a second call goes on where the first ended.
    What a folder holds shows in no time of change: it is packed each time.

    The manifest is written at the end. If a listing fails, or on Ctrl-C, what
    has not begun is cancelled; workers end the shards that they are at. There
    is then no manifest, or that of an earlier call, none of whose shards has
    changed. Raises what `PathList.pack` raises, with the listing's name, and
    `RuntimeError` if workers are lost again and again. A listing must not be
    one of the shards to be written: that is a `ValueError`.
    """
    if isinstance(listings, (str, bytes, os.PathLike)):
        raise TypeError("expected many listings; put the one into a list")
    known_level(level)
    known_callable(progress)
    sources = [os.path.abspath(os.fsdecode(listing)) for listing in listings]
    target = os.path.abspath(os.fsdecode(folder))
    names = [f"{position:05}.tessel" for position in range(len(sources))]
    files = [os.path.join(target, name) for name in names]
    replaced = {os.path.realpath(file) for file in files}
    for source in sources:
        if os.path.realpath(source) in replaced:
            raise ValueError(f"{source!r} would be replaced while it is read")
    os.makedirs(target, exist_ok=True)
    tasks = client.map(_pack, sources, files, [level] * len(files), pure=False)
    try:
        facts = _results(tasks, sources, progress)
    except BaseException:
        client.cancel(tasks)
        raise
    manifest = os.path.join(target, _MANIFEST)
    write_manifest(manifest, zip(names, facts))
    return ShardedPathList.open(manifest, as_bytes=as_bytes)


def _results(
    tasks: list[distributed.Future], listings: list[str], progress: Progress | None
) -> list[Facts]:
    """The tasks' results. Raises as soon as one of them fails."""
    positions = {task.key: position for position, task in enumerate(tasks)}
    results: dict[int, Facts] = {}
    for task in distributed.as_completed(tasks):
        position = positions[task.key]
        try:
            results[position] = task.result()
        except Exception as error:
            raise _named(error, listings[position]) from error
        if progress is not None:
            progress(len(results), len(tasks))
    return [results[position] for position in range(len(tasks))]


def _named(error: Exception, listing: str) -> Exception:
    """An error of the same kind that names the listing."""
    if isinstance(error, OSError) and error.filename is not None:
        where = f"cannot pack {listing!r}: {error.strerror}"
        return type(error)(error.errno, where, error.filename)
    if isinstance(error, distributed.KilledWorker):
        return RuntimeError(f"cannot pack {listing!r}: its workers were lost")
    if isinstance(error, (ValueError, TypeError)):
        return type(error)(f"cannot pack {listing!r}: {error}")
    return RuntimeError(f"cannot pack {listing!r}: {error!r}")


# ---- On workers ----


@dataclass(frozen=True)
class _Origin:
    """What a shard was packed from. A file beside it has this and its facts."""

    listing: str
    listing_bytes: int
    listing_mtime_ns: int
    level: Level


def _pack(listing: str, file: str, level: Level) -> Facts:
    """Pack a shard, unless it is there."""
    state = os.stat(listing)
    origin = _Origin(listing, state.st_size, state.st_mtime_ns, level)
    record = f"{file}.json"
    if not os.path.isdir(listing) and (done := _finished(origin, file, record)):
        return done
    # Neither may go on saying what the shard is while it is replaced.
    for stale in os.path.join(os.path.dirname(file), _MANIFEST), record:
        with contextlib.suppress(FileNotFoundError):
            os.unlink(stale)
    facts = Facts.of(PathList.pack(listing, file, level=level)._paths)
    replace_json(record, asdict(origin) | asdict(facts))
    return facts


def _finished(origin: _Origin, file: str, record: str) -> Facts | None:
    """The facts of a shard that is there, whole, and of this origin."""
    try:
        facts = Facts.of(_core.PathSequence(_core.open(os.fsencode(file))))
        with open(record, "rb") as text:
            told = json.load(text)
    except (OSError, ValueError):
        return None
    return facts if told == asdict(origin) | asdict(facts) else None
