"""The plug-in's class: its methods, its errors, and values both ways."""

import concurrent.futures
import copy
import itertools
import pickle
import random
import signal
import struct
import zlib

import numpy as np
import pytest
from qztessel import HostError, HuffmanPaths

OWN = "VELOX:datastoreio:huffmanpaths:"
HOST = "VELOX:embedded:"
LOAD_LINE = "Error while custom loading CompressedFileSet.\n"

FOLDERS = [["/", "usr", "bin"], ["/"], ["/", "usr"]]
FILES = [["env", "vi"], ["vmlinuz"], ["README", "x"]]
PATHS = ["/usr/bin/env", "/usr/bin/vi", "/vmlinuz", "/usr/README", "/usr/x"]
COMPONENTS = [
    [*folder, name]
    for folder, names in zip(FOLDERS, FILES, strict=True)
    for name in names
]

# Of one, two and three bytes in UTF-8; a pair; halves of pairs; a byte that is
# not UTF-8 as os.fsdecode shows it; what separates and ends texts elsewhere.
CHARACTERS = [*"az. \n\\\t\0", "é", "☃", "\uffff", "\U0001f600", "\ud800", "\udcff"]


def filled(folders=FOLDERS, files=FILES):
    paths = HuffmanPaths("files", folders + files)
    paths.add_paths(folders, files)
    return paths


def iterated(paths):
    found = []
    paths.reset()
    while paths.has_next_path():
        found.append(paths.get_next_path())
    return found


def all_of(paths):
    """Paths by number, up to the first number that there is not."""
    found = []
    while (path := paths.get_paths([len(found) + 1], "/")[0]) is not None:
        found.append(path)
    return found


def call(paths, method, outputs, *inputs):
    """A method with any numbers of inputs and outputs, as the host has it."""
    return paths._instance.call(method, outputs, inputs)


def assert_error(caught, identifier, *arguments):
    error = caught.value
    assert (error.identifier, error.arguments) == (identifier, arguments)
    assert len(str(error).splitlines()) == 1


def random_listing(seed):
    """Folders and files of names with all sorts of characters."""
    chance = random.Random(seed)

    def name(first):
        # A letter after each keeps halves of pairs apart.
        units = [chance.choice(CHARACTERS) + "b" for _ in range(chance.randint(0, 6))]
        return first + "".join(units)

    folders = [
        ["/", *(name("d") for _ in range(chance.randint(0, 4)))] for _ in range(30)
    ]
    files = [
        [f"{i}{name('f')}" for i in range(chance.randint(1, 20))] for _ in folders
    ]
    return folders, files


# ---- The constructor ----


@pytest.mark.parametrize(
    "inputs",
    [
        (),
        ("files",),
        ("copy",),
        ("unknown", [["/"], ["a"]]),
        ("Files", [["/"], ["a"]]),
        ("frequencies", "ab"),
        ("tree", "ab", b""),
        ("files", [["/"], ["a"]], 3),
    ],
)
def test_other_inputs_make_an_empty_instance(inputs):
    paths = HuffmanPaths(*inputs)
    assert paths.string_tree == ""
    assert paths.frequencies.dtype == np.float64
    assert paths.frequencies.shape == (0,)
    assert not paths.has_next_path()
    assert all_of(paths) == iterated(paths) == []
    with pytest.raises(HostError, match="Code for the character not found"):
        paths.add_paths([["/"]], [["a"]])


def test_inputs_that_the_host_refuses():
    with pytest.raises(HostError) as caught:
        HuffmanPaths("tree", "ab", b"", [1], 5)
    assert_error(caught, HOST + "tooManyInputs")
    with pytest.raises(HostError) as caught:
        HuffmanPaths(3)
    assert_error(caught, HOST + "wrongType", "createFrom", "char", "double")


def test_files_counts_folders_as_texts_or_as_components():
    texts = HuffmanPaths("files", ["/aab", "/c", ["d"], ["dd", "e"]])
    components = HuffmanPaths(
        "files", [["/", "aab"], ["/", "c"], ["d"], ["dd", "e"]]
    )
    assert sorted(texts.frequencies) == [1, 1, 1, 2, 2, 3]
    assert np.array_equal(texts.frequencies, components.frequencies)
    assert texts.string_tree == components.string_tree
    assert all_of(texts) == []


