"""meshport.read_ply: raw values against scenetool's dump, every type through NumPy, and
files that are not what they claim."""

import gzip
import subprocess

import numpy as np
import pytest

import meshport
from conftest import DATA, corpus_files, ply_header, same_values, scenetool_json

DTYPES = {"char": "i1", "uchar": "u1", "short": "i2", "ushort": "u2", "int": "i4", "uint": "u4",
          "float": "f4", "double": "f8"}


def columns_of(element, described):
    """(property, values, counts) in header order; counts only for lists of differing lengths."""
    entries = iter(element.items())
    for prop in described["properties"]:
        name, values = next(entries)
        counts = None
        if prop["list"] and values.ndim == 1:
            counts_name, counts = next(entries)
            assert counts_name == name + ".counts"
        yield prop, values, counts


def assert_element_matches(element, described, encoding):
    rows = described["instances"]
    for p, (prop, values, counts) in enumerate(columns_of(element, described)):
        expected = [row[p] for row in rows]
        declared = np.dtype(DTYPES[prop["type"]])
        if values.dtype != declared:
            # Only ASCII integers that leave their type's range come back wider.
            assert encoding == "ascii" and values.dtype.itemsize == 4 and values.dtype.kind == declared.kind
        if not prop["list"]:
            assert same_values(values, expected)
        elif counts is None:
            assert same_values(values, np.asarray(expected, dtype=values.dtype).reshape(len(rows), -1))
        else:
            assert counts.dtype == np.uint32
            assert counts.tolist() == [len(items) for items in expected]
            assert same_values(values, [item for items in expected for item in items])


@pytest.mark.parametrize("path", corpus_files(), ids=lambda path: path.name)
def test_corpus_values_are_those_scenetool_shows(scenetool, path):
    done = subprocess.run([scenetool, "ply", "--values", "--json", str(path)], capture_output=True, text=True)
    if done.returncode != 0:
        with pytest.raises(meshport.CorruptError) as raised:
            meshport.read_ply(path)
        assert done.stderr.strip().splitlines()[-1] == f"scenetool: error: {raised.value}"
        return
    dumped = scenetool_json(scenetool, "ply", "--values", "--json", str(path))
    elements = meshport.read_ply(path)
    assert len(elements) == len(dumped["elements"])
    for element, described in zip(elements.values(), dumped["elements"]):
        assert_element_matches(element, described, dumped["format"])


@pytest.mark.parametrize("path", sorted((DATA / "ply" / "valid").glob("*.ply")), ids=lambda path: path.name)
def test_conformance_files_read_as_scenetool_shows(scenetool, path):
    dumped = scenetool_json(scenetool, "ply", "--values", "--json", str(path))
    elements = meshport.read_ply(path)
    for element, described in zip(elements.values(), dumped["elements"]):
        assert_element_matches(element, described, dumped["format"])


def typed_vertices(count, byte_order):
    """A record array with a property of every type, values that reach each type's ends."""
    rng = np.random.default_rng(7)
    fields = [(name, byte_order + code) for name, code in
              [("c", "i1"), ("uc", "u1"), ("s", "i2"), ("us", "u2"), ("i", "i4"), ("ui", "u4"), ("f", "f4"),
               ("d", "f8")]]
    records = np.zeros(count, dtype=fields)
    for name, code in fields:
        kind = np.dtype(code)
        if kind.kind == "f":
            records[name] = rng.standard_normal(count) * 1e6
        else:
            limits = np.iinfo(kind)
            records[name] = rng.integers(limits.min, limits.max, size=count, endpoint=True)
    records["f"][:3] = [np.nan, np.inf, -np.inf]
    return records


TYPE_WORDS = ["char", "uchar", "short", "ushort", "int", "uint", "float", "double"]


