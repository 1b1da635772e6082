"""Very large lists of paths, kept small.

>>> from qztessel import PathList
>>> paths = PathList.pack(["usr/bin/env", "usr/bin/vi", "etc/hosts"])
>>> len(paths), paths[-1]
(3, 'etc/hosts')
>>> list(paths.shuffled(seed=1)[:2])
['usr/bin/vi', 'usr/bin/env']

`PathList` is a sequence over an archive, `ShardedPathList` one over many;
`HuffmanPaths` is the plug-in's class.
"""

from ._core import DamagedArchiveError
from ._huffman_paths import HostError, HuffmanPaths
from ._path_list import PathList
from ._plugin import load_plugin
from ._sharded_path_list import ShardedPathList

__all__ = [
    "DamagedArchiveError",
    "HostError",
    "HuffmanPaths",
    "PathList",
    "ShardedPathList",
    "load_plugin",
]