def test_files_with_an_odd_number_of_elements():
    with pytest.raises(HostError, match="even number") as caught:
        HuffmanPaths("files", [["/"], ["a"], ["b"]])
    assert_error(caught, OWN + "fileListNotEven")


def test_files_of_an_empty_list_makes_no_code():
    assert HuffmanPaths("files", []).string_tree == ""


@pytest.mark.parametrize(
    "frequencies",
    [[5, 2, 1], (5.0, 2.0, 1.0), np.array([5, 2, 1]), [5, 2, 1, 100]],
)
def test_frequencies(frequencies):
    paths = HuffmanPaths("frequencies", "/ab", frequencies)
    assert sorted(paths.frequencies) == [1, 2, 5]
    paths.add_paths([["/"]], [["ab"]])
    assert all_of(paths) == ["/ab"]


def test_too_few_frequencies():
    with pytest.raises(HostError) as caught:
        HuffmanPaths("frequencies", "/ab", [5, 2])
    assert_error(caught, HOST + "tooFewElements", 3, 2)


def test_tree_with_an_empty_string_sets_only_the_frequencies():
    paths = HuffmanPaths("tree", "", b"no stored form", [4, 2])
    assert paths.frequencies.tolist() == [4, 2]
    assert paths.string_tree == ""
    assert all_of(paths) == []


def test_tree_of_damaged_bytes():
    string, stored = filled().serialize()
    for length in range(len(stored)):
        with pytest.raises(HostError) as caught:
            HuffmanPaths("tree", string, stored[:length], [])
        assert_error(
            caught, HOST + "nativeError", "HuffmanPaths", caught.value.arguments[1]
        )


def test_copy_of_what_is_no_instance():
    with pytest.raises(HostError) as caught:
        HuffmanPaths("copy", "no instance")
    assert caught.value.identifier == HOST + "notAnInstance"


# ---- addPaths ----


@pytest.mark.parametrize(
    ("folders", "files", "key", "arguments"),
    [
        ([["/"], ["/"]], [["a"]], "unequalNumFolderFileList", ()),
        ([], [["a"]], "unequalNumFolderFileList", ()),
        ([["/"], ["/"], []], [["a"], ["b"], ["a"]], "folderElementEmpty", ("3",)),
        ([["/"], ["/", "a", "b", ""]], [["a"], []], "folderElementEmpty", ("2, 4",)),
        ([["/"], ["/", "a"]], [["a"], []], "fileElementEmpty", ("2",)),
        ([["/"]] * 12, [["a"]] * 11 + [["a", "b", ""]], "fileElementEmpty", ("12, 3",)),
    ],
)
def test_refused_additions_add_nothing(folders, files, key, arguments):
    paths = HuffmanPaths("frequencies", "/ab", [1, 1, 1])
    with pytest.raises(HostError) as caught:
        paths.add_paths(folders, files)
    assert_error(caught, OWN + key, *arguments)
    assert all_of(paths) == iterated(paths) == []


def test_texts_of_errors_name_the_position():
    paths = HuffmanPaths()
    with pytest.raises(HostError, match=r"Element 1, 2 of the folders is empty\."):
        paths.add_paths([["/", ""]], [["a"]])
    with pytest.raises(HostError, match=r"Element 1 of the files is empty\."):
        paths.add_paths([["/"]], [[]])
    with pytest.raises(HostError, match="number of folders must be the number of"):
        paths.add_paths([], [[]])


def test_character_without_a_code_adds_nothing():
    paths = filled()
    with pytest.raises(HostError) as caught:
        paths.add_paths([["/"], ["/"]], [["env"], ["?"]])
    text = "Code for the character not found."
    assert_error(caught, HOST + "nativeError", "addPaths", text)
    assert all_of(paths) == PATHS


