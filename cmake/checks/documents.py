#!/usr/bin/env python3
"""Usage: documents.py [--run FOLDER] PAGE...

Checks what pages of Markdown say against what is there:

  - a relative link leads to a file of ours;
  - the map, docs/architecture.md, names each source file of the core;
  - a block marked cpp is, spaces aside, part of a program of examples/ or of
    hosts/minimal/;
  - with --run, each block marked console is run, in one empty folder per page
    and with FOLDER first in the search path: what follows a line "$ COMMAND"
    is its output. A line "..." stands for any lines. Numbers may differ in a
    block marked "console ~", where they depend on sizes and times.

Prints every difference and ends with status 1 if there is one.
"""
import argparse
import os
import pathlib
import re
import subprocess
import sys
import tempfile

LINK = re.compile(r"\]\(([^)#:]+)(?:#[^)]*)?\)")
MAPPED_ROOMS = ["packing", "pathtree", "coder", "paths", "binding", "qztessel"]
NUMBER = re.compile(r"[0-9][0-9.,]*[0-9]|[0-9]")


def blocks(text, language):
    """The mark and the lines of each fenced block of a language."""
    fence = re.compile(rf"^```{language}( ~)?\n(.*?)^```$", re.M | re.S)
    return [(mark, body.splitlines()) for mark, body in fence.findall(text)]


def broken_links(page, text):
    prose = re.sub(r"^```.*?^```$", "", text, flags=re.M | re.S)
    for target in LINK.findall(prose):
        if not (page.parent / target).exists():
            yield f"no file {target}"


def unmapped_files(page, text):
    """Source files of the core that the map does not name."""
    if page.name != "architecture.md":
        return
    named = set(re.findall(r"\w+", text))
    for room in MAPPED_ROOMS:
        for file in sorted(pathlib.Path(room).glob("*.?pp")):
            if file.stem not in named:
                yield f"does not name {file}"


def without_spaces(text):
    return "".join(text.split())


def strange_code(text, programs):
    for _, block in blocks(text, "cpp"):
        wanted = without_spaces("".join(block))
        if not any(wanted in program for program in programs):
            yield "in no example:\n" + "\n".join(block)


def transcript(block):
    """Pairs of a command and the lines that it is said to write."""
    commands = []
    for line in block:
        if line.startswith("$ "):
            commands.append((line[2:], []))
        else:
            commands[-1][1].append(line)
    return commands


def matches(lines, written):
    if not lines:
        return not written
    if lines[0] == "...":
        return any(matches(lines[1:], written[i:]) for i in range(len(written) + 1))
    return written[:1] == lines[:1] and matches(lines[1:], written[1:])


def output_of(command, folder, programs_folder):
    environment = dict(os.environ, LC_ALL="C.UTF-8")
    environment["PATH"] = f"{programs_folder}:{environment['PATH']}"
    run = subprocess.run(
        ["bash", "-c", command],
        cwd=folder,
        env=environment,
        stdin=subprocess.DEVNULL,
        stdout=subprocess.PIPE,
        stderr=subprocess.STDOUT,
        check=False,
    )
    return run.stdout.decode(errors="replace").splitlines()


def wrong_output(text, programs_folder):
    with tempfile.TemporaryDirectory() as folder:
        for mark, block in blocks(text, "console"):
            for command, lines in transcript(block):
                written = output_of(command, folder, programs_folder)
                shown = "\n".join(written)
                if mark:
                    lines, written = (
                        [NUMBER.sub("N", line) for line in side]
                        for side in (lines, written)
                    )
                if not matches(lines, written):
                    yield f"$ {command}\nwrites\n{shown}"


def main():
    parser = argparse.ArgumentParser()
    parser.add_argument("--run", type=pathlib.Path)
    parser.add_argument("pages", nargs="+", type=pathlib.Path)
    arguments = parser.parse_args()
    programs = [
        without_spaces(file.read_text())
        for folder in ("examples", "hosts/minimal")
        for file in pathlib.Path(folder).glob("*.?pp")
    ]
    found = False
    for page in arguments.pages:
        text = page.read_text()
        complaints = [
            *broken_links(page, text),
            *unmapped_files(page, text),
            *strange_code(text, programs),
        ]
        if arguments.run:
            complaints += wrong_output(text, arguments.run.resolve())
        for complaint in complaints:
            found = True
            print(f"{page}: {complaint}\n")
    return found


if __name__ == "__main__":
    sys.exit(main())
