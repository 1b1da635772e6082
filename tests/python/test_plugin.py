"""Where the plug-in is found, and how its host lives in a process."""

import os
import pathlib
import shutil
import subprocess
import sys

import pytest
import qztessel
from qztessel import _host

PACKAGE = pathlib.Path(qztessel.__file__).parent
PLUGIN = "libqztessel.so"

KEEP_ONE_PATH = """
import qztessel
def kept():
    paths = qztessel.HuffmanPaths("files", ["/", ["a"]])
    paths.add_paths([["/"]], [["a"]])
    return paths
def check(paths):
    assert paths.get_paths([1], "/") == ["/a"]
"""


def run(script, package=PACKAGE, **environment):
    """Runs a script in a process of its own; returns what it wrote."""
    done = subprocess.run(
        [sys.executable, "-c", script],
        env={**os.environ, "PYTHONPATH": str(package.parent), **environment},
        capture_output=True,
        text=True,
        check=False,
    )
    assert (done.returncode, done.stderr) == (0, "")
    return done.stdout


@pytest.fixture
def bare(tmp_path):
    """The package without the plug-in."""
    folder = tmp_path / "bare" / "qztessel"
    shutil.copytree(PACKAGE, folder, ignore=shutil.ignore_patterns(PLUGIN))
    return folder


def failure_of(statement):
    return (
        "import qztessel\n"
        f"try: {statement}\n"
        "except Exception as error: print(type(error).__name__, error)"
    )


# ---- Where it is found ----


@pytest.mark.skipif(
    _host.installed_plugin() is not None, reason="the plug-in is installed"
)
def test_package_works_without_the_plugin(bare, tmp_path):
    script = "from qztessel import PathList; print(PathList.pack(['a'])[0])"
    assert run(script, bare) == "a\n"
    line = run(failure_of("qztessel.HuffmanPaths()"), bare)
    assert line.startswith("FileNotFoundError the plug-in libqztessel.so is not in ")
    assert str(bare) in line
    assert line.endswith("install libqztessel1, or set QZTESSEL_PLUGIN to its file\n")


def test_variable_names_the_plugin(bare, tmp_path):
    script = "print(qztessel.load_plugin()); check(kept())"
    plugin = shutil.copy(PACKAGE / PLUGIN, tmp_path)
    for package in (bare, PACKAGE):
        written = run(KEEP_ONE_PATH + script, package, QZTESSEL_PLUGIN=plugin)
        assert written == f"{plugin}\n"


def test_argument_comes_before_the_variable(bare, tmp_path):
    plugin = shutil.copy(PACKAGE / PLUGIN, tmp_path)
    script = f"print(qztessel.load_plugin({plugin!r})); check(kept())"
    written = run(KEEP_ONE_PATH + script, bare, QZTESSEL_PLUGIN="/none")
    assert written == f"{plugin}\n"


def test_loader_finds_the_installed_plugin(bare, tmp_path):
    installed = pathlib.Path(shutil.copy(PACKAGE / PLUGIN, tmp_path / f"{PLUGIN}.1"))
    script = "print(qztessel.load_plugin()); check(kept())"
    written = run(KEEP_ONE_PATH + script, bare, LD_LIBRARY_PATH=str(tmp_path))
    assert written == f"{installed}\n"


def test_named_file_is_missing():
    script = failure_of("qztessel.HuffmanPaths()")
    line = run(script, QZTESSEL_PLUGIN="/none/libqztessel.so")
    assert line == (
        "FileNotFoundError there is no plug-in '/none/libqztessel.so'; "
        "QZTESSEL_PLUGIN names it\n"
    )
    line = run(failure_of("qztessel.load_plugin('/none')"))
    assert line == "FileNotFoundError there is no plug-in '/none'\n"


def test_named_file_is_no_plugin_and_another_one_is_taken_then(tmp_path):
    file = tmp_path / PLUGIN
    file.write_text("no library")
    script = f"""
try: qztessel.load_plugin({str(file)!r})
except qztessel.HostError as error: print(error.identifier)
check(kept())
"""
    assert run(KEEP_ONE_PATH + script) == "VELOX:embedded:moduleUnreadable\n"