@pytest.mark.parametrize("folders", ["/", ["/"], [3], 3, None, {"a": 1}])
def test_other_values_for_folders_are_host_errors(folders):
    paths = filled()
    with pytest.raises(HostError):
        paths.add_paths(folders, [["x"]])
    assert all_of(paths) == PATHS


@pytest.mark.parametrize(
    "value", [{"x"}, object(), 1j, np.array([1j]), np.array([b"x"]), {1: "a"}]
)
def test_values_without_a_form_are_type_errors(value):
    paths = filled()
    for folders in (value, [value], [["/", value]]):
        with pytest.raises(TypeError) as caught:
            paths.add_paths(folders, [["x"]])
        assert len(str(caught.value).splitlines()) == 1
    assert all_of(paths) == PATHS


def test_additions_go_on_from_the_last_number():
    paths = filled()
    paths.add_paths([["/", "usr", "bin"]], [["x"]])
    assert all_of(paths) == [*PATHS, "/usr/bin/x"]


# ---- getPaths ----


def test_paths_joined_with_a_separator():
    paths = filled()
    assert paths.get_paths(range(1, 6), "/") == PATHS
    assert paths.get_paths([1, 3], "::") == ["/usr::bin::env", "/vmlinuz"]
    assert paths.get_paths([1], "") == ["/usrbinenv"]


def test_paths_as_components():
    folders, files = filled().get_paths([2, 3, 4, 5])
    assert folders == FOLDERS
    assert files == [["vi"], ["vmlinuz"], ["README", "x"]]


@pytest.mark.parametrize(
    ("numbers", "found"),
    [
        ([], []),
        (2, [PATHS[1]]),
        ([1.9, 3.2], [PATHS[0], PATHS[2]]),
        ([5, 6, 7], [PATHS[4], None, None]),
        ([6, 1], [None, None]),
        (np.array([4, 5], dtype=np.int16), PATHS[3:]),
        (np.array([[1, 3], [2, 4]]), PATHS[:4]),  # column by column
    ],
)
def test_numbers(numbers, found):
    assert filled().get_paths(numbers, "/") == found


def test_smaller_number_is_looked_up_in_its_predecessors_folder():
    paths = filled([["/"], ["/", "a"]], [["b", "c", "d"], ["e", "f"]])
    assert paths.get_paths([5, 4], "/") == ["/a/f", "/a/e"]


@pytest.mark.parametrize("number", [float("nan"), -1, -7.5])
def test_numbers_that_no_path_can_have(number):
    with pytest.raises(HostError) as caught:
        filled().get_paths([number], "/")
    assert caught.value.identifier == HOST + "nativeError"
    assert caught.value.arguments[0] == "getPaths"


def test_numbers_that_are_none():
    with pytest.raises(ValueError, match="could not convert"):
        filled().get_paths(["one"])


def test_without_an_output_nothing_is_looked_up():
    assert call(filled(), "getPaths", 0, np.array([np.nan])) == []


def test_numbers_beyond_32_bits():
    # A stored form whose second batch begins at 2^32 - 1. Its ends take 8 bytes.
    made = HuffmanPaths("frequencies", "/abc", [1, 1, 1, 1])
    made.add_paths([["/"], ["/", "b"]], [["a"], ["a", "b", "c"]])
    payload = zlib.decompress(made.serialize()[1].tobytes()[8:])
    ends = struct.pack("<QQ", 2**32 - 2, 2**32 + 1)
    assert payload.count(b"\1\0\0\2\1\4") == 1
    payload = payload.replace(b"\1\0\0\2\1\4", b"\1\3\0\2" + ends)
    form = struct.pack("<Q", len(payload)) + zlib.compress(payload)
    inputs = made.string_tree, np.frombuffer(form, np.uint8), made.frequencies
    paths = HuffmanPaths("tree", *inputs)
    numbers = [1, 2**32 - 1, 2**32, 2**32 + 1, 2**32 + 2]
    wanted = ["/a", "/b/a", "/b/b", "/b/c", None]
    for each in paths, copy.copy(paths), pickle.loads(pickle.dumps(paths)):
        assert each.get_paths(numbers, "/") == wanted
        assert each.get_paths(np.array(numbers, np.uint64), "/") == wanted
        for number, path in zip(numbers, wanted, strict=True):
            assert each.get_paths([number], "/") == [path]


