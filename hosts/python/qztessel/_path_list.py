"""The class PathList; the package's users import it from `qztessel`."""

from __future__ import annotations

import operator
import os
import pickle
import warnings
from collections.abc import Callable, Iterable, Iterator, Sequence
from typing import (
    TYPE_CHECKING,
    Any,
    AnyStr,
    Literal,
    SupportsIndex,
    TypeVar,
    Union,
    overload,
)

import numpy as np

from . import _core

if TYPE_CHECKING:  # only for annotations: importing it takes half a megabyte
    import numpy.typing as npt

Path = Union[str, bytes, "os.PathLike[str]", "os.PathLike[bytes]"]
Progress = Callable[[int, int], object]
_Viewed = TypeVar("_Viewed", _core.PathSequence, _core.View)

# Paths that iteration fetches at a time: few at first, for those who want only
# a few. Shuffled lists are read the faster, the more are fetched together.
_FIRST_BLOCK = 64
_LAST_BLOCK = 16384


class PathList(Sequence[AnyStr]):
    """A list of paths in an archive, in a file or in memory.

    A list in a file is mapped: all processes that open it share one copy, and
    none of them copies it by reading. A list never changes. Slices and the
    results of `shuffled`, `split`, `sample` and `select` are lists, too, which
    read the same archive. Only `select` takes memory: 8 bytes per index.

    >>> paths = PathList.pack(["a/x", "a/y", "b/x", "b/y"])
    >>> paths[1], paths[-1], "b/x" in paths, len(paths)
    ('a/y', 'b/y', True, 4)
    >>> list(paths[::-2])
    ['b/y', 'a/y']

    Paths are `str`; bytes in them that are not UTF-8 are lone surrogates, as
    `os.fsdecode` gives them. With `as_bytes=True`, they are `bytes`. Whatever
    takes a path takes `str`, `bytes` or `os.PathLike`.

    Threads may share a list; processes get it by fork or by pickling. Every
    method that reads raises `DamagedArchiveError` where the archive is
    damaged, and `OSError` for what the system refuses.
    """

    __slots__ = ("_as_bytes", "_paths")

    _as_bytes: bool
    _paths: _core.PathSequence

    # ---- Making lists ----

    def __init__(self, *source: object) -> None:
        raise TypeError(f"use {type(self).__name__}.open or PathList.pack")

    @overload
    @classmethod
    def open(cls, file: Path, *, as_bytes: Literal[False] = ...) -> PathList[str]: ...
    @overload
    @classmethod
    def open(cls, file: Path, *, as_bytes: Literal[True]) -> PathList[bytes]: ...
    @overload
    @classmethod
    def open(cls, file: Path, *, as_bytes: bool) -> PathList[Any]: ...

    @classmethod
    def open(cls, file: Path, *, as_bytes: bool = False) -> PathList[Any]:
        """Open an archive by mapping its file, which takes a millisecond.

        If the file is cut or written anew while it is open, reading raises
        `DamagedArchiveError`. Do not write into its middle; `pack`, `save` and
        `append` replace files as a whole, and this list keeps the old one.

        >>> PathList.open("missing.tessel")
        Traceback (most recent call last):
        FileNotFoundError: [Errno 2] No such file or directory: ...
        """
        stored = _core.open(full_name(file))
        return cls._over(_core.PathSequence(stored), as_bytes)

    @overload
    @classmethod
    def pack(
        cls,
        source: Path | Iterable[Path],
        file: Path | None = ...,
        *,
        level: Literal["fast", "normal", "best"] = ...,
        index: bool = ...,
        progress: Progress | None = ...,
        as_bytes: Literal[False] = ...,
    ) -> PathList[str]: ...
    @overload
    @classmethod
    def pack(
        cls,
        source: Path | Iterable[Path],
        file: Path | None = ...,
        *,
        level: Literal["fast", "normal", "best"] = ...,
        index: bool = ...,
        progress: Progress | None = ...,
        as_bytes: Literal[True],
    ) -> PathList[bytes]: ...
    @overload
    @classmethod
    def pack(
        cls,
        source: Path | Iterable[Path],
        file: Path | None = ...,
        *,
        level: Literal["fast", "normal", "best"] = ...,
        index: bool = ...,
        progress: Progress | None = ...,
        as_bytes: bool,
    ) -> PathList[Any]: ...

    @classmethod
    def pack(
        cls,
        source: Path | Iterable[Path],
        file: Path | None = None,
        *,
        level: Literal["fast", "normal", "best"] = "normal",
        index: bool = False,
        progress: Progress | None = None,
        as_bytes: bool = False,
    ) -> PathList[Any]:
        """Pack paths into an archive and open it.

        source    paths; or the name of a list file with one path per line (or
                  separated by NUL), or of an archive; or the name of a folder,
                  for all files below it
        file      the archive to write, which is replaced as a whole at the
                  end; without it, the archive is in memory
        level     "fast" takes two thirds of the time, and 6 % more room;
                  "best" four times the time, and 3 % less room
        index     makes `index`, `numbers` and `in` take microseconds in a list
                  that is not sorted, too, instead of a scan; takes 2 to 3 bytes
                  per path there, and nothing in a sorted list
        progress  called with the paths packed and the paths read so far,
                  some twenty times per second, and at last when the archive is
                  in its place

        Takes 0.6 to 1.2 microseconds per path on one core and uses all cores.
        Raises `ValueError`, with the position, for a path that is empty, holds
        a NUL or has a name or folder of over 1 MiB; `TypeError` for what is no
        path. After an exception, `file` is the old one, or the new one if the
        exception came in the last moment, as Ctrl-C may; it is always whole.

        >>> PathList.pack(["a", ""])
        Traceback (most recent call last):
        ValueError: path 1 is empty
        """
        packer = _core.Packer(
            _target(file), known_level(level), index, known_callable(progress)
        )
        _add(packer, source)
        return cls._over(_core.PathSequence(packer.finish()), as_bytes)

    def save(
        self,
        file: Path,
        *,
        level: Literal["fast", "normal", "best"] = "normal",
        index: bool = False,
        progress: Progress | None = None,
    ) -> PathList[AnyStr]:
        """Write these paths as an archive, and open it.

        The options are those of `pack`.

        >>> folder = getfixture("tmp_path")
        >>> paths = PathList.pack(["a", "b", "c"])[:2].save(folder / "ab.tessel")
        >>> list(PathList.open(folder / "ab.tessel")) == list(paths)
        True
        """
        packer = _core.Packer(
            _target(file), known_level(level), index, known_callable(progress)
        )
        packer.add_sequence(self._paths)
        return self._like(_core.PathSequence(packer.finish()))

    def append(
        self, paths: Iterable[Path], *, progress: Progress | None = None
    ) -> PathList[AnyStr]:
        """Add paths to the archive, and return the longer list.

        This list stays what it is. If its archive is in a file, that file is
        replaced by a longer one; lists that are open keep the old one, and can
        no longer be appended to: go on with the list that is returned. What is
        added gets an index if the list has one. Only whole lists can be
        appended to: save a slice or other view first.

        Raises `ValueError` if the file has other contents than this list.

        >>> paths = PathList.pack(["a", "b"])
        >>> longer = paths.append(["c"])
        >>> len(paths), len(longer)
        (2, 3)
        """
        if not self._paths.is_whole:
            raise ValueError("cannot append to a view; save() it and append to that")
        packer = _core.Packer.append_to(self._paths.stored, known_callable(progress))
        _add(packer, paths)
        return self._like(_core.PathSequence(packer.finish()))

    # ---- Sequence ----

    def __len__(self) -> int:
        return len(self._paths)

    @overload
    def __getitem__(self, index: SupportsIndex) -> AnyStr: ...
    @overload
    def __getitem__(self, index: slice) -> PathList[AnyStr]: ...

    def __getitem__(self, index: SupportsIndex | slice) -> AnyStr | PathList[AnyStr]:
        if isinstance(index, slice):
            return self._sliced(range(*index.indices(len(self._paths))))
        path: AnyStr = self._paths.at(index, self._as_bytes)
        return path

    def __iter__(self) -> Iterator[AnyStr]:
        core, as_bytes, size = self._paths, self._as_bytes, len(self._paths)
        first, block = 0, _FIRST_BLOCK
        while first < size:
            last = min(first + block, size)
            yield from core.block(first, last, as_bytes)
            first, block = last, min(2 * block, _LAST_BLOCK)

    def __reversed__(self) -> Iterator[AnyStr]:
        return iter(self[::-1])

    def __contains__(self, path: object) -> bool:
        try:
            return self._paths.contains(path)
        except (TypeError, UnicodeEncodeError):
            return False  # no path, so it is not in the list

    def index(self, path: Any, start: int = 0, stop: int | None = None) -> int:
        """Return the first index of a path, not below start, below stop.

        Takes microseconds in a list that is sorted or was packed with an index;
        otherwise it may have to scan the list. Raises `ValueError` if the path
        is not there.

        >>> PathList.pack(["a", "b", "a"]).index("a", 1)
        2
        """
        bounds = range(*slice(start, stop).indices(len(self)))
        first = self._first_index_of(path)
        if first in bounds:
            return first
        for index in self._indices_of(path) if first >= 0 else []:
            if index in bounds:
                return index
        raise ValueError(f"{path!r} is not in the list")

    def count(self, path: Any) -> int:
        """Return how many times a path is in the list; see `index`.

        >>> PathList.pack(["a", "b", "a"]).count("a")
        2
        """
        return len(self._indices_of(path))

    def __eq__(self, other: object) -> bool:
        """Whether the other is a PathList of the same paths in the same order."""
        if not isinstance(other, PathList):
            return NotImplemented
        if self._as_bytes != other._as_bytes:
            return len(self) == len(other) == 0
        return self._paths.equals(other._paths)

    __hash__ = None  # type: ignore[assignment]  # it would have to read all paths

    # ---- Views ----

    def shuffled(self, seed: int) -> PathList[AnyStr]:
        """Return these paths in an order that looks random.

        The order depends on the length and the seed alone, and is the same on
        every machine. It is computed per index (a Feistel network with cycle
        walking), so that it takes no memory.

        seed  from 0 to 2**64 - 1

        >>> list(PathList.pack(list("abcdef")).shuffled(2))
        ['d', 'f', 'b', 'a', 'e', 'c']
        """
        key = operator.index(seed)
        if not 0 <= key < 2**64:
            raise ValueError(f"seed {seed} is not from 0 to 2**64 - 1")
        return self._like(self._paths.shuffled(key))

    def split(self, shards: int) -> list[PathList[AnyStr]]:
        """Divide the list into consecutive lists of nearly equal length.

        The first ones have one path more if the length is no multiple.

        >>> [list(shard) for shard in PathList.pack(list("abcde")).split(2)]
        [['a', 'b', 'c'], ['d', 'e']]
        """
        if shards < 1:
            raise ValueError(f"cannot split into {shards} lists")
        each, more = divmod(len(self), shards)
        starts = [i * each + min(i, more) for i in range(shards + 1)]
        return [self[a:b] for a, b in zip(starts, starts[1:])]

    def sample(self, count: int, seed: int) -> PathList[AnyStr]:
        """Return this many of these paths, drawn without repeats.

        The same as `shuffled(seed)[:count]`.

        >>> list(PathList.pack(list("abcdef")).sample(2, seed=2))
        ['d', 'f']
        """
        if not 0 <= count <= len(self):
            raise ValueError(f"cannot draw {count} of {len(self)} paths")
        return self.shuffled(seed)[:count]

    def select(self, indices: npt.ArrayLike) -> PathList[AnyStr]:
        """Return the paths at these indices, in this order.

        Keeps a copy of the indices, 8 bytes each. Raises `IndexError`.

        >>> list(PathList.pack(list("abcdef")).select([5, 0, -2]))
        ['f', 'a', 'e']
        """
        return self._like(self._paths.select(_integers(indices, len(self))))

    # ---- In bulk ----

    # These use all cores, let other threads run, and end on Ctrl-C.

    @overload
    def take(self, indices: npt.ArrayLike) -> list[AnyStr]: ...
    @overload
    def take(
        self, indices: npt.ArrayLike, *, as_array: Literal["S", "U", "O"]
    ) -> npt.NDArray[Any]: ...

    def take(
        self,
        indices: npt.ArrayLike,
        *,
        as_array: Literal["S", "U", "O"] | None = None,
    ) -> list[AnyStr] | npt.NDArray[Any]:
        """Return the paths at these indices, in this order.

        as_array  None for a list; "S" for a NumPy array of bytes, "U" of text,
                  both as wide as the longest path; "O" of Python's own objects

        Takes less than 1.5 microseconds per path in a list of millions.
        Raises `IndexError`, and `TypeError` for indices that are no integers.

        >>> paths = PathList.pack(["usr/bin/env", "etc/hosts", "usr/bin/vi"])
        >>> paths.take([2, 0])
        ['usr/bin/vi', 'usr/bin/env']
        >>> paths.take([-1], as_array="S")
        array([b'usr/bin/vi'], dtype='|S10')
        """
        if as_array not in (None, "S", "U", "O"):
            raise ValueError(f"as_array {as_array!r} is none of 'S', 'U', 'O'")
        numbers = _integers(indices, len(self))
        if as_array in ("S", "U"):
            return self._paths.take_array(numbers, as_array == "S")
        taken = self._paths.take_list(numbers, self._as_bytes)
        if as_array is None:
            return taken
        array = np.empty(len(taken), dtype=object)
        array[:] = taken
        return array

    def numbers(self, paths: Iterable[Path]) -> npt.NDArray[np.int64]:
        """Return the first index of each path, or -1 if it is not in the list.

        >>> PathList.pack(["a", "b", "a"]).numbers(["b", "a", "c"])
        array([ 1,  0, -1])
        """
        if isinstance(paths, (str, bytes, os.PathLike)):
            raise TypeError("expected many paths; put the one into a list")
        return self._paths.numbers(iter(paths))

    def find(
        self,
        *texts: str | bytes,
        glob: str | bytes | None = None,
        regex: str | bytes | None = None,
        folder: Path | None = None,
        ignore_case: bool = False,
    ) -> npt.NDArray[np.int64]:
        """Return the indices of all paths that match everything given.

        texts        each of them is anywhere in the path
        glob         a shell pattern for the whole path, or for its last
                     component if the pattern has no '/'; '*' matches '/', too
        regex        a regular expression of RE2, which is anywhere in the path
        folder       the path is below this folder, at any depth
        ignore_case  of glob or regex

        Raises `ValueError` for an expression that is wrong.

        >>> paths = PathList.pack(["usr/bin/env", "etc/hosts", "usr/bin/vi"])
        >>> paths.find("bin", "v")
        array([0, 2])
        >>> paths.take(paths.find(glob="V?", ignore_case=True, folder="usr"))
        ['usr/bin/vi']
        >>> paths.find(regex="^etc/|env$")
        array([0, 1])
        """
        return self._paths.find(
            [os.fsencode(text) for text in texts],
            _pattern(glob, regex),
            None if folder is None else os.fsencode(folder),
            ignore_case,
        )

    def folders(self) -> list[AnyStr]:
        """Return the different folders that paths are in, in byte order.

        A path's folder is what is before its last '/': '' without one, and '/'
        if that is the first character. Reads the whole list.

        >>> PathList.pack(["usr/bin/env", "x", "usr/bin/vi", "/y"]).folders()
        ['', '/', 'usr/bin']
        """
        return self._paths.folders(self._as_bytes)

    # ---- Facts ----

    @property
    def file(self) -> str | None:
        """The archive's file, or None if it is in memory."""
        file = self._paths.stored.file
        return os.fsdecode(file) if file else None

    @property
    def as_bytes(self) -> bool:
        """Whether paths are `bytes`."""
        return self._as_bytes

    @property
    def nbytes(self) -> int:
        """Bytes of the archive, whether it is mapped or in memory."""
        return self._paths.stored.nbytes

    def __sizeof__(self) -> int:
        """Bytes in this process's memory; a mapped file takes none of them."""
        stored = self._paths.stored
        own = object.__sizeof__(self) + self._paths.heap_bytes
        return own if stored.file else own + stored.nbytes

    def __repr__(self) -> str:
        size = len(self)
        where = self._origin() + "".join(map(_described, self._paths.steps()))
        number = "1 path" if size == 1 else f"{size} paths"
        try:
            shown = f"[{', '.join(self._outermost())}]"
        except (OSError, ValueError) as error:  # who looks at a list wants no error
            shown = f"cannot be read, {error}"
        return f"<{type(self).__name__} of {number} from {where}: {shown}>"

    # ---- Copies ----

    def __copy__(self) -> PathList[AnyStr]:
        return self

    def __deepcopy__(self, memo: object) -> PathList[AnyStr]:
        return self

    def __reduce_ex__(self, protocol: SupportsIndex) -> tuple[Any, ...]:
        stored, steps = self._paths.stored, self._paths.steps()
        if stored.file:
            where = (stored.file, stored.nbytes, stored.sum)
            return _reopened, (type(self), where, steps, self._as_bytes)
        data: object = memoryview(stored)  # type: ignore[arg-type]
        data = pickle.PickleBuffer(data) if int(protocol) >= 5 else bytes(data)  # type: ignore
        return _rebuilt, (type(self), data, steps, self._as_bytes)

    # ---- Helpers ----

    def _outermost(self) -> list[str]:
        size = len(self)
        paths = [repr(self[i]) for i in range(min(size, 2))]
        if size > 3:
            paths.append("...")
        if size > 2:
            paths.append(repr(self[-1]))
        return paths

    @classmethod
    def _over(cls, core: _core.PathSequence, as_bytes: bool) -> PathList[Any]:
        made: PathList[Any] = cls.__new__(cls)
        made._paths = core
        made._as_bytes = as_bytes
        return made

    def _like(self, core: _core.PathSequence) -> PathList[AnyStr]:
        return type(self)._over(core, self._as_bytes)

    def _sliced(self, indices: range) -> PathList[AnyStr]:
        count = len(indices)
        step = indices.step if count > 1 else 1  # it may be huge
        return self._like(self._paths.slice(indices.start if count else 0, step, count))

    def _first_index_of(self, path: Any) -> int:
        try:
            return int(self.numbers([path])[0])
        except (TypeError, UnicodeEncodeError):
            return -1

    def _indices_of(self, path: object) -> list[int]:
        try:
            return self._paths.indices_of(path)
        except (TypeError, UnicodeEncodeError):
            return []

    def _origin(self) -> str:
        file = self.file
        return "memory" if file is None else repr(file)


