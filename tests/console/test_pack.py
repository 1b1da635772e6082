"""tessel pack: what goes in comes out, and what does not is told."""
import os
import random
import re

import pytest

from conftest import nasty_paths, some_paths


def test_any_bytes_come_back_by_line(tessel):
    paths = nasty_paths()
    tessel.pack(paths)
    assert tessel.list() == paths


def test_any_bytes_come_back_with_nul(tessel):
    paths = nasty_paths() + [b"\n", b"a\nb", b"\n\n", b"a/\n/b"]
    tessel.pack(paths, "a.tessel", end=b"\0")
    assert tessel.list() == paths


@pytest.mark.parametrize("level", ["fast", "normal", "best"])
@pytest.mark.parametrize("shuffled", [False, True])
def test_every_level_and_order(tessel, level, shuffled):
    paths = some_paths(20000, shuffled=shuffled)
    tessel.pack(paths, "a.tessel", "--level", level)
    assert tessel.list() == paths


def test_the_empty_list(tessel):
    line = tessel.pack([]).out
    assert line.startswith(b"0 paths, 0 bytes of text, ")
    assert tessel.list() == []
    assert tessel("list", "a.tessel", "--folder", "").out == b""
    assert tessel("find", "a.tessel", "x", expect=1).out == b""
    assert tessel("info", "a.tessel").out.startswith(b"paths")
    tessel("verify", "a.tessel")
    assert tessel("get", "a.tessel", "0", expect=3).out == b""
    tessel("get", "a.tessel", "-1", expect=3)
    assert tessel("get", "a.tessel", "--random", "0").out == b""
    assert tessel("diff", "a.tessel", "a.tessel").out == b""


def test_the_last_separator_may_be_missing(tessel):
    tessel("pack", "-o", "a.tessel", input=b"a\nb")
    assert tessel.list() == [b"a", b"b"]


def test_one_line_tells_the_sizes(tessel):
    paths = some_paths(1000)
    line = tessel.pack(paths).out.decode()
    found = re.fullmatch(r"(\d+) paths, (\d+) bytes of text, (\d+) bytes in "
                         r"the file, ([\d.]+) bytes per path, [\d.]+ s\n", line)
    assert found, line
    size = os.path.getsize(tessel.folder / "a.tessel")
    assert int(found[1]) == 1000
    assert int(found[2]) == sum(len(p) + 1 for p in paths)
    assert int(found[3]) == size
    assert float(found[4]) == pytest.approx(size / 1000, abs=0.006)
    assert tessel.pack(paths, "b.tessel", "-q").out == b""


def test_a_file_is_a_list(tessel):
    (tessel.folder / "list").write_bytes(b"a\nb\n")
    tessel("pack", "list", "-o", "a.tessel")
    tessel("pack", "-", "-o", "b.tessel", input=b"a\nb\n")
    assert tessel.list() == tessel.list("b.tessel") == [b"a", b"b"]


def test_empty_lines_are_told_or_skipped(tessel):
    done = tessel("pack", "-o", "a.tessel", input=b"a\nb\n\nc\n", expect=3)
    assert b"line 3" in done.err and b"--skip-empty" in done.err
    assert not (tessel.folder / "a.tessel").exists()
    done = tessel("pack", "-o", "a.tessel", "--skip-empty",
                  input=b"\na\n\n\nb\n")
    assert b"3 empty lines skipped" in done.out
    assert tessel.list() == [b"a", b"b"]


def test_no_path_holds_nul(tessel):
    done = tessel("pack", "-o", "a.tessel", input=b"a\nb\0c\n", expect=3)
    assert b"line 2" in done.err and b"-0" in done.err


def test_paths_that_are_too_long_are_told(tessel):
    long = b"x" * (1 << 20)
    tessel.pack([b"a", long])
    assert tessel.list()[1] == long
    done = tessel("pack", "-f", "-o", "a.tessel", input=b"a\n" + long + b"x\n",
                  expect=3)
    assert b"line 2" in done.err
    assert tessel.list()[1] == long


def test_nothing_is_overwritten_unasked(tessel):
    tessel.pack([b"a"])
    done = tessel("pack", "-o", "a.tessel", input=b"b\n", expect=3)
    assert b"a.tessel" in done.err and b"-f" in done.err
    assert tessel.list() == [b"a"]
    tessel("pack", "-f", "-o", "a.tessel", input=b"b\n")
    assert tessel.list() == [b"b"]


def test_append_goes_on_with_the_numbers(tessel):
    draw = random.Random(5)
    paths = []
    for part in range(8):
        more = some_paths(draw.choice([0, 1, 500]), part, draw.random() < 0.5)
        tessel.pack(more, "a.tessel", "--append")
        paths += more
        assert tessel.list() == paths
    for number in draw.sample(range(len(paths)), 20):
        got = tessel("get", "a.tessel", str(number), "-0").out
        assert got == paths[number] + b"\0"
    tessel("verify", "a.tessel")


def test_append_tells_what_there_is_now(tessel):
    tessel.pack([b"a", b"b"])
    line = tessel.pack([b"c"], "a.tessel", "--append").out
    assert line.startswith(b"3 paths, 6 bytes of text, ")
    assert line.endswith(b"; 1 paths added\n")