# ---- Iteration ----


def test_a_pass_gives_every_path_once():
    paths = filled()
    assert sorted(iterated(paths)) == sorted(COMPONENTS)
    assert not paths.has_next_path()
    assert iterated(paths) == iterated(paths)


def test_repeated_paths_come_out_as_often_as_they_were_added():
    paths = filled()
    paths.add_paths(FOLDERS, FILES)
    assert sorted(iterated(paths)) == sorted(COMPONENTS * 2)
    assert all_of(paths) == PATHS * 2


def test_no_next_path_before_reset_and_after_the_last():
    paths = filled()
    assert not paths.has_next_path()
    for _ in range(2):
        with pytest.raises(HostError) as caught:
            paths.get_next_path()
        text = "No more paths to provide."
        assert_error(caught, HOST + "nativeError", "getNextPath", text)
        iterated(paths)


def test_has_next_path_answers_also_without_a_requested_output():
    paths = filled()
    paths.reset()
    assert call(paths, "hasNextPath", 0) == [True]


# ---- Counts of inputs and outputs ----


@pytest.mark.parametrize(
    ("method", "outputs", "inputs", "key"),
    [
        ("addPaths", 1, ([], []), "tooManyOutputs"),
        ("addPaths", 0, ([],), "tooFewInputs"),
        ("addPaths", 0, ([], [], []), "tooManyInputs"),
        ("getPaths", 3, ([],), "tooManyOutputs"),
        ("getPaths", 1, (), "tooFewInputs"),
        ("getPaths", 1, (np.ones(1), "/", 3), "tooManyInputs"),
        ("getNextPath", 2, (), "tooManyOutputs"),
        ("getNextPath", 1, (1,), "tooManyInputs"),
        ("hasNextPath", 2, (), "tooManyOutputs"),
        ("hasNextPath", 1, (1,), "tooManyInputs"),
        ("reset", 1, (), "tooManyOutputs"),
        ("reset", 0, (1,), "tooManyInputs"),
        ("serialize", 3, (), "tooManyOutputs"),
        ("serialize", 2, (1,), "tooManyInputs"),
        ("unknown", 0, (), "methodMissing"),
        ("getPaths", 1, ("1",), "wrongType"),
    ],
)
def test_calls_that_the_host_refuses(method, outputs, inputs, key):
    with pytest.raises(HostError) as caught:
        call(filled(), method, outputs, *inputs)
    assert caught.value.identifier == HOST + key


# ---- The stored form and the properties ----


def test_stored_form_restores_an_equal_instance():
    paths = filled()
    string, stored = paths.serialize()
    assert string == paths.string_tree
    assert (stored.dtype, stored.ndim) == (np.uint8, 1)
    for form in (stored, bytes(stored), bytearray(stored), memoryview(stored)):
        equal = HuffmanPaths("tree", string, form, paths.frequencies)
        assert all_of(equal) == PATHS
        assert iterated(equal) == iterated(paths)
        assert np.array_equal(equal.frequencies, paths.frequencies)
        assert np.array_equal(equal.serialize()[1], stored)


def test_one_output_of_serialize_is_the_tree_string():
    paths = filled()
    assert call(paths, "serialize", 1) == [paths.string_tree]


def test_empty_instance_has_a_stored_form():
    string, stored = HuffmanPaths().serialize()
    assert string == ""
    assert stored.dtype == np.uint8
    assert all_of(HuffmanPaths("tree", string, stored, [])) == []


def test_properties_are_read_only():
    paths = filled()
    assert isinstance(paths.string_tree, str)
    assert sorted(paths.frequencies) == sorted(
        HuffmanPaths("files", FOLDERS + FILES).frequencies
    )
    with pytest.raises(AttributeError):
        paths.string_tree = ""
    with pytest.raises(AttributeError):
        paths.frequencies = [1]


