#!/usr/bin/env python3
"""Usage: tidy.py OUTPUT FILE... -- CLANG_TIDY [OPTION...] -- [COMPILER_OPTION...]

Runs clang-tidy over source files that are joined into the one file OUTPUT.

They are copied, not included: the static analyzer looks into no file that
another one includes. What is found is shown with the names and lines of the
source files.
"""
import pathlib
import re
import subprocess
import sys

# Where a fuzz target begins.
BEGIN = "LLVMFuzzerTestOneInput"


def is_include(line: str) -> bool:
    return line.startswith("#include")


def set_apart(lines: list[str], name: str) -> None:
    """Puts what follows the headers into a namespace, on the same lines."""
    first = 1 + max(at for at, line in enumerate(lines) if is_include(line))
    lines[first] = f"namespace {name} {{ {lines[first]}"
    lines[-1] += f" }}  // namespace {name}"


def join(files: list[str]) -> tuple[list[str], list[str]]:
    """All lines of the files, and the place of each. A header that a file before
    has included is left out; its line stays, empty. Programs are set apart, since
    all have a main(), and the beginnings of fuzz targets are numbered."""
    joined: list[str] = []
    places: list[str] = []
    included: set[str] = set()
    for number, file in enumerate(files):
        text = pathlib.Path(file).read_text().replace(BEGIN, f"{BEGIN}{number}")
        lines = text.splitlines()
        headers = set(filter(is_include, lines))
        if "\nint main(" in text:
            set_apart(lines, f"program{number}")
        joined += ["" if line in included else line for line in lines]
        places += [f"{file}:{at}" for at in range(1, len(lines) + 1)]
        included |= headers
    return joined, places


def main(output: str, *words: str) -> int:
    first = words.index("--")
    second = words.index("--", first + 1)
    lines, places = join(list(words[:first]))
    unit = pathlib.Path(output)
    unit.parent.mkdir(parents=True, exist_ok=True)
    unit.write_text("\n".join(lines) + "\n")
    result = subprocess.run(
        [*words[first + 1:second], str(unit), *words[second:]],
        stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True, check=False)
    print(re.sub(re.escape(str(unit)) + r":(\d+)",
                 lambda found: places[int(found[1]) - 1], result.stdout), end="")
    return result.returncode


if __name__ == "__main__":
    sys.exit(main(*sys.argv[1:]))
