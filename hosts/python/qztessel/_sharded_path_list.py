"""The class ShardedPathList; the package's users import it from `qztessel`."""

from __future__ import annotations

import os
from collections.abc import Iterable
from typing import Any, AnyStr, Literal, NoReturn, SupportsIndex, overload

from . import _core
from ._path_list import Path, PathList, full_name, with_steps
from ._sharded_sequence import ShardedSequence
from ._shards import Facts, Shards, write_manifest


class ShardedPathList(PathList[AnyStr]):
    """A list of paths in several archives, its shards: a PathList of all.

    A manifest names the shards and says how many paths each has; see
    `qztessel.dask.pack_shards`, which packs shards on many machines, and
    `join`. A shard is opened when it is first needed, so that a list of
    thousands of shards opens in milliseconds. `FileNotFoundError` then names a
    shard that is missing, and `ValueError` one that is not the manifest's.

    >>> folder = getfixture("tmp_path")
    >>> for name, paths in ("a.tessel", ["x", "y"]), ("b.tessel", ["z"]):
    ...     shard = PathList.pack(paths, folder / name)
    >>> files = [folder / "a.tessel", folder / "b.tessel"]
    >>> paths = ShardedPathList.join(files, folder / "both.json")
    >>> list(paths), paths[2], paths.numbers(["z", "x"])
    (['x', 'y', 'z'], 'z', array([2, 0]))
    """

    __slots__ = ()

    _paths: ShardedSequence  # type: ignore[assignment]  # it has the same methods

    # ---- Making lists ----

    @overload
    @classmethod
    def open(
        cls, file: Path, *, as_bytes: Literal[False] = ...
    ) -> ShardedPathList[str]: ...
    @overload
    @classmethod
    def open(cls, file: Path, *, as_bytes: Literal[True]) -> ShardedPathList[bytes]: ...
    @overload
    @classmethod
    def open(cls, file: Path, *, as_bytes: bool) -> ShardedPathList[Any]: ...

    @classmethod
    def open(cls, file: Path, *, as_bytes: bool = False) -> ShardedPathList[Any]:
        """Open a manifest. Reads no shard.

        Raises `ValueError` for a file that is no manifest.
        """
        shards = Shards(os.path.abspath(os.fsdecode(file)))
        return cls._made(ShardedSequence(shards, _core.View(shards.count)), as_bytes)

    @classmethod
    def join(
        cls, shards: Iterable[Path], manifest: Path, *, as_bytes: bool = False
    ) -> ShardedPathList[Any]:
        """Write a manifest of archives, in this order, and open it.

        shards    archives in the manifest's folder
        manifest  the file to write, which is replaced as a whole

        Opens each of them to read how many paths it has.
        """
        if isinstance(shards, (str, bytes, os.PathLike)):
            raise TypeError("expected many shards; put the one into a list")
        file = os.path.abspath(os.fsdecode(manifest))
        facts = []
        for shard in shards:
            folder, name = os.path.split(os.path.abspath(os.fsdecode(shard)))
            if folder != os.path.dirname(file):
                raise ValueError(f"{shard!r} is not in the folder of {file!r}")
            if name == os.path.basename(file):
                raise ValueError(f"{shard!r} would be replaced by the manifest")
            paths = _core.PathSequence(_core.open(full_name(shard)))
            facts.append((name, Facts.of(paths)))
        write_manifest(file, facts)
        return cls.open(file, as_bytes=as_bytes)

    def on(self, client: Any) -> ShardedPathList[AnyStr]:
        """Return the same list, searched elsewhere.

        `find`, `numbers`, `folders`, `index`, `count` and `in` ask each shard
        by itself; the list that is returned, and its views, let the client's
        workers do that. They have to see the shards under the same paths.

        client  a `distributed.Client` or an executor of `concurrent.futures`;
                None for threads of this process, as at first

        >>> from concurrent.futures import ProcessPoolExecutor
        >>> folder = getfixture("tmp_path")
        >>> shard = PathList.pack(["a/x", "b/x"], folder / "1.tessel")
        >>> paths = ShardedPathList.join([folder / "1.tessel"], folder / "all.json")
        >>> with ProcessPoolExecutor(2) as processes:
        ...     paths.on(processes).find("b/")
        array([1])
        """
        mine = self._paths
        return self._made(
            ShardedSequence(mine.shards, mine.view, client), self._as_bytes
        )

    @classmethod
    def pack(cls, *source: object, **options: object) -> NoReturn:
        """Not for shards: pack them one by one and `join` them."""
        raise TypeError("pack each shard by PathList.pack and join() them")

    def save(self, file: Path, **options: Any) -> PathList[AnyStr]:
        """Write these paths as one archive, and open it; as `PathList.save`."""
        return PathList.pack(self, file, as_bytes=self._as_bytes, **options)

    def append(self, paths: Iterable[Path], **options: Any) -> NoReturn:
        """Not for shards: a list gets longer by another shard; see `join`."""
        raise ValueError("cannot append to shards; pack one more and join() them")

    # ---- Facts ----

    @property
    def file(self) -> str:
        """The manifest's file."""
        return self._paths.shards.manifest

    @property
    def nbytes(self) -> int:
        """Bytes of all shards, as the manifest says."""
        return sum(shard.facts.nbytes for shard in self._paths.shards.shards)

    def __sizeof__(self) -> int:
        """Bytes in this process's memory, without what all views share."""
        return object.__sizeof__(self) + self._paths.view.heap_bytes

    # ---- Copies ----

    def __reduce_ex__(self, protocol: SupportsIndex) -> tuple[Any, ...]:
        shards, steps = self._paths.shards, self._paths.steps()
        where = (shards.manifest, shards.digest)
        return _reopened, (type(self), where, steps, self._as_bytes)

    # ---- Helpers ----

    @classmethod
    def _made(cls, paths: ShardedSequence, as_bytes: bool) -> ShardedPathList[Any]:
        return cls._over(paths, as_bytes)  # type: ignore[arg-type, return-value]


def _reopened(
    cls: type[ShardedPathList[Any]],
    where: tuple[str, str],
    steps: list[tuple[Any, ...]],
    as_bytes: bool,
) -> ShardedPathList[Any]:
    manifest, digest = where
    shards = Shards(manifest)
    if shards.digest != digest:
        raise ValueError(
            f"{manifest!r} is not the manifest that was pickled: "
            "it has other contents; pickle the list again"
        )
    view = with_steps(_core.View(shards.count), steps)
    return cls._made(ShardedSequence(shards, view), as_bytes)
