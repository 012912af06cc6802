"""The example host programs run to completion against the reference engine."""

import pathlib
import subprocess
import sys

import pytest

EXAMPLES = sorted((pathlib.Path(__file__).parents[2] / "examples").glob("*.py"))


@pytest.mark.parametrize("example", EXAMPLES, ids=lambda path: path.name)
def test_example_runs(example):
    result = subprocess.run([sys.executable, str(example)], capture_output=True, text=True, timeout=120)
    assert result.returncode == 0, result.stderr
