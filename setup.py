"""Builds the Python package: CMake makes the modules, setuptools the wheel.

    python3 -m build --no-isolation

QZTESSEL_PYTHON_BUILD may name a CMake build folder whose modules are taken as
they are; otherwise they are built.
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
PLUGIN = "libqztessel.so"
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
    """Takes the modules, the plug-in and its messages from a build of CMake's."""

    def run(self):
        folder = os.environ.get("QZTESSEL_PYTHON_BUILD") or self.build_with_cmake()
        self.built = pathlib.Path(folder, "hosts/python/qztessel")
        super().run()
        target = pathlib.Path(self.get_ext_fullpath("qztessel._host")).parent
        shutil.copyfile(self.built / PLUGIN, target / PLUGIN)
        shutil.copytree(
            self.built / "messages", target / "messages", dirs_exist_ok=True
        )

    def build_extension(self, ext):
        target = pathlib.Path(self.get_ext_fullpath(ext.name))
        target.parent.mkdir(parents=True, exist_ok=True)
        shutil.copyfile(self.built / target.name, target)

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
    ext_modules=[
        Extension(f"qztessel.{name}", sources=[]) for name in ("_core", "_host")
    ],
    cmdclass={"build_ext": CMakeBuild},
)
