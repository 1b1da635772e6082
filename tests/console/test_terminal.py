"""Progress bar and colours, in a terminal (tmux)."""
import os
import shutil
import subprocess
import time

import pytest

from conftest import TESSEL, some_paths

pytestmark = pytest.mark.skipif(shutil.which("tmux") is None,
                                reason="needs tmux")


class Terminal:
    """A terminal of 100 columns with a shell in it."""

    def __init__(self, folder):
        self.folder = folder
        self.socket = str(folder / "tmux")
        self.run("new-session", "-d", "-x", "100", "-y", "24", "sh")
        self.type("PS1='$ '; export TERM=screen; unset NO_COLOR; clear")

    def run(self, *words):
        return subprocess.run(
            ["tmux", "-S", self.socket, "-f", "/dev/null", *words],
            cwd=self.folder, check=True, stdout=subprocess.PIPE).stdout.decode()

    def type(self, line):
        self.run("send-keys", "-l", line)
        self.run("send-keys", "Enter")

    def screen(self, escapes=False):
        return self.run("capture-pane", "-p", *(["-e"] if escapes else []))

    def wait(self, text):
        for _ in range(3000):  # a minute, so that a failure ends at all
            if text in self.screen():
                return
            time.sleep(0.02)
        assert text in self.screen()

    def close(self):
        self.run("kill-server")


@pytest.fixture
def terminal(tessel):
    shown = Terminal(tessel.folder)
    yield shown
    shown.close()


def test_matches_are_coloured(tessel, terminal):
    tessel.pack([b"lib/readme.txt", b"other"])
    terminal.type(f"{TESSEL} find a.tessel read txt; echo do''ne")
    terminal.wait("done")
    screen = terminal.screen(escapes=True)
    assert "lib/\x1b[1m\x1b[31mread\x1b[0m" in screen, screen
    assert "\x1b[31mtxt\n\x1b[0m" in screen, screen


@pytest.mark.parametrize("prefix,suffix", [
    ("NO_COLOR=1 ", ""), ("TERM=dumb ", ""), ("", " | cat")])
def test_matches_are_plain_otherwise(tessel, terminal, prefix, suffix):
    tessel.pack([b"lib/readme.txt"])
    terminal.type(f"{prefix}{TESSEL} find a.tessel read{suffix}; echo do''ne")
    terminal.wait("done")
    screen = terminal.screen(escapes=True)
    assert "lib/readme.txt" in screen and "\x1b[31m" not in screen


def test_the_bar_comes_and_goes(tessel, terminal):
    os.mkfifo(tessel.folder / "pipe")
    terminal.type(f"{TESSEL} pack pipe -o a.tessel >line; echo do''ne")
    with open(tessel.folder / "pipe", "wb") as pipe:
        paths = some_paths(50000)
        for part in range(10):
            pipe.write(b"".join(p + b"\n" for p in paths))
            time.sleep(0.12)
        terminal.wait("reading")
        assert "/s" in terminal.screen()
    terminal.wait("done")
    screen = terminal.screen()
    assert "reading" not in screen and "packing" not in screen, screen


@pytest.mark.parametrize("command,label,question", [
    ("get", "fetching", b"0\n"), ("number", "looking up", b"path\n")])
def test_the_bar_of_many_questions(tessel, terminal, command, label, question):
    tessel.pack([b"path"])
    os.mkfifo(tessel.folder / "pipe")
    terminal.type(f"{TESSEL} {command} a.tessel - <pipe >out; echo do''ne")
    with open(tessel.folder / "pipe", "wb") as pipe:
        for part in range(8):
            pipe.write(question * 20000)
            pipe.flush()
            time.sleep(0.12)
        terminal.wait(label)
    terminal.wait("done")
    assert label not in terminal.screen()
    assert (tessel.folder / "out").read_bytes().count(b"\n") == 160000


def test_the_bar_is_removed_by_an_interrupt(tessel, terminal):
    os.mkfifo(tessel.folder / "pipe")
    terminal.type(f"{TESSEL} pack pipe -o a.tessel; echo sta''tus $?")
    with open(tessel.folder / "pipe", "wb") as pipe:
        for part in range(8):
            pipe.write(b"path\n" * 20000)
            time.sleep(0.12)
        terminal.wait("reading")
        terminal.run("send-keys", "C-c")
        terminal.wait("status 130")
    assert "reading" not in terminal.screen()
    assert sorted(os.listdir(tessel.folder)) == ["pipe", "tmux"]


@pytest.mark.parametrize("words,redirection", [("-q", ""), ("", "2>err")])
def test_no_bar_if_nobody_wants_it(tessel, terminal, words, redirection):
    os.mkfifo(tessel.folder / "pipe")
    terminal.type(f"{TESSEL} pack {words} pipe -o a.tessel >line {redirection};"
                  " echo do''ne")
    with open(tessel.folder / "pipe", "wb") as pipe:
        for part in range(8):
            pipe.write(b"path\n" * 20000)
            time.sleep(0.12)
            assert "reading" not in terminal.screen()
    terminal.wait("done")
    if redirection:
        assert (tessel.folder / "err").read_bytes() == b""


def test_binary_is_not_written_to_a_terminal(tessel, terminal):
    terminal.type(f"{TESSEL} pack -o - </dev/null; echo sta''tus $?")
    terminal.wait("status 2")
    terminal.type(f"{TESSEL} pack -o x; echo en''ded $?")
    terminal.wait("ended 2")
    assert "no list given" in terminal.screen()
