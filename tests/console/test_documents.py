"""Manual pages and completions name exactly the flags that --help lists."""
import os
import pathlib
import re
import shutil
import subprocess

import pytest

ROOT = pathlib.Path(__file__).resolve().parents[2] / "hosts" / "console"
COMMANDS = ["pack", "list", "get", "find", "number", "info", "verify", "diff",
            "export"]


def flags_of_help(tessel, command):
    text = tessel(command, "--help").out.decode()
    options = text.split("\nOptions:\n")[1].split("\nExamples:")[0]
    return set(re.findall(r"^  (--?[a-z0-9][a-z0-9-]*)", options, re.M))


@pytest.mark.parametrize("command", COMMANDS)
def test_manual_pages(tessel, command):
    text = (ROOT / "man" / f"tessel-{command}.1.scd").read_text()
    options = text.split("# OPTIONS")[1].split("# EXAMPLES")[0]
    flags = set(re.findall(r"^\*(--?[a-z0-9][a-z0-9-]*)\*", options, re.M))
    assert flags == flags_of_help(tessel, command)


def test_the_general_page_names_all_commands():
    text = (ROOT / "man" / "tessel.1.scd").read_text()
    assert re.findall(r"^\*tessel-([a-z]+)\*\(1\)", text, re.M) == COMMANDS


@pytest.mark.skipif(shutil.which("scdoc") is None, reason="needs scdoc")
@pytest.mark.parametrize("page", ["tessel"] + [f"tessel-{c}" for c in COMMANDS])
def test_manual_pages_are_well_formed(page):
    source = (ROOT / "man" / f"{page}.1.scd").read_bytes()
    done = subprocess.run(["scdoc"], input=source, check=True,
                          stdout=subprocess.PIPE, stderr=subprocess.PIPE)
    assert done.stderr == b"" and f'"{page}"'.encode() in done.stdout


def bash_completions(line):
    script = f"""
        source {ROOT}/completions/tessel.bash
        COMP_WORDS=({line}); [[ '{line}' == *' ' ]] && COMP_WORDS+=('')
        COMP_CWORD=$((${{#COMP_WORDS[@]}} - 1))
        compopt() {{ :; }}
        _tessel
        printf '%s\\n' "${{COMPREPLY[@]}}"
    """
    return subprocess.run(["bash", "-c", script], check=True,
                          stdout=subprocess.PIPE).stdout.decode().split()


def test_bash(tessel):
    assert set(bash_completions("tessel ")) == \
        set(COMMANDS) | {"--help", "--version"}
    for command in COMMANDS:
        assert set(bash_completions(f"tessel {command} -")) == \
            flags_of_help(tessel, command)
    assert bash_completions("tessel pack --level n") == ["normal"]


@pytest.mark.skipif(shutil.which("fish") is None, reason="needs fish")
def test_fish(tessel):
    def complete(line):
        script = f"source {ROOT}/completions/tessel.fish; complete -C'{line}'"
        out = subprocess.run(
            ["fish", "--no-config", "-c", script], check=True,
            env={**os.environ, "HOME": str(tessel.folder)},
            cwd=tessel.folder, stdout=subprocess.PIPE).stdout.decode()
        return {line.split("\t")[0] for line in out.splitlines()}

    assert complete("tessel ") == set(COMMANDS)
    for command in COMMANDS:
        flags = complete(f"tessel {command} -") | complete(f"tessel {command} --")
        assert flags == flags_of_help(tessel, command)
    assert complete("tessel pack --level n") == {"normal"}


def test_zsh(tessel):
    text = (ROOT / "completions" / "_tessel").read_text()
    common = set(re.findall(r"^        '(--?[a-z0-9][a-z0-9-]*)\[", text, re.M))
    for command in COMMANDS:
        part = re.search(rf"^    {command}\)\n(.*?)\n        ;;", text,
                         re.M | re.S)[1]
        flags = set(re.findall(r"'(?:\([^)]*\))?(--?[a-z0-9][a-z0-9-]*)\[", part))
        assert flags | common == flags_of_help(tessel, command)
    if shutil.which("zsh"):
        subprocess.run(["zsh", "-n", ROOT / "completions" / "_tessel"],
                       check=True)