# ---- Copies and pickles ----


@pytest.mark.parametrize("make", [copy.copy, lambda paths: HuffmanPaths("copy", paths)])
def test_copy_shares_paths_and_iterates_on_its_own(make):
    paths = filled()
    paths.reset()
    copied = make(paths)
    assert all_of(copied) == PATHS
    first = paths.get_next_path()
    assert iterated(copied)[0] == first
    assert paths.has_next_path()
    assert np.array_equal(copied.frequencies, paths.frequencies)
    del paths
    assert all_of(copied) == PATHS


def test_passes_of_copies_give_what_is_added_later():
    paths = filled()
    copied = copy.copy(paths)
    paths.add_paths([["/"]], [["x"]])
    copied.add_paths([["/"]], [["vi"]])
    expected = sorted([*COMPONENTS, ["/", "x"], ["/", "vi"]])
    assert sorted(iterated(paths)) == sorted(iterated(copied)) == expected
    assert all_of(paths) == [*PATHS, "/x"]
    assert all_of(copied) == [*PATHS, "/vi"]


class Named(HuffmanPaths):
    """A class of a user's."""


@pytest.mark.parametrize("protocol", range(2, pickle.HIGHEST_PROTOCOL + 1))
@pytest.mark.parametrize("kind", [HuffmanPaths, Named])
def test_pickle(protocol, kind):
    paths = kind("files", FOLDERS + FILES)
    paths.add_paths(FOLDERS, FILES)
    loaded = pickle.loads(pickle.dumps(paths, protocol))
    assert type(loaded) is kind
    assert all_of(loaded) == PATHS
    assert iterated(loaded) == iterated(paths)
    assert np.array_equal(loaded.frequencies, paths.frequencies)
    loaded.add_paths([["/"]], [["x"]])
    assert all_of(loaded) == [*PATHS, "/x"]
    assert all_of(paths) == PATHS


def test_deep_copy_shares_nothing():
    paths = filled()
    copied = copy.deepcopy(paths)
    copied.add_paths([["/", "usr", "bin"]], [["x"]])
    assert sorted(iterated(paths)) == sorted(COMPONENTS)
    assert all_of(copied) == [*PATHS, "/usr/bin/x"]


def test_empty_instance_is_pickled(capfd):
    loaded = pickle.loads(pickle.dumps(HuffmanPaths()))
    assert all_of(loaded) == []
    assert capfd.readouterr().out == ""


def test_saved_form_is_what_custom_load_wants():
    paths = filled()
    saved = paths.__getstate__()
    string, stored = paths.serialize()
    assert set(saved) == {"StringTree", "Frequencies", "PathTree"}
    assert saved["StringTree"] == string
    assert np.array_equal(saved["Frequencies"], paths.frequencies)
    assert np.array_equal(saved["PathTree"], stored)


@pytest.mark.parametrize(
    "damage",
    [
        lambda saved: saved.update(PathTree=saved["PathTree"][:-1]),
        lambda saved: saved.update(PathTree=b""),
        lambda saved: saved.update(PathTree="text"),
        lambda saved: saved.update(StringTree="a"),
        lambda saved: saved.pop("StringTree"),
    ],
)
def test_damaged_saved_form(damage, capfd):
    saved = filled().__getstate__()
    damage(saved)
    with pytest.raises(ValueError, match="this saved HuffmanPaths is damaged"):
        HuffmanPaths.__new__(HuffmanPaths).__setstate__(saved)
    assert capfd.readouterr().out == LOAD_LINE


def test_host_errors_are_pickled():
    with pytest.raises(HostError) as caught:
        HuffmanPaths("files", [1])
    error = pickle.loads(pickle.dumps(caught.value))
    assert str(error) == str(caught.value)
    assert error.identifier == OWN + "fileListNotEven"
    assert error.arguments == ()


# ---- Values both ways ----


