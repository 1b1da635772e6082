"""Lists of paths that tests share, as bytes."""

import random

NASTY = [
    b"/", b"//", b"a", b"a/", b"a//b", b"a/b", b"./x", b"../x", b"a", b"a", b"/a",
    b"\xff\xfe/\x01", b"a\nb", b"a/\n", "ä/ö/日本/😀".encode(), b"\xed\xa0\x80", b"\xc3",
    b"n" * 5000, b"d/" * 300 + b"leaf",
]  # fmt: skip


def tree(count, seed=1):
    """A sorted list such as a system's files make, with a few repeats."""
    choose = random.Random(seed)
    words = [b"share", b"lib", b"doc", b"python3", b"man", b"icons", "größe".encode()]
    paths = []
    for _ in range(count):
        folders = [choose.choice(words) for _ in range(choose.randrange(5))]
        name = b"%s-%d.txt" % (choose.choice(words), choose.randrange(count))
        paths.append(b"/".join([*folders, name]))
    return sorted(paths)


def shuffled(paths, seed=1):
    paths = list(paths)
    random.Random(seed).shuffle(paths)
    return paths


ALL = {
    "empty": [],
    "one": [b"a"],
    "nasty": NASTY,
    "sorted": tree(3000),
    "shuffled": shuffled(tree(3000)),
}
