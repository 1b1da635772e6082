"""The class HuffmanPaths; the package's users import it from `qztessel`."""

from __future__ import annotations

from collections.abc import Sequence
from typing import TYPE_CHECKING, Any, Union, cast, overload

import numpy as np
import numpy.typing as npt

from . import _plugin

if TYPE_CHECKING:
    from ._host import Instance

Texts = Union[Sequence[str], npt.NDArray[np.object_], npt.NDArray[np.str_]]
TextLists = Union[Sequence[Texts], npt.NDArray[np.object_]]

# Which input of a constructor's mode has numbers.
_FREQUENCIES = {"frequencies": 2, "tree": 3}


class HostError(Exception):
    """An error of the plug-in, or of the host environment around it.

    identifier  component, colon, key; `VELOX:datastoreio:huffmanpaths:...` for
                the plug-in's own errors, `VELOX:embedded:...` for the host's
    arguments   what the text was made with, `str` or `int`

    An exception that the plug-in lets through has the identifier
    `VELOX:embedded:nativeError`; its text is the last argument.
    """

    __module__ = "qztessel"

    def __init__(
        self, text: str, identifier: str = "", arguments: tuple[str | int, ...] = ()
    ) -> None:
        super().__init__(text, identifier, arguments)
        self.identifier = identifier
        self.arguments = arguments

    def __str__(self) -> str:
        return cast(str, self.args[0])


