"""tessel list, get, find, number, info, verify, diff."""
import fnmatch
import json
import os
import random
import re
import resource
import subprocess

import pytest

from conftest import TESSEL, nasty_paths, some_paths


@pytest.fixture(params=["sorted", "shuffled", "nasty"])
def paths(request):
    if request.param == "nasty":
        return nasty_paths()
    return some_paths(5000, shuffled=request.param == "shuffled")


# ---- list ----

def test_list_writes_lines_or_nul(tessel, paths):
    tessel.pack(paths)
    assert tessel("list", "a.tessel").out == b"".join(p + b"\n" for p in paths)
    assert tessel("list", "-0", "a.tessel").out == \
        b"".join(p + b"\0" for p in paths)
    assert tessel("list", "a.tessel", "--numbers", "-0").out == \
        b"".join(b"%d\t%s\0" % (i, p) for i, p in enumerate(paths))


def test_list_of_a_folder(tessel, paths):
    tessel.pack(paths)
    folders = {p.rsplit(b"/", 1)[0] for p in paths if b"/" in p}
    folders |= {f.split(b"/", 1)[0] for f in folders}
    for folder in random.Random(1).sample(sorted(folders - {b""}), 4):
        if len(folder) > 100000:
            continue
        start = folder if folder.endswith(b"/") else folder + b"/"
        below = [p for p in paths if p.startswith(start)]
        got = tessel("list", "a.tessel", "-0", "--folder", folder)
        assert got.out.split(b"\0")[:-1] == below
    tessel("list", "a.tessel", "--folder", "no/such", expect=1)


# ---- get ----

def test_get_answers_in_the_order_asked(tessel, paths):
    tessel.pack(paths)
    n = len(paths)
    words = ["5", "-1", "0", "5", "3-6", "-3--1", "2--%d" % (n - 4), "-%d" % n]
    numbers = [5, -1, 0, 5, 3, 4, 5, 6, -3, -2, -1, 2, 3, 4, -n]
    got = tessel("get", "a.tessel", *words, "-0").out.split(b"\0")[:-1]
    assert got == [paths[i] for i in numbers]
    got = tessel("get", "-0", "a.tessel", "--", *words).out
    assert got == b"".join(paths[i] + b"\0" for i in numbers)


def test_get_checks_before_it_writes(tessel):
    tessel.pack([b"a", b"b", b"c"])
    for words in [["0", "3"], ["0", "-4"], ["1-3"], ["2-1"], ["0-99999999999"],
                  ["9223372036854775807"], ["99999999999999999999"],
                  ["-9223372036854775809-1"]]:
        done = tessel("get", "a.tessel", *words, expect=3)
        assert done.out == b"" and b"out of range" in done.err
    for words in [["0", "x"], ["1-"], ["1-2-3"], ["0x1"], [""], []]:
        assert tessel("get", "a.tessel", *words, expect=2).out == b""


def test_get_reads_numbers(tessel, paths):
    tessel.pack(paths)
    draw = random.Random(3)
    numbers = [draw.randrange(-len(paths), len(paths)) for _ in range(20000)]
    text = b"".join(b"%d\n" % i for i in numbers)
    got = tessel("get", "a.tessel", "0", "-", "1", "-0", input=text).out
    assert got.split(b"\0")[:-1] == \
        [paths[0]] + [paths[i] for i in numbers] + [paths[1]]


def test_get_tells_the_line_of_a_wrong_number(tessel):
    tessel.pack([b"a", b"b"])
    done = tessel("get", "a.tessel", "-", input=b"1\n0-1\n2\n0\n", expect=3)
    assert done.out == b"b\na\nb\n" and b"line 3" in done.err
    done = tessel("get", "a.tessel", "-", input=b"1\n\n", expect=3)
    assert done.out == b"b\n" and b"line 2" in done.err


def test_get_and_number_answer_while_they_wait(tessel):
    tessel.pack([b"a", b"b"])
    for words, question, answer in [(["get", "a.tessel", "-"], b"1\n", b"b\n"),
                                    (["number", "a.tessel", "-"], b"b\n", b"1\n")]:
        run = tessel.start(*words, stdin=subprocess.PIPE,
                           stdout=subprocess.PIPE)
        for _ in range(3):
            run.stdin.write(question)
            run.stdin.flush()
            assert run.stdout.readline() == answer
        run.stdin.close()
        assert run.wait() == 0
        run.stdout.close()


