"""Builds the Python package: CMake makes the module, setuptools the wheel.

    python3 -m build --no-isolation

QZTESSEL_PYTHON_BUILD may name a CMake build folder whose module is taken as it
is; otherwise one is built.
"""

import os
import pathlib
import re
import shutil
import subprocess
import sys

from setuptools import Extension, setup
from setuptools.command.build_ext import build_ext

ROOT = pathlib.Path(__file__).resolve().parent
OPTIONS = {
    "CMAKE_BUILD_TYPE": "Release",
    "Python_EXECUTABLE": sys.executable,
    "QZTESSEL_BUILD_PYTHON": "ON",
    "QZTESSEL_BUILD_BENCH": "OFF",
    "QZTESSEL_BUILD_COMMAND": "OFF",
    "QZTESSEL_BUILD_EXAMPLES": "OFF",
    "QZTESSEL_BUILD_TESTS": "OFF",
    "QZTESSEL_INSTALL": "OFF",
}


class CMakeBuild(build_ext):
    """Takes the module from a build of CMake's."""

    def build_extension(self, ext):
        target = pathlib.Path(self.get_ext_fullpath(ext.name))
        folder = os.environ.get("QZTESSEL_PYTHON_BUILD") or self.build_with_cmake()
        module = pathlib.Path(folder, "hosts/python/qztessel", target.name)
        target.parent.mkdir(parents=True, exist_ok=True)
        shutil.copyfile(module, target)

    def build_with_cmake(self):
        folder = pathlib.Path(self.build_temp).resolve()
        options = [f"-D{name}={value}" for name, value in OPTIONS.items()]
        configure = ["cmake", "-S", ROOT, "-B", folder, "-G", "Ninja", *options]
        subprocess.run(configure, check=True)
        build = ["cmake", "--build", folder, "--target", "qztessel_python"]
        subprocess.run(build, check=True)
        return folder


def version():
    header = (ROOT / "qztessel/Version.hpp").read_text()
    return re.search(r'versionText\[\] = "(.*)"', header)[1]


setup(
    version=version(),
    ext_modules=[Extension("qztessel._core", sources=[])],
    cmdclass={"build_ext": CMakeBuild},
)
