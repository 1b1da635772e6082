"""Copies of lists, in this process and in others."""

import concurrent.futures
import copy
import multiprocessing
import pickle
import subprocess
import sys

import lists
import pytest
from qztessel import PathList, _core


def views(packed):
    return [packed, packed[1:], packed[::-2], packed.shuffled(5)[1:], packed.select([])]


@pytest.mark.parametrize("protocol", range(pickle.HIGHEST_PROTOCOL + 1))
def test_pickle(packed, protocol):
    for view in views(packed):
        copied = pickle.loads(pickle.dumps(view, protocol))
        assert copied == view and repr(copied) == repr(view)
        assert copied.as_bytes == view.as_bytes


def test_pickle_of_a_selection(packed):
    if len(packed) > 0:
        view = packed.select([0, -1, 0])
        assert pickle.loads(pickle.dumps(view)) == view


def test_pickle_of_a_file_is_short(tmp_path):
    packed = PathList.pack(lists.tree(3000), tmp_path / "x.tessel")
    assert len(pickle.dumps(packed.shuffled(7)[10:100])) < 1000


def test_pickle_of_memory_is_out_of_band():
    packed = PathList.pack(lists.tree(3000))
    buffers = []
    data = pickle.dumps(packed, 5, buffer_callback=buffers.append)
    assert len(data) < 1000 and len(buffers) == 1
    assert buffers[0].raw().nbytes == packed.nbytes
    assert pickle.loads(data, buffers=buffers) == packed


def test_bytes_are_borrowed_and_what_can_change_is_copied():
    data = bytes(memoryview(PathList.pack(["a", "b"])._paths.stored))
    borrowed = _core.over(data)
    assert sys.getrefcount(data) == 3  # one by the list, one by the call
    changeable = bytearray(data)
    copied = _core.PathSequence(_core.over(changeable))
    changeable[:] = bytes(len(changeable))
    assert copied.block(0, 2, False) == ["a", "b"]
    del borrowed
    assert sys.getrefcount(data) == 2


def test_bytes_with_gaps_are_refused():
    data = bytes(memoryview(PathList.pack(["a"])._paths.stored))
    apart = bytes(byte for value in data for byte in (value, 0))
    for view in memoryview(apart)[::2], memoryview(data[::-1])[::-1]:
        assert bytes(view) == data
        with pytest.raises(ValueError, match="has gaps"):
            _core.over(view)


def test_a_file_is_a_buffer_of_its_bytes(tmp_path):
    file = tmp_path / "x.tessel"
    data = memoryview(PathList.pack(["a"], file)._paths.stored)
    assert data.readonly and bytes(data) == file.read_bytes()


def test_a_loaded_list_keeps_its_bytes():
    loaded = pickle.loads(pickle.dumps(PathList.pack(["a", "b"]), 5))
    again = pickle.loads(pickle.dumps(loaded, 5))
    del loaded
    assert list(again) == ["a", "b"]


def test_pickle_of_another_file(tmp_path):
    file = tmp_path / "x.tessel"
    data = pickle.dumps(PathList.pack(["a", "b"], file))
    PathList.pack(["a", "c"], file)
    with pytest.raises(ValueError, match="is not the file that was pickled"):
        pickle.loads(data)
    file.unlink()
    with pytest.raises(FileNotFoundError):
        pickle.loads(data)


def test_copies_are_the_list_itself(packed):
    assert copy.copy(packed) is packed
    assert copy.deepcopy([packed])[0] is packed


def length_and_ends(packed):
    return len(packed), packed[0], packed[-1], sum(map(len, packed))


@pytest.mark.parametrize("method", ["fork", "spawn", "forkserver"])
@pytest.mark.parametrize("where", ["memory", "file"])
def test_other_processes(method, where, tmp_path):
    file = tmp_path / "x.tessel" if where == "file" else None
    packed = PathList.pack(lists.tree(5000), file).shuffled(3)
    wanted = [length_and_ends(part) for part in packed.split(4)]
    context = multiprocessing.get_context(method)
    with context.Pool(2) as pool:
        assert pool.map(length_and_ends, packed.split(4)) == wanted


def test_threads():
    packed = PathList.pack(lists.shuffled(lists.tree(20000)))
    wanted = list(packed)

    def work(seed):
        view = packed.shuffled(seed)
        assert sorted(view) == sorted(wanted)
        assert [packed[i] for i in range(seed, 20000, 97)] == wanted[seed::97]

    with concurrent.futures.ThreadPoolExecutor(4) as threads:
        list(threads.map(work, range(8)))


@pytest.mark.parametrize(
    "call",
    [
        "paths.take(everything)",
        "paths.find(regex='9.*8')",
        "paths == paths.shuffled(1).shuffled(2)",
        "paths.shuffled(1) == paths.shuffled(1)",
        "list(paths)",
        "PathList.pack(paths)",
    ],
)
def test_the_interpreter_ends_during_calls(call):
    program = f"""
import threading, time
from qztessel import PathList
paths = PathList.pack(f"a/{{i % 97}}/{{i}}" for i in range(100_000))
everything = range(len(paths))
def work():
    while True:
        {call}
for i in range(4):
    threading.Thread(target=work, daemon=True).start()
time.sleep(0.2)
"""
    subprocess.run([sys.executable, "-c", program], check=True)