@pytest.mark.parametrize("encoding,order", [("binary_little_endian", "<"), ("binary_big_endian", ">")])
def test_every_type_comes_back_bit_for_bit_in_its_own_dtype(write_ply, encoding, order):
    records = typed_vertices(1000, order)
    header = ply_header(encoding, [("vertex", len(records), [(word, name) for word, name in
                                                             zip(TYPE_WORDS, records.dtype.names)])])
    elements = meshport.read_ply(write_ply("typed.ply", header, records.tobytes()))
    for name in records.dtype.names:
        column = elements["vertex"][name]
        assert column.dtype == records.dtype[name].newbyteorder("=")
        assert same_values(column, records[name])


def test_lists_are_rows_when_equal_and_items_with_counts_otherwise(write_ply):
    # A list of 70,000 items among short ones: longer than any list length the reader
    # counts in 16 bits.
    lengths = [3, 3, 70000, 0, 5]
    body = bytearray()
    for n, length in enumerate(lengths):
        body += np.array([length], "<u4").tobytes() + np.arange(n, n + length, dtype="<i2").tobytes()
        body += np.array([3], "u1").tobytes() + np.array([n, n + 1, n + 2], "<f8").tobytes()
        body += np.array([2], "u1").tobytes() + np.array([n * 0.5, -n], "<f4").tobytes()
    header = ply_header("binary_little_endian", [("face", len(lengths), [
        ("list", "uint", "short", "ragged"), ("list", "uchar", "double", "triples"),
        ("list", "uchar", "float", "pairs")])])
    face = meshport.read_ply(write_ply("lists.ply", header, bytes(body)))["face"]
    assert list(face) == ["ragged", "ragged.counts", "triples", "pairs"]
    assert face["ragged.counts"].tolist() == lengths
    assert face["ragged"].dtype == np.int16
    assert same_values(face["ragged"], np.concatenate([np.arange(n, n + k) for n, k in enumerate(lengths)]))
    assert face["triples"].shape == (5, 3) and face["triples"].dtype == np.float64
    assert same_values(face["triples"], [[n, n + 1, n + 2] for n in range(5)])
    assert same_values(face["pairs"], [[n * 0.5, -n] for n in range(5)])


def test_ascii_integers_beyond_their_type_come_back_in_32_bits(write_ply):
    header = ply_header("ascii", [("vertex", 3, [("uchar", "wide"), ("uchar", "fits"), ("char", "negative"),
                                                 ("ushort", "big"), ("list", "uchar", "char", "items")])])
    body = b"300 1 -200 70000 2 1 -129\n255 2 -1 1 2 5 6\n0 3 127 0 2 7 8\n"
    vertex = meshport.read_ply(write_ply("wide.ply", header, body))["vertex"]
    assert vertex["wide"].dtype == np.uint32 and vertex["wide"].tolist() == [300, 255, 0]
    assert vertex["fits"].dtype == np.uint8 and vertex["fits"].tolist() == [1, 2, 3]
    assert vertex["negative"].dtype == np.int32 and vertex["negative"].tolist() == [-200, -1, 127]
    assert vertex["big"].dtype == np.uint32 and vertex["big"].tolist() == [70000, 1, 0]
    assert vertex["items"].dtype == np.int32 and vertex["items"].tolist() == [[1, -129], [5, 6], [7, 8]]


def test_names_stay_as_written_and_repeats_are_numbered(write_ply):
    header = ply_header("ascii", [("vertex", 1, [("float", "u"), ("float", "s"), ("float", "texture_u"),
                                                 ("float", "s")]), ("vertex", 1, [("float", "x")])])
    elements = meshport.read_ply(write_ply("names.ply", header, b"1 2 3 4\n5\n"))
    assert list(elements) == ["vertex", "vertex.2"]
    assert {name: column.tolist() for name, column in elements["vertex"].items()} == {
        "u": [1.0], "s": [2.0], "texture_u": [3.0], "s.2": [4.0]}