@pytest.mark.parametrize("seed", range(20))
def test_random_names_come_out_as_they_went_in(seed):
    folders, files = random_listing(seed)
    paths = filled(folders, files)
    plain = [
        [*folder, name]
        for folder, names in zip(folders, files, strict=True)
        for name in names
    ]
    joined = [path[0] + "\1".join(path[1:]) for path in plain]
    numbers = range(1, len(plain) + 1)
    loaded = pickle.loads(pickle.dumps(paths))
    for kept in (paths, loaded):
        assert kept.get_paths(numbers, "\1") == joined
        assert kept.get_paths(numbers) == (folders, files)
        assert sorted(iterated(kept)) == sorted(plain)


def test_halves_of_a_pair_that_meet_are_a_pair():
    paths = filled([["/"]], [["\ud83d\ude00", "\ude00\ud83d"]])
    assert all_of(paths) == ["/\U0001f600", "/\ude00\ud83d"]


def test_lists_may_be_tuples_and_arrays():
    folders = np.array([["/", "a"], ["/", "b"]])
    objects = np.empty(2, dtype=object)
    objects[:] = [("/", "a"), np.array(["/", "b"], dtype=object)]
    files = (["c"], (np.str_("d"),))
    for given in ([*folders], objects, tuple(objects)):
        paths = HuffmanPaths("frequencies", "/abcd", np.ones(5))
        paths.add_paths(given, files)
        assert all_of(paths) == ["/a/c", "/b/d"]


def test_arrays_are_read_column_by_column_and_with_steps():
    paths = filled([["/"]], [["a", "b", "c", "d"]])
    backwards = np.array([4, 9, 3, 9, 2, 9, 1, 9])[::2][::-1]
    assert paths.get_paths(backwards, "/") == ["/a", "/b", "/c", "/d"]
    names = np.array([["a", "c"], ["b", "d"]], dtype=object)
    other = HuffmanPaths("frequencies", "/abcd", np.ones((5, 1)))
    other.add_paths([["/"]], [names])
    assert all_of(other) == ["/a", "/b", "/c", "/d"]


def test_list_within_itself():
    folders = []
    folders.append(folders)
    with pytest.raises(RecursionError):
        filled().add_paths(folders, [["x"]])


def test_interrupt_ends_a_conversion():
    class Interrupted(Exception):  # noqa: N818
        pass

    def interrupt(*_):
        raise Interrupted

    paths = HuffmanPaths("frequencies", "/a", [1, 1])
    names = ["a"] * 2_000_000
    before = signal.signal(signal.SIGALRM, interrupt)
    try:
        with pytest.raises(Interrupted):
            signal.setitimer(signal.ITIMER_REAL, 0.001)
            paths.add_paths([["/"]], [names])
    finally:
        signal.signal(signal.SIGALRM, before)
    assert all_of(paths) == []


def test_million_paths():
    folders = [["/", "data", f"run{i:04}"] for i in range(1000)]
    names = [f"image-{i:04}.jpg" for i in range(1000)]
    files = [names] * len(folders)
    plain = [f"/data/run{i:04}/{name}" for i in range(1000) for name in names]
    paths = filled(folders, files)
    assert paths.get_paths(np.arange(1, 1_000_001), "/") == plain
    loaded = pickle.loads(pickle.dumps(paths))
    assert loaded.get_paths(range(1, 1_000_001, 999), "/") == plain[::999]


# ---- Threads ----


def in_threads(work):
    """What four threads that do the same work return."""
    with concurrent.futures.ThreadPoolExecutor(4) as pool:
        return [done.result() for done in [pool.submit(work, i) for i in range(4)]]


def test_threads_have_instances_of_their_own():
    def work(seed):
        for step in range(20):
            folders, files = random_listing(100 * seed + step)
            numbers = range(1, 1 + sum(map(len, files)))
            assert filled(folders, files).get_paths(numbers) == (folders, files)

    in_threads(work)


def test_threads_share_a_pass():
    names = [f"{i:06}" for i in range(50_000)]
    paths = filled([["/"]], [names])
    paths.reset()

    def work(_):
        found = []
        try:
            while True:
                found.append(paths.get_next_path()[1])
        except HostError:
            return found

    assert sorted(itertools.chain(*in_threads(work))) == names
