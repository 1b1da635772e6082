"""Views, and views of views, beside plain lists."""

import collections
import random

import numpy as np
import pytest
from qztessel import PathList

# Shuffled lists have to stay in their order: never change these.
SHUFFLED_42 = "998 721 62 193 563 996 685 278 883 312 710 605".split()
SHUFFLED_MAX = "330 343 316 103 556 644".split()
SHUFFLED_LETTERS = "bajdfgcihe"


def test_shuffled_is_a_permutation():
    for size in [0, 1, 2, 3, 4, 5, 7, 8, 9, 100, 255, 256, 257, 1000]:
        plain = [f"p{i}" for i in range(size)]
        packed = PathList.pack(plain)
        for seed in (0, 1, 2**64 - 1):
            assert sorted(packed.shuffled(seed)) == sorted(plain)


def test_shuffled_is_the_same_everywhere():
    packed = PathList.pack([str(i) for i in range(1000)])
    assert list(packed.shuffled(42)[:12]) == SHUFFLED_42
    assert list(packed.shuffled(2**64 - 1)[:6]) == SHUFFLED_MAX
    assert "".join(PathList.pack(list("abcdefghij")).shuffled(0)) == SHUFFLED_LETTERS


def test_shuffled_depends_on_the_seed():
    packed = PathList.pack([str(i) for i in range(100)])
    orders = {tuple(packed.shuffled(seed)) for seed in range(50)}
    assert len(orders) == 50


def test_every_order_is_equally_likely():
    packed = PathList.pack(list("abcd"))
    orders = collections.Counter("".join(packed.shuffled(s)) for s in range(12000))
    assert len(orders) == 24
    squares = sum((count - 500) ** 2 / 500 for count in orders.values())
    assert squares < 60  # chi-squared with 23 degrees of freedom: p = 0.00004


def test_shuffled_keeps_no_neighbours():
    packed = PathList.pack([str(i) for i in range(10000)])
    order = [int(path) for path in packed.shuffled(3)]
    near = sum(abs(a - b) == 1 for a, b in zip(order, order[1:]))
    assert near < 20  # 2 expected
    fixed = sum(i == number for i, number in enumerate(order))
    assert fixed < 12  # 1 expected


def test_seeds_out_of_range():
    for seed in (-1, 2**64):
        with pytest.raises(ValueError, match="is not from 0 to"):
            PathList.pack(list("ab")).shuffled(seed)


def test_split(plain, packed):
    for shards in (1, 2, 3, 7, len(plain) + 2):
        parts = packed.split(shards)
        assert len(parts) == shards
        assert [path for part in parts for path in part] == plain
        sizes = [len(part) for part in parts]
        assert max(sizes) - min(sizes) <= 1
    with pytest.raises(ValueError, match="cannot split into 0"):
        packed.split(0)


def test_sample(plain, packed):
    size = len(plain) // 2
    drawn = list(packed.sample(size, seed=4))
    assert len(drawn) == size
    assert drawn == list(packed.shuffled(4))[:size]
    for count in (-1, len(plain) + 1):
        with pytest.raises(ValueError, match="cannot draw"):
            packed.sample(count, seed=4)


def test_select(plain, packed):
    choose = random.Random(11)
    chosen = [choose.randrange(-len(plain), len(plain)) for _ in range(200) if plain]
    wanted = [plain[i] for i in chosen]
    assert list(packed.select(chosen)) == wanted
    assert list(packed.select(np.array(chosen, dtype=np.int32))) == wanted
    assert list(packed.select([])) == []


def test_select_keeps_its_own_numbers():
    numbers = np.array([1, 2])
    view = PathList.pack(list("abc")).select(numbers)
    numbers[:] = 0
    assert list(view) == ["b", "c"]


def test_select_refuses():
    packed = PathList.pack(list("abc"))
    for wrong in ([3], [-4], np.array([2**63], dtype=np.uint64)):
        with pytest.raises(IndexError, match="out of range for 3 paths"):
            packed.select(wrong)
    for wrong in ([1.5], ["a"], [True]):
        with pytest.raises(TypeError, match="expected integers"):
            packed.select(wrong)
    with pytest.raises(ValueError, match="one dimension"):
        packed.select([[1]])


def random_view(choose, packed, plain):
    """The same random step for a PathList and a plain list."""
    kind = choose.randrange(4)
    if kind == 0:
        size = len(plain) + 1
        cut = slice(
            choose.randint(-size, size),
            choose.choice([None, choose.randint(-size, size)]),
            choose.choice([1, 1, 2, -1, -3]),
        )
        return packed[cut], plain[cut]
    if kind == 1:
        seed = choose.randrange(2**64)
        numbers = PathList.pack([str(i) for i in range(len(plain))]).shuffled(seed)
        return packed.shuffled(seed), [plain[int(i)] for i in numbers]
    if kind == 2 and plain:
        chosen = [choose.randrange(len(plain)) for _ in range(len(plain))]
        return packed.select(chosen), [plain[i] for i in chosen]
    shard = choose.randrange(2)
    half = -(-len(plain) // 2)
    return packed.split(2)[shard], [plain[:half], plain[half:]][shard]


@pytest.mark.parametrize("seed", range(20))
def test_views_of_views(seed, plain, packed):
    choose = random.Random(seed)
    for _ in range(5):
        packed, plain = random_view(choose, packed, plain)
        assert list(packed) == plain
        if plain:
            i = choose.randrange(-len(plain), len(plain))
            assert packed[i] == plain[i]
            assert packed.index(plain[i]) == plain.index(plain[i])


@pytest.mark.parametrize("seed", [1.0, "1", None])
def test_seeds_that_are_no_integers(seed):
    with pytest.raises(TypeError, match="^'.*' object cannot be interpreted as an int"):
        PathList.pack(["a"]).shuffled(seed)