def test_a_folder_is_walked(tessel):
    top = tessel.folder / "top"
    (top / "b" / "deep").mkdir(parents=True)
    (top / "empty").mkdir()
    (top / "z").write_text("")
    (top / "b" / "x").write_text("")
    (top / "b" / "deep" / b"\xff".decode(errors="surrogateescape")).write_text("")
    (top / "link").symlink_to("b")
    tessel("pack", "--walk", "top", "-o", "a.tessel")
    assert sorted(tessel.list()) == [b"top/b/deep/\xff", b"top/b/x",
                                     b"top/link", b"top/z"]
    tessel("pack", "--walk", "top/", "--folders", "-o", "b.tessel")
    assert sorted(tessel.list("b.tessel")) == [
        b"top/b", b"top/b/deep", b"top/b/deep/\xff", b"top/b/x", b"top/empty",
        b"top/link", b"top/z"]
    # The file that is being written does not see itself.
    tessel("pack", "--walk", "top", "-o", "top/a.tessel")
    assert tessel.list("top/a.tessel") == tessel.list()
    (top / "a.tessel").unlink()
    tessel("pack", "--walk", "none", "-o", "c.tessel", expect=5)
    tessel("pack", "--walk", "top/z", "-o", "c.tessel", expect=5)
    assert not (tessel.folder / "c.tessel").exists()


def test_a_store_is_a_list_and_back(tessel):
    paths = some_paths(3000, shuffled=True) + [b"a", b"a", b"a/b"]
    tessel.pack(paths)
    tessel("export", "a.tessel", "-o", "a.store")
    tessel("export", "a.tessel", "-o", "a.store", expect=3)
    tessel("export", "a.tessel", "-o", "a.store", "-f")
    tessel("pack", "a.store", "-o", "b.tessel")
    assert tessel.list("b.tessel") == paths
    store = (tessel.folder / "a.store").read_bytes()
    tessel("pack", "-o", "c.tessel", input=store)
    assert tessel.list("c.tessel") == paths
    assert tessel("export", "a.tessel", "-o", "-").out == store
    tessel("pack", "-o", "d.tessel", input=store[:-20], expect=4)
    assert not (tessel.folder / "d.tessel").exists()


def test_an_archive_is_a_list(tessel):
    paths = some_paths(500)
    tessel.pack(paths, "a.tessel", "--level", "fast")
    tessel("pack", "a.tessel", "-o", "b.tessel", "--level", "best")
    assert tessel.list("b.tessel") == paths


def test_pipes_carry_archives(tessel):
    paths = some_paths(500)
    done = tessel("pack", "-o", "-", input=b"\n".join(paths))
    assert done.err.startswith(b"500 paths")
    again = tessel("list", "-", "-0", input=done.out)
    assert again.out.split(b"\0")[:-1] == paths


def test_threads_do_not_change_the_bytes(tessel):
    paths = some_paths(50000)
    for threads in ["1", "2", "7"]:
        tessel.pack(paths, threads, "-j", threads)
    one = (tessel.folder / "1").read_bytes()
    assert (tessel.folder / "2").read_bytes() == one
    assert (tessel.folder / "7").read_bytes() == one


@pytest.mark.parametrize("words", [
    ["pack"], ["pack", "-o"], ["pack", "-o", "x", "--level", "great"],
    ["pack", "-o", "x", "--append", "-f"], ["pack", "-o", "x", "a", "b"],
    ["pack", "-o", "x", "list", "--walk", "."], ["pack", "-o", "-", "--append"],
    ["pack", "-o", "x", "--folders"], ["pack", "-o", "x", "-j", "two"]])
def test_wrong_words(tessel, words):
    assert b"--help" in tessel(*words, expect=2).err
    assert os.listdir(tessel.folder) == []


def test_what_the_system_refuses(tessel):
    tessel("pack", "none", "-o", "a.tessel", expect=5)
    tessel("pack", ".", "-o", "a.tessel", expect=5)
    refused = tessel("pack", "-o", "none/a.tessel", input=b"a\n", expect=5)
    assert refused.err.startswith(b"tessel: none/a.tessel: "), refused.err
    # An empty name, as an unset variable gives it, is not standard input.
    tessel("pack", "", "-o", "a.tessel", input=b"a\n", expect=5)
    assert tessel.leftovers() == []
    (tessel.folder / "text").write_bytes(b"no archive\n")
    tessel("pack", "-o", "text", "--append", input=b"a\n", expect=4)
    assert (tessel.folder / "text").read_bytes() == b"no archive\n"


def test_a_million_names_in_one_folder(tessel):
    paths = [b"folder/%07d" % i for i in range(1000000)]
    tessel.pack(paths)
    assert tessel.list() == paths
    assert tessel("get", "a.tessel", "654321").out == b"folder/0654321\n"


def test_a_hundred_thousand_sibling_folders(tessel):
    paths = [b"%05d/f" % i for i in range(100000)]
    random.Random(2).shuffle(paths)
    tessel.pack(paths)
    assert tessel.list() == paths
    number = paths.index(b"04711/f")
    assert tessel("number", "a.tessel", "04711/f").out == b"%d\n" % number