class HuffmanPaths:
    """The plug-in's class of growing lists of paths, in a host in this process.

    The full name of the class is
    `velox.io.datastore.internal.fileset.HuffmanPaths`. A path has a folder,
    which is a list of components, and the name of a file. The first component
    is a root with its own separator, such as "/". A code is made first, for
    all characters of all paths; then paths are added. They are numbered from 1
    in the order of addition.

    >>> folders, files = [["/", "etc"], ["/", "usr", "bin"]], [["hosts"], ["env", "vi"]]
    >>> paths = HuffmanPaths("files", folders + files)
    >>> paths.add_paths(folders, files)
    >>> paths.get_paths([1, 3], "/")
    ['/etc/hosts', '/usr/bin/vi']

    A text is a `str`, kept as UTF-16: surrogates that are no pair stay as they
    are, such as those with which `os.fsdecode` shows bytes that are not UTF-8.
    Lists of texts may also be tuples or arrays of objects or of `str`.
    A path must not be the folder of another path, or it is lost.

    `copy.copy` makes a copy that shares its paths with its source: passes of
    both give what is added later to either. Numbers, and the position of a
    pass, are each one's own. `pickle` and `copy.deepcopy` save and load: what
    they make shares nothing, and needs `reset` before a pass.

    Threads may share instances; their calls wait for each other, while other
    threads run. Ctrl-C ends the conversion of values, but a call of the
    plug-in runs to its end first.

    A value that has no form in the host raises `TypeError`. `HostError` is
    raised for all that the plug-in or the host refuses. The first use of the
    class loads the plug-in; see `load_plugin` for where it is found.
    """

    __slots__ = ("_instance", "__weakref__")

    _instance: Instance

    def __init__(self, *inputs: object) -> None:
        """Make an instance; the first input is a word for what it has.

        HuffmanPaths("files", list)
            a code for these texts: folders, each a text or a list of
            components, then as many lists of files. No path is added.
        HuffmanPaths("frequencies", characters, frequencies)
            a code for these characters, in UTF-16 code units, with a frequency
            for each. A frequent character has a short code.
        HuffmanPaths("tree", string, stored, frequencies)
            what `serialize` answered, with the property `frequencies`. With an
            empty string only the frequencies are set.
        HuffmanPaths("copy", other)
            like `copy.copy`

        Any other word or number of inputs, up to four, makes an empty
        instance. It has no code, so that no path can be added.

        >>> HuffmanPaths("files", ["/etc", ["hosts"], ["one too many"]])
        Traceback (most recent call last):
        qztessel.HostError: The list of folders and files must ...
        """
        self._instance = _plugin.host().construct(_for_host(inputs))

    # ---- Adding ----

    def add_paths(self, folders: TextLists, files: TextLists) -> None:
        """Add paths; the plug-in's method "addPaths".

        folders  per folder the list of its components, the root first
        files    per folder the list of the names of its files

        All is checked before anything is added: `HostError` with the key
        `unequalNumFolderFileList`, `folderElementEmpty` or `fileElementEmpty`,
        the latter two with the position, counted from 1. A character without a
        code is a `HostError`, too, and nothing is added.

        Takes about half a microsecond per path.

        >>> paths = HuffmanPaths("frequencies", "/abc", [1, 2, 2, 2])
        >>> paths.add_paths([["/", "a"]], [["b", ""]])
        Traceback (most recent call last):
        qztessel.HostError: Element 1, 2 of the files is empty.
        """
        self._instance.call("addPaths", 0, (folders, files))

    # ---- Getting paths back ----

    @overload
    def get_paths(
        self, numbers: npt.ArrayLike, separator: None = ...
    ) -> tuple[list[list[str]], list[list[str]]]: ...
    @overload
    def get_paths(
        self, numbers: npt.ArrayLike, separator: str
    ) -> list[str | None]: ...

    def get_paths(
        self, numbers: npt.ArrayLike, separator: str | None = None
    ) -> list[str | None] | tuple[list[list[str]], list[list[str]]]:
        """Get paths by their numbers; the plug-in's method "getPaths".

        numbers    from 1, in ascending order; fractions are cut off. The first
                   one beyond the last path ends the answer. A number smaller
                   than the one before is looked up among the files of that
                   one's folder.
        separator  joins the components of a folder, and folder and file; the
                   root has its own

        With a separator, returns one text per number; the last are None if the
        answer ended early. Without, returns two lists, of folders and of files:
        per folder met, the list of its components, and the names of those of
        its files that were asked for.

        >>> paths = HuffmanPaths("frequencies", "/abc", [1, 2, 2, 2])
        >>> paths.add_paths([["/", "a"], ["/", "b"]], [["a", "b"], ["c"]])
        >>> paths.get_paths([1, 2, 3, 4], "/")
        ['/a/a', '/a/b', '/b/c', None]
        >>> paths.get_paths([2, 3])
        ([['/', 'a'], ['/', 'b']], [['b'], ['c']])
        """
        wanted = np.asarray(numbers, dtype=np.float64)
        if separator is None:
            folders, files = self._instance.call("getPaths", 2, (wanted,))
            return folders, files
        (paths,) = self._instance.call("getPaths", 1, (wanted, separator))
        return cast("list[str | None]", paths)

    def get_next_path(self) -> list[str]:
        """Get the components of the next path; the plug-in's "getNextPath".

        One pass gives every path once, the files of a folder together. Call
        `reset` before a pass, and again after `add_paths`. Raises `HostError`
        after the last path, and before the first `reset`.

        >>> paths = HuffmanPaths("frequencies", "/abc", [1, 2, 2, 2])
        >>> paths.add_paths([["/", "a"]], [["b", "c"]])
        >>> paths.reset()
        >>> while paths.has_next_path():
        ...     print(paths.get_next_path())
        ['/', 'a', 'b']
        ['/', 'a', 'c']
        """
        (path,) = self._instance.call("getNextPath", 1, ())
        return cast("list[str]", path)

    def has_next_path(self) -> bool:
        """Whether a pass has another path; the plug-in's "hasNextPath"."""
        (answer,) = self._instance.call("hasNextPath", 1, ())
        return cast(bool, answer)

    def reset(self) -> None:
        """Go before the first path; the plug-in's method "reset"."""
        self._instance.call("reset", 0, ())

    # ---- The stored form ----

    def serialize(self) -> tuple[str, npt.NDArray[np.uint8]]:
        """Store code and paths; the plug-in's method "serialize".

        Returns the tree string and the stored form. With the property
        `frequencies`, they make an equal instance:

        >>> paths = HuffmanPaths("frequencies", "/abc", [1, 2, 2, 2])
        >>> paths.add_paths([["/", "a"]], [["b", "c"]])
        >>> string, stored = paths.serialize()
        >>> equal = HuffmanPaths("tree", string, stored, paths.frequencies)
        >>> equal.get_paths([2], "/")
        ['/a/c']
        """
        string, stored = self._instance.call("serialize", 2, ())
        return string, stored

    @property
    def string_tree(self) -> str:
        """The tree string; the plug-in's property "StringTree"."""
        return cast(str, self._instance.get("StringTree"))

    @property
    def frequencies(self) -> npt.NDArray[np.float64]:
        """The frequencies of the characters; "Frequencies" in the plug-in."""
        return cast("npt.NDArray[np.float64]", self._instance.get("Frequencies"))

    # ---- Copies and pickles ----

    def __copy__(self) -> HuffmanPaths:
        copied = type(self).__new__(type(self))
        copied._instance = self._instance.copy()
        return copied

    def __getstate__(self) -> dict[str, Any]:
        return self._instance.save()

    def __setstate__(self, saved: dict[str, Any]) -> None:
        self._instance = _plugin.host().load(saved)


def _for_host(inputs: tuple[object, ...]) -> tuple[object, ...]:
    """The constructor's inputs with numbers as an array, and the host's own
    instance of another object."""
    mode = inputs[0] if inputs else None
    numbers = _FREQUENCIES.get(mode) if isinstance(mode, str) else None
    return tuple(
        np.asarray(value, dtype=np.float64)
        if i == numbers
        else value._instance if isinstance(value, HuffmanPaths) else value
        for i, value in enumerate(inputs)
    )