def _target(file: Path | None) -> bytes:
    return b"" if file is None else full_name(file)


def full_name(file: Path) -> bytes:
    """A file's absolute name; the system would take one with NUL as a shorter."""
    name = os.fsencode(file)
    if b"\0" in name:
        raise ValueError(f"the file name {file!r} holds a NUL")
    return os.path.abspath(name)


def known_callable(progress: Progress | None) -> Progress | None:
    """The progress, or a `TypeError`."""
    if progress is not None and not callable(progress):
        raise TypeError(f"progress {progress!r} cannot be called")
    return progress


def known_level(level: str) -> _core.Level:
    """The level of that name, or a `ValueError`."""
    if level not in ("fast", "normal", "best"):
        raise ValueError(f"level {level!r} is none of 'fast', 'normal', 'best'")
    chosen: _core.Level = getattr(_core.Level, level)
    return chosen


def _add(packer: _core.Packer, source: Path | Iterable[Path]) -> None:
    if isinstance(source, PathList) and isinstance(source._paths, _core.PathSequence):
        packer.add_sequence(source._paths)
    elif isinstance(source, (str, bytes, os.PathLike)):
        _add_named(packer, os.fsencode(source))
    else:
        packer.add_iterable(iter(source))


def _add_named(packer: _core.Packer, name: bytes) -> None:
    if not os.path.isdir(name):
        os.stat(os.fsdecode(name))
        return packer.add_list_file(name)
    skipped, first, reason = packer.add_folder(name)
    if skipped:
        warnings.warn(
            f"left out {skipped} folders that cannot be read, "
            f"first {os.fsdecode(first)!r}: {reason}",
            stacklevel=4,
        )


