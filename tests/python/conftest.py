"""Shared fixtures: the scenetool of the same build, the repository's test data, the corpus,
and PLY files written on the spot."""

import json
import os
import pathlib
import subprocess

import numpy as np
import pytest

REPO = pathlib.Path(__file__).resolve().parents[2]
DATA = REPO / "tests" / "data"
CORPUS = REPO.parent / "shared" / "plycorpus" / "files"


@pytest.fixture(scope="session")
def scenetool():
    tool = os.environ.get("MESHPORT_SCENETOOL")
    if not tool:
        pytest.skip("MESHPORT_SCENETOOL names no scenetool (the test workflow sets it)")
    return tool


def run_scenetool(tool, *arguments):
    """scenetool's standard output and exit status."""
    done = subprocess.run([tool, *arguments], capture_output=True, text=True)
    return done.stdout, done.returncode


def scenetool_json(tool, *arguments):
    output, status = run_scenetool(tool, *arguments)
    assert status == 0, f"scenetool {' '.join(arguments)} failed"
    return json.loads(output)


def corpus_files():
    if not CORPUS.is_dir():
        if os.environ.get("CI"):
            raise RuntimeError(f"the PLY corpus is missing: {CORPUS}")
        return []
    return sorted(CORPUS.iterdir())


def ply_header(encoding, elements):
    """A header for `elements`: (name, count, [(type, name) or ("list", count type, item type, name)])."""
    lines = ["ply", f"format {encoding} 1.0"]
    for name, count, properties in elements:
        lines.append(f"element {name} {count}")
        lines += ["property " + " ".join(words) for words in properties]
    lines.append("end_header")
    return ("\n".join(lines) + "\n").encode()


@pytest.fixture
def write_ply(tmp_path):
    """Writes a PLY file from a header and body bytes; gives its path."""

    def write(name, header, body=b""):
        path = tmp_path / name
        path.write_bytes(header + body)
        return path

    return write


def same_values(actual, expected):
    """Array equality bit for bit in the array's own type, NaN equal to NaN."""
    expected = np.asarray(expected, dtype=actual.dtype)
    return actual.shape == expected.shape and np.array_equal(actual, expected, equal_nan=actual.dtype.kind == "f")
