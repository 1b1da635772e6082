"""Finds and loads the plug-in libqztessel.so for `HuffmanPaths`."""

from __future__ import annotations

import os
import pathlib
import types

_VARIABLE = "QZTESSEL_PLUGIN"
_PACKAGE = pathlib.Path(__file__).resolve().parent

# The plug-in's file, once it is loaded.
_loaded: str | None = None


def load_plugin(file: str | os.PathLike[str] | None = None) -> str:
    """Load the plug-in that has the class `HuffmanPaths`; return its file.

    `HuffmanPaths` calls this when it is first used, so call it only to choose
    the file. Without `file`, the plug-in is, in this order: the file that the
    environment variable QZTESSEL_PLUGIN names; `libqztessel.so` in the
    package's own folder; what the system's loader finds by the library's name.

    A process loads one plug-in, which stays loaded. Raises `FileNotFoundError`
    if there is none, `HostError` if the file cannot be loaded, and `ValueError`
    if another file is loaded already.

    >>> load_plugin() == load_plugin()
    True
    >>> load_plugin("/none/libqztessel.so")
    Traceback (most recent call last):
    ValueError: the plug-in '...' is loaded; a process loads only one
    """
    global _loaded
    if _loaded is None:
        from . import _host

        plugin = _wanted(file) or _found()
        _host.start(plugin, _messages())
        _loaded = plugin
    elif file is not None and pathlib.Path(file).resolve() != pathlib.Path(_loaded):
        raise ValueError(f"the plug-in '{_loaded}' is loaded; a process loads only one")
    return _loaded


def host() -> types.ModuleType:
    """The module `_host`, with the plug-in loaded."""
    load_plugin()
    from . import _host

    return _host


def _wanted(file: str | os.PathLike[str] | None) -> str | None:
    """The file that the user names, if it is there."""
    named = file if file is not None else os.environ.get(_VARIABLE)
    if not named:
        return None
    path = pathlib.Path(named).resolve()
    if not path.is_file():
        source = "" if file is not None else f"; {_VARIABLE} names it"
        raise FileNotFoundError(f"there is no plug-in '{path}'{source}")
    return str(path)


def _found() -> str:
    """The plug-in of the package, or else the installed one."""
    own = _PACKAGE / "libqztessel.so"
    if own.is_file():
        return str(own)
    from . import _host

    installed = _host.installed_plugin()
    if installed is not None:
        return str(installed.resolve())
    raise FileNotFoundError(
        f"the plug-in libqztessel.so is not in '{_PACKAGE}', nor where the loader "
        f"looks; install libqztessel1, or set {_VARIABLE} to its file"
    )


def _messages() -> pathlib.Path:
    """The message catalogue: the package's own, or that of its prefix."""
    installed = (_PACKAGE / "../../../../share/qztessel/messages").resolve()
    for folder in (_PACKAGE / "messages", installed):
        if folder.is_dir():
            return folder
    raise FileNotFoundError(
        f"the plug-in's messages are neither in '{_PACKAGE / 'messages'}' nor in "
        f"'{installed}'; install libqztessel1"
    )
