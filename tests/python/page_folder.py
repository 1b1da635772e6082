"""A plug-in of pytest: examples run in an empty folder of their own."""

import pytest


@pytest.fixture(autouse=True)
def _in_empty_folder(tmp_path, monkeypatch):
    monkeypatch.chdir(tmp_path)