def test_names_in_any_encoding_are_keys_with_what_is_not_utf8_replaced():
    elements = meshport.read_ply(DATA / "ply" / "valid" / "ascii_names_not_ascii.ply")
    assert list(elements) == ["donn\u00e9es", "vertex", "face"]
    assert list(elements["vertex"])[-1] == "\u00e9t\u00e9"
    assert list(elements["face"])[1:] == ["qualit\ufffd", "\ufffdtiquettes", "\ufffdtiquettes.counts"]
    mesh = meshport.import_scene(DATA / "ply" / "valid" / "ascii_names_not_ascii.ply",
                                 importCustomProperties=True).objects[0].attributes
    assert mesh["ply:\u00e9t\u00e9"].tolist() == [0.5, 1.5, 2.5, 3.5]
    assert "ply:qualit\ufffd" in mesh


def test_compressed_files_read_like_plain_ones(tmp_path):
    plain = DATA / "ply" / "valid" / "binary_le_cube_triangles.ply"
    packed = tmp_path / "cube.ply.gz"
    packed.write_bytes(gzip.compress(plain.read_bytes()))
    expected = meshport.read_ply(plain)
    actual = meshport.read_ply(packed)
    assert expected.keys() == actual.keys()
    for name in expected:
        assert all(same_values(actual[name][key], column) for key, column in expected[name].items())


def test_failures_raise_the_modules_exceptions_with_the_cause(tmp_path, write_ply):
    missing = tmp_path / "missing.ply"
    with pytest.raises(meshport.NotFoundError, match="missing.ply: no such file"):
        meshport.read_ply(missing)
    assert issubclass(meshport.NotFoundError, FileNotFoundError)
    with pytest.raises(meshport.CorruptError, match="Missing format"):
        meshport.read_ply(write_ply("no_format.ply", b"ply\nelement vertex 1\nend_header\n"))
    header = ply_header("binary_little_endian", [("face", 2, [("list", "uchar", "int", "vertex_indices")])])
    with pytest.raises(meshport.CorruptError, match="short.ply: The data ends early in element 'face'"):
        meshport.read_ply(write_ply("short.ply", header, bytes([3]) + bytes(8)))
    damaged = tmp_path / "damaged.ply.gz"
    damaged.write_bytes(gzip.compress(header + bytes(32))[:-12])
    with pytest.raises(meshport.CorruptError, match="damaged.ply.gz: the compressed data"):
        meshport.read_ply(damaged)
    with pytest.raises(meshport.Error):
        meshport.read_ply(tmp_path)


def test_an_ascii_instance_the_reader_skips_keeps_the_rows_in_step(write_ply, caplog):
    header = ply_header("ascii", [("face", 3, [("uchar", "flag"), ("list", "uchar", "int", "vertex_indices")])])
    face = meshport.read_ply(write_ply("skip.ply", header, b"1 3 0 1 2\n2 3 # 1 2\n3 3 4 5 6\n"))["face"]
    assert face["flag"].tolist() == [1, 2, 3]
    assert face["vertex_indices.counts"].tolist() == [3, 0, 3]
    assert face["vertex_indices"].tolist() == [0, 1, 2, 4, 5, 6]
    assert "Skipping this element instance" in caplog.text


HOSTILE = sorted((DATA / "ply" / "invalid").glob("*.ply")) + sorted(
    (DATA.parents[1] / "fuzz" / "regressions").glob("*/*.ply"))


@pytest.mark.parametrize("path", HOSTILE, ids=lambda path: f"{path.parent.name}/{path.name}")
def test_hostile_files_give_values_or_the_modules_exception(path):
    try:
        elements = meshport.read_ply(path)
    except meshport.Error:
        return
    for element in elements.values():
        for column in element.values():
            assert column.flags.c_contiguous


def test_counts_beyond_the_file_cost_no_memory(write_ply):
    header = ply_header("binary_little_endian", [("vertex", 4000000000, [("double", "x")])])
    with pytest.raises(meshport.CorruptError):
        meshport.read_ply(write_ply("huge.ply", header, bytes(64)))
