"""Very large lists of paths, kept small.

>>> from qztessel import PathList
>>> paths = PathList.pack(["usr/bin/env", "usr/bin/vi", "etc/hosts"])
>>> len(paths), paths[-1]
(3, 'etc/hosts')
>>> list(paths.shuffled(seed=1)[:2])
['usr/bin/vi', 'usr/bin/env']
"""

from ._core import DamagedArchiveError
from ._path_list import PathList

__all__ = ["DamagedArchiveError", "PathList"]