def test_get_draws_samples(tessel, paths):
    tessel.pack(paths)
    for count in [0, 1, 10, len(paths) // 2, len(paths)]:
        out = tessel("get", "a.tessel", "-0", "--random", str(count), "--seed",
                     "7").out
        again = tessel("get", "a.tessel", "-0", "--random", str(count),
                       "--seed=7").out
        drawn = out.split(b"\0")[:-1]
        assert out == again and len(drawn) == count
        rest = list(paths)
        for path in drawn:
            rest.remove(path)
    other = tessel("get", "a.tessel", "-0", "--random", "100", "--seed", "8")
    assert other.out != tessel("get", "a.tessel", "-0", "--random", "100",
                               "--seed", "7").out
    tessel("get", "a.tessel", "--random", str(len(paths) + 1), expect=3)
    tessel("get", "a.tessel", "--random", "1", "0", expect=2)
    tessel("get", "a.tessel", "--seed", "1", expect=2)


# ---- find ----

def found(tessel, *words, expect=0):
    return tessel("find", "a.tessel", "-0", *words, expect=expect) \
        .out.split(b"\0")[:-1]


def test_find_texts(tessel, paths):
    tessel.pack(paths)
    for texts in [[b"a"], [b"lib", b"README"], [b"/"], [b"\xff"],
                  [b"e", b"e1", b"s"], [b"x" * 50]]:
        expected = [p for p in paths if all(t in p for t in texts)]
        for threads in ["1", "3"]:
            assert found(tessel, "-j", threads, *texts,
                         expect=0 if expected else 1) == expected
        count = tessel("find", "a.tessel", "--count", *texts,
                       expect=0 if expected else 1)
        assert count.out == b"%d\n" % len(expected)
        numbered = tessel("find", "a.tessel", "--numbers", "-0", *texts,
                          expect=0 if expected else 1)
        assert numbered.out == b"".join(
            b"%d\t%s\0" % (i, p) for i, p in enumerate(paths)
            if all(t in p for t in texts))


def test_find_without_case(tessel):
    paths = [b"a/README", b"a/readme", b"b/\xc3\x84x", b"b/\xc3\xa4X", b"c\xff/ReadMe"]
    tessel.pack(paths)
    assert found(tessel, "-i", "rEADMe") == [paths[0], paths[1], paths[4]]
    assert found(tessel, "-i", "ä") == paths[2:4]
    assert found(tessel, "-i", "--glob", "READ*") == \
        [paths[0], paths[1], paths[4]]
    assert found(tessel, "-i", "--regex", "/r.*e$") == \
        [paths[0], paths[1], paths[4]]


@pytest.mark.parametrize("glob", ["*.txt", "README*", "*/doc?/*", "lib*",
                                  "*[0-9][0-9].txt", "lib[!1-8]/*", "*-1*.txt"])
def test_find_globs(tessel, glob):
    paths = some_paths(3000)
    tessel.pack(paths)
    subject = (lambda p: p) if "/" in glob else (lambda p: p.split("/")[-1])
    expected = [p for p in paths if fnmatch.fnmatchcase(
        subject(p.decode("latin1")), glob)]
    assert found(tessel, "--glob", glob) == expected and expected


def test_find_expressions(tessel, paths):
    tessel.pack(paths)
    for expression in [b"^[a-z]", b"(doc|lib)[0-4]/", b"x$", b"[^/]/.$"]:
        expected = [p for p in paths if re.search(expression, p)]
        assert found(tessel, "--regex", expression,
                     expect=0 if expected else 1) == expected
    assert b"a(" in tessel("find", "a.tessel", "--regex", "a(", expect=2).err
    tessel("find", "a.tessel", "--regex", "--glob", "a", expect=2)


def test_find_below_a_folder(tessel, paths):
    tessel.pack(paths)
    folder = next(p for p in paths if b"/" in p.strip(b"/") and
                  not p.startswith(b"/")).split(b"/")[0]
    for flags in [[], ["-i"]]:
        expected = [p for p in paths if p.startswith(folder + b"/") and
                    b"e" in (p.lower() if flags else p)]
        assert found(tessel, "e", "--folder", folder, *flags,
                     expect=0 if expected else 1) == expected


def test_words_that_look_like_something_else(tessel):
    paths = [b"-x", b"[ab]", b"{}", b"pack", b"%%"]
    tessel.pack(paths)
    for path in paths:
        assert found(tessel, "--", path) == [path]
        assert tessel("number", "a.tessel", "--", path).out == \
            b"%d\n" % paths.index(path)
    assert found(tessel, "--glob", "[ab]", expect=1) == []


# ---- number ----

def test_number(tessel, paths):
    tessel.pack(paths)
    first = {}
    for number, path in enumerate(paths):
        first.setdefault(path, number)
    asked = random.Random(4).sample(paths, 200)
    done = tessel("number", "a.tessel", "-0", "-",
                  input=b"".join(p + b"\0" for p in asked))
    assert done.lines() == [b"%d" % first[p] for p in asked]
    done = tessel("number", "a.tessel", "--", "no such", paths[7], "", expect=1)
    assert done.lines() == [b"?", b"%d" % first[paths[7]], b"?"]
    done = tessel("number", "a.tessel", "-", input=b"\nno\n", expect=1)
    assert done.lines() == [b"?", b"?"]


# ---- info ----

def test_info(tessel, paths):
    tessel.pack(paths)
    facts = json.loads(tessel("info", "a.tessel", "--json").out)
    size = os.path.getsize(tessel.folder / "a.tessel")
    assert facts["file"] == "a.tessel"
    assert facts["paths"] == len(paths)
    assert facts["repeats"] == len(paths) - len(set(paths))
    assert facts["folders"] == len({p[:p.rfind(b"/") + 1] for p in paths})
    assert facts["fileBytes"] == size
    assert facts["bytesPerPath"] == pytest.approx(size / len(paths))
    assert facts["textBytes"] == sum(len(p) + 1 for p in paths)
    assert sum(s["bytes"] for s in facts["sections"]) == size
    assert facts["longestPath"] == max(len(p) for p in paths)
    assert facts["shortestPath"] == min(len(p) for p in paths)
    table = tessel("info", "a.tessel").out.decode()
    assert f"{len(paths):,}" in table and f"{size:,}" in table


def test_info_counts_folders_once_over_segments(tessel):
    tessel.pack([b"a/1", b"b/1"])
    tessel.pack([b"b/2", b"a/1", b"c/1"], "a.tessel", "--append")
    facts = json.loads(tessel("info", "a.tessel", "--json").out)
    assert (facts["folders"], facts["repeats"], facts["segments"]) == (3, 1, 2)


def test_info_of_a_name_that_is_no_text(tessel):
    name = b"\xff.tessel"
    tessel("pack", "-o", name, input=b"a\n")
    facts = json.loads(tessel("info", name, "--json").out)
    assert facts["file"] == {"bytes": "/y50ZXNzZWw="}


def test_info_draws(tessel, paths):
    import xml.etree.ElementTree as tree
    tessel.pack(paths)
    tessel("info", "a.tessel", "--plot", "a.svg")
    picture = tree.parse(tessel.folder / "a.svg").getroot()
    assert picture.tag.endswith("svg")
    texts = [e.text for e in picture.iter() if e.tag.endswith("text")]
    assert "a.tessel" in texts and "Bytes of the file" in texts
    for name in [s["name"] for s in json.loads(
            tessel("info", "a.tessel", "--json").out)["sections"]]:
        assert name in texts


# ---- verify, salvage ----

def test_verify(tessel):
    paths = some_paths(20000)
    tessel.pack(paths)
    assert tessel("verify", "a.tessel").out == b"a.tessel: intact, 20000 paths\n"
    assert tessel("verify", "-q", "-j", "2", "a.tessel").out == b""
    data = bytearray((tessel.folder / "a.tessel").read_bytes())
    middle = len(data) * 3 // 4
    data[middle] ^= 1
    (tessel.folder / "b.tessel").write_bytes(data)
    done = tessel("verify", "b.tessel", "a.tessel", expect=4)
    assert done.lines()[-1] == b"a.tessel: intact, 20000 paths"
    places = re.findall(rb"b.tessel: bytes (\d+) to (\d+): ", done.out)
    assert any(int(a) <= middle <= int(b) for a, b in places), done.out
    done = tessel("verify", "none", "a.tessel", expect=5)
    assert b"none" in done.err and b"a.tessel: intact" in done.out


def test_salvage(tessel):
    paths = some_paths(20000)
    tessel.pack(paths)
    done = tessel("list", "a.tessel", "--salvage", "-0")
    assert done.out.split(b"\0")[:-1] == paths
    data = bytearray((tessel.folder / "a.tessel").read_bytes())
    data[len(data) * 3 // 4] ^= 1
    (tessel.folder / "b.tessel").write_bytes(data)
    tessel("list", "b.tessel", expect=4)
    done = tessel("list", "b.tessel", "--salvage", "--numbers", "-0", expect=4)
    kept = [line.split(b"\t", 1) for line in done.out.split(b"\0")[:-1]]
    assert all(paths[int(number)] == path for number, path in kept)
    report = re.search(rb"(\d+) paths kept, (\d+) lost: ([-0-9, ]+)", done.err)
    assert int(report[1]) == len(kept) > 0
    lost = set()
    for text in report[3].decode().split(", "):
        first, _, last = text.partition("-")
        lost |= set(range(int(first), int(last or first) + 1))
    assert len(lost) == int(report[2]) > 0
    assert lost | {int(n) for n, _ in kept} == set(range(len(paths)))


def test_salvage_of_what_is_no_archive(tessel):
    (tessel.folder / "text").write_bytes(b"no archive\n")
    done = tessel("list", "text", "--salvage", expect=4)
    assert done.err.count(b"\n") == 1
    assert b"--salvage" not in done.err
    # A list where an archive belongs is told from damage in the middle.
    assert b"tessel pack" in tessel("list", "text", expect=4).err


def test_damage_is_told_everywhere(tessel):
    tessel.pack(some_paths(3000))
    data = (tessel.folder / "a.tessel").read_bytes()
    for bad in [b"", b"text\n", data[:-1], data + b"x", data[:len(data) // 2]]:
        (tessel.folder / "b.tessel").write_bytes(bad)
        for words in [["list"], ["get", "0"], ["find", "a"], ["number", "a"],
                      ["info"], ["verify"], ["diff", "a.tessel"],
                      ["export", "-o", "x"]]:
            done = tessel(words[0], "b.tessel", *words[1:], expect=4)
            assert b"b.tessel" in done.err
            assert not (tessel.folder / "x").exists()


# ---- diff ----

@pytest.mark.parametrize("shuffled", [False, True])
def test_diff(tessel, shuffled):
    a = some_paths(6000, 1, shuffled) + [b"only/a", b"both", b"both", b"A" * 5000]
    b = some_paths(6000, 1)[::2] + [b"both", b"only/b", b"only/b", b"\xff"]
    if shuffled:
        random.Random(9).shuffle(b)
    tessel.pack(a)
    tessel.pack(b, "b.tessel")
    done = tessel("diff", "a.tessel", "b.tessel", expect=1)
    expected = [b"- " + p for p in set(a) - set(b)] + \
        [b"+ " + p for p in set(b) - set(a)]
    assert done.lines() == sorted(expected, key=lambda line: line[2:])
    assert tessel("diff", "a.tessel", "a.tessel").out == b""
    assert tessel("diff", "-0", "a.tessel", "b.tessel", expect=1).out == \
        done.out.replace(b"\n", b"\0")


def test_diff_of_many_runs(tessel):
    # More text than one run of the merge holds.
    paths = [b"%s/%08d" % (b"folder" * 12, i * 7919 % 300000)
             for i in range(300000)]
    tessel.pack(paths)
    tessel.pack(sorted(paths)[1:] + [b"z"], "b.tessel")
    done = tessel("diff", "a.tessel", "b.tessel", expect=1)
    assert done.lines() == [b"- " + min(paths), b"+ z"]


def test_diff_of_many_runs_of_long_paths(tessel):
    folder = b"folder/" * 2000
    paths = [folder + b"%08d" % (i * 7919 % 12000) for i in range(12000)]
    tessel.pack(paths)
    tessel.pack(sorted(paths)[1:], "b.tessel")
    # Of 168 MB of text, only some is in memory at a time.
    limit = 80 << 20
    done = tessel("diff", "a.tessel", "b.tessel", expect=1, preexec_fn=lambda:
                  resource.setrlimit(resource.RLIMIT_DATA, (limit, limit)))
    assert done.out == b"- " + min(paths) + b"\n"


# ---- the rest ----

def test_help_and_version(tessel):
    assert re.fullmatch(rb"tessel \d+\.\d+\.\d+\n", tessel("--version").out)
    overview = tessel("--help").out
    for command in ["pack", "list", "get", "find", "number", "info", "verify",
                    "diff", "export"]:
        assert command.encode() in overview
        text = tessel(command, "--help").out.decode()
        assert "Examples:\n" in text and f"tessel {command} " in text
        assert text.endswith("\n")
        assert max(len(line) for line in text.split("\n")) <= 80


@pytest.mark.parametrize("words", [
    [], ["bogus"], ["list"], ["list", "a", "b"], ["find", "a"], ["get", "a"],
    ["number", "a"], ["diff", "a"], ["verify"], ["export", "a"], ["info"],
    ["list", "--bogus", "a"], ["find", "a", "-z"], ["get", "-", "-"],
    ["number", "-", "-"], ["diff", "-", "-"], ["export", "a", "-o"]])
def test_wrong_words(tessel, words):
    done = tessel(*words, expect=2)
    assert done.out == b"" and done.err.count(b"\n") == 1
    assert b"--help" in done.err


def test_what_the_system_refuses(tessel):
    for words in [["list", "none"], ["verify", "none"], ["diff", "none", "none"]]:
        done = tessel(*words, expect=5)
        assert b"none" in done.err and b"No such file" in done.err
    done = tessel("list", ".", expect=5)
    assert b"directory" in done.err


def test_a_full_device(tessel):
    tessel.pack(some_paths(100))
    with open("/dev/full", "wb") as full:
        done = subprocess.run([TESSEL, "list", "a.tessel"], cwd=tessel.folder,
                              stdout=full, stderr=subprocess.PIPE, check=False)
    assert done.returncode == 5 and b"No space" in done.stderr
