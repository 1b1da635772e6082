"""What the tests of the command share."""
import os
import random
import subprocess

import pytest

TESSEL = os.environ.get("TESSEL", "build/release/hosts/console/tessel")


class Result:
    def __init__(self, done):
        self.status = done.returncode
        self.out = done.stdout
        self.err = done.stderr

    def lines(self):
        return self.out.split(b"\n")[:-1]


class Tessel:
    """Runs the command in a folder of its own."""

    def __init__(self, folder):
        self.folder = folder

    def __call__(self, *words, input=b"", expect=0, **options):
        done = Result(subprocess.run(
            [TESSEL, *words], input=input, cwd=self.folder,
            stdout=subprocess.PIPE, stderr=subprocess.PIPE, check=False,
            **options))
        assert done.status == expect, (words, done.status, done.err)
        if expect > 1 and not options:
            # One line that says what is wrong.
            assert done.err.startswith(b"tessel: "), done.err
            assert done.err.count(b"\n") >= 1, done.err
        return done

    def start(self, *words, **options):
        return subprocess.Popen([TESSEL, *words], cwd=self.folder, **options)

    def pack(self, paths, file="a.tessel", *flags, end=b"\n"):
        return self("pack", "-o", file, *(["-0"] if end == b"\0" else []),
                    *flags, input=b"".join(p + end for p in paths))

    def list(self, file="a.tessel"):
        text = self("list", file, "-0").out
        return text.split(b"\0")[:-1]

    def leftovers(self):
        return [n for n in os.listdir(self.folder) if n.endswith(".tmp")]


@pytest.fixture
def tessel(tmp_path):
    return Tessel(tmp_path)


def some_paths(count, seed=1, shuffled=False):
    """Paths as file systems have them: few folders, many alike names."""
    draw = random.Random(seed)
    words = [b"lib", b"share", b"doc", b"README", b"index", b"python3",
             b"include", b"main", b"test", b"\xc3\xbcber", b"\xff\xfe"]
    paths = []
    while len(paths) < count:
        folder = b"/".join(draw.choice(words) + b"%d" % draw.randrange(9)
                           for _ in range(draw.randrange(1, 5)))
        for _ in range(draw.randrange(1, 40)):
            paths.append(folder + b"/" + draw.choice(words) +
                         b"-%d.txt" % draw.randrange(100000))
    paths = sorted(paths[:count])
    if shuffled:
        draw.shuffle(paths)
    return paths


def nasty_paths():
    """Everything that is a path and that a program could trip over."""
    paths = [bytes([b]) for b in range(1, 256) if b != 10]
    paths.append(bytes(b for b in range(1, 256) if b != 10))
    paths += [b"a//b", b"./x", b"../y", b"/", b"//", b"///", b"a/", b"a//",
              b".", b"..", b"-", b"--", b"-0", b" ", b"\t", b"\r", b"a\r",
              b"*", b"[ab]", b"{}", b"~", b"$HOME", b"\xc3", b"\xed\xb2\x80",
              b"\xf4\x90\x80\x80", b"/abs/olute", b"x" * 4096,
              b"f/" * 2000 + b"deep", b"y" * 4096 + b"/" + b"z" * 4096,
              b"12", b"-1", b"same", b"same", b"same"]
    return paths
