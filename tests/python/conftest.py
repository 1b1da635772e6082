import lists
import pytest
from qztessel import PathList


@pytest.fixture(params=list(lists.ALL))
def plain(request):
    """A plain list of paths."""
    return list(lists.ALL[request.param])


@pytest.fixture(params=["memory", "file"])
def packed(request, plain, tmp_path):
    """The same as a PathList of bytes."""
    file = tmp_path / "list.tessel" if request.param == "file" else None
    return PathList.pack(plain, file, as_bytes=True)