def _is_integer(value: object) -> bool:
    return isinstance(value, (int, np.integer)) and not isinstance(value, bool)


def _integers(numbers: npt.ArrayLike, size: int) -> npt.NDArray[np.int64]:
    array = np.asarray(numbers)
    if array.ndim != 1:
        raise ValueError(f"expected one dimension of indices, not {array.ndim}")
    # Integers that have no type of 64 bits in common become objects or floats.
    exact = array
    if array.dtype.kind == "f" and not isinstance(numbers, np.ndarray):
        exact = np.asarray(numbers, dtype=object)
    if array.size and exact.dtype.kind == "O" and all(map(_is_integer, exact)):
        farthest = max(exact, key=abs)
        if not -size <= farthest < size:
            raise IndexError(f"list index {farthest} is out of range for {size} paths")
        array = exact.astype(np.int64)
    if array.dtype.kind not in "iu" and array.size:
        raise TypeError(f"expected integers as indices, not {array.dtype}")
    if array.dtype.kind == "u" and array.size and array.max() >= size:
        raise IndexError(f"list index {array.max()} is out of range for {size} paths")
    return np.ascontiguousarray(array, dtype=np.int64)


def _pattern(
    glob: str | bytes | None, regex: str | bytes | None
) -> tuple[str, bytes] | None:
    if glob is not None and regex is not None:
        raise ValueError("glob and regex exclude each other")
    if glob is not None:
        return "glob", os.fsencode(glob)
    return None if regex is None else ("regex", os.fsencode(regex))