def test_second_plugin_is_refused(tmp_path):
    other = shutil.copy(PACKAGE / PLUGIN, tmp_path)
    own = qztessel.load_plugin()
    assert qztessel.load_plugin(own) == own
    with pytest.raises(ValueError, match="a process loads only one"):
        qztessel.load_plugin(other)


def test_process_with_a_host_of_its_own(tmp_path):
    other = shutil.copy(next(PACKAGE.glob("_host.*.so")), tmp_path / "host.so")
    line = run(failure_of("qztessel.HuffmanPaths()"), LD_PRELOAD=str(other))
    assert line.startswith("RuntimeError This process has a host of its own")


def test_messages_are_missing(bare, tmp_path):
    shutil.rmtree(bare / "messages")
    line = run(
        failure_of("qztessel.HuffmanPaths()"),
        bare,
        QZTESSEL_PLUGIN=str(PACKAGE / PLUGIN),
    )
    assert line.startswith("FileNotFoundError the plug-in's messages are neither in ")


def test_import_loads_no_host():
    script = "import qztessel, sys; print('qztessel._host' in sys.modules)"
    assert run(script) == "False\n"


def test_module_shows_only_its_two_symbols():
    names = subprocess.run(
        ["nm", "-D", "--defined-only", next(PACKAGE.glob("_host.*.so"))],
        capture_output=True,
        text=True,
        check=True,
    ).stdout.split()[2::3]
    assert sorted(names) == ["PyInit__host", "VXHostInterface"]


# ---- Exit, fork ----


@pytest.mark.parametrize(
    "script",
    [
        "paths = kept(); paths.reset()",
        "import sys; sys.kept = [kept(), kept()]; sys.kept.append(sys.kept)",
        "import atexit; atexit.register(check, kept())",
        "paths = kept(); del qztessel; import sys; sys.modules.clear()",
        "class C:\n  def __del__(self): self.paths.reset()\n"
        "kept_by = C(); kept_by.paths = kept()",
        "import threading\npaths = kept()\n"
        "threading.Thread(target=lambda: [check(paths) for _ in range(1000)]).start()",
        "import threading, time\npaths = kept()\n"
        "def work():\n  while True: check(paths)\n"
        "threading.Thread(target=work, daemon=True).start()\ntime.sleep(0.05)",
    ],
)
def test_interpreter_ends_with_instances_alive(script):
    assert run(KEEP_ONE_PATH + script) == ""


def test_children_go_on_with_instances():
    script = """
import os
paths = kept()
child = os.fork()
check(paths)
check(kept())
if child == 0: os._exit(7)
print(os.waitstatus_to_exitcode(os.waitpid(child, 0)[1]))
"""
    assert run(KEEP_ONE_PATH + script) == "7\n"


def test_fork_while_another_thread_calls():
    script = """
import os, threading
done = False
names = [f"{i:05}" for i in range(10000)]
large = qztessel.HuffmanPaths("files", ["/", names])
large.add_paths([["/"]], [names])
def work():
    while not done: large.serialize()
thread = threading.Thread(target=work)
thread.start()
for _ in range(20):
    child = os.fork()
    if child == 0:
        check(kept())
        os._exit(0)
    assert os.waitpid(child, 0)[1] == 0
done = True
thread.join()
"""
    assert run(KEEP_ONE_PATH + script) == ""


def test_instances_end_with_their_last_reference():
    script = """
import resource
def peak(): return resource.getrusage(resource.RUSAGE_SELF).ru_maxrss
folders, files = [["/"]], [[f"{i:07}" for i in range(100000)]]
def fill():
    paths = qztessel.HuffmanPaths("files", folders + files)
    paths.add_paths(folders, files)
for _ in range(3): fill()
first = peak()
for _ in range(10): fill()
print(peak() - first)
"""
    # In KiB; an instance that stayed would take some 2,000.
    assert int(run(KEEP_ONE_PATH + script)) < 10_000