def _described(step: tuple[Any, ...]) -> str:
    kind, *values = step
    if kind == "shuffled":
        return f".shuffled({values[0]})"
    if kind == "select":
        return f".select({len(values[0])} indices)"
    first, stride, count = values
    end = first + stride * count
    bounds = f"{first}:{'' if end < 0 else end}"
    return f"[{bounds}]" if stride == 1 else f"[{bounds}:{stride}]"


def with_steps(core: _Viewed, steps: list[tuple[Any, ...]]) -> _Viewed:
    """Take the views that `steps` returned of a core class's object."""
    for kind, *values in steps:
        core = getattr(core, kind)(*values)
    return core


def _reopened(
    cls: type[PathList[Any]],
    where: tuple[bytes, int, int],
    steps: list[tuple[Any, ...]],
    as_bytes: bool,
) -> PathList[Any]:
    file, size, checksum = where
    stored = _core.open(file)
    if (stored.nbytes, stored.sum) != (size, checksum):
        raise ValueError(
            f"{os.fsdecode(file)!r} is not the file that was pickled: "
            "it has other contents; pickle the list again"
        )
    return cls._over(with_steps(_core.PathSequence(stored), steps), as_bytes)


def _rebuilt(
    cls: type[PathList[Any]],
    data: object,
    steps: list[tuple[Any, ...]],
    as_bytes: bool,
) -> PathList[Any]:
    core = _core.PathSequence(_core.over(data))
    return cls._over(with_steps(core, steps), as_bytes)
