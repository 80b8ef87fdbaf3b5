"""meshport.import_scene: the scene scenetool imports, arrays that share the scene's storage,
decoded faces, parameters and failures."""

import concurrent.futures
import gc

import numpy as np
import pytest

import meshport
from conftest import DATA, corpus_files, ply_header, run_scenetool, scenetool_json

VALID = sorted((DATA / "ply" / "valid").glob("*.ply"))


def assert_same(value, stored, where):
    """A Python attribute against its JSON form from scenetool."""
    if isinstance(value, np.ndarray):
        expected = np.asarray(stored, dtype=value.dtype).reshape(value.shape)
        assert np.array_equal(value, expected, equal_nan=value.dtype.kind == "f"), where
    elif isinstance(value, dict):
        # The JSON form keys each member as "name^type".
        stored = {key.rpartition("^")[0] or key: member for key, member in stored.items()}
        assert sorted(value) == sorted(stored), where
        for name in value:
            assert_same(value[name], stored[name], f"{where}/{name}")
    elif isinstance(value, list):
        assert len(value) == len(stored), where
        for k, (item, stored_item) in enumerate(zip(value, stored)):
            assert_same(item, stored_item, f"{where}[{k}]")
    elif isinstance(value, float):
        assert np.float32(value) == np.float32(stored) or (np.isnan(value) and stored == "NaN"), where
    else:
        assert value == stored, where


@pytest.mark.parametrize("path", VALID + [p for p in corpus_files() if p.stat().st_size < 1 << 20],
                         ids=lambda path: path.name)
def test_objects_and_summary_are_those_scenetool_imports(scenetool, path):
    output, status = run_scenetool(scenetool, "import", str(path))
    if status != 0:
        with pytest.raises(meshport.Error):
            meshport.import_scene(path)
        return
    imported = meshport.import_scene(path, decode=False)
    assert imported.summary() == output[:output.rindex("imported ")]
    dumped = scenetool_json(scenetool, "import", "--json", str(path))["objects"]
    assert [(o.index, o.type) for o in imported.objects] == [(o["index"], o["type"]) for o in dumped]
    for mine, stored in zip(imported.objects, dumped):
        assert_same(mine.attributes, stored["attributes"], f"{path.name}: object {mine.index}")


def faces_of(indices, counts):
    """Each face rotated to start at its smallest index, in sorted order."""
    faces, start = [], 0
    for n in counts:
        face = list(indices[start:start + n])
        first = face.index(min(face))
        faces.append(tuple(face[first:] + face[:first]))
        start += n
    return sorted(faces)


@pytest.mark.parametrize("name", ["ascii_cube_quads.ply", "binary_le_cube_triangles.ply"])
def test_decoded_faces_are_the_files_faces(name):
    path = DATA / "ply" / "valid" / name
    face = meshport.read_ply(path)["face"]
    written = next(column for key, column in face.items() if key.startswith("vertex_ind"))
    mesh = meshport.import_scene(path).objects[0].attributes
    width = written.shape[1]
    assert mesh["indicesDeltaCompression"] is False
    assert faces_of(mesh["indices"].tolist(), [width] * len(written)) == faces_of(written.ravel().tolist(),
                                                                                  [width] * len(written))
    stored = meshport.import_scene(path, decode=False).objects[0].attributes
    assert stored["indicesDeltaCompression"] is True
    assert not np.array_equal(stored["indices"], mesh["indices"])


def big_mesh(write_ply, vertices=1 << 20):
    positions = np.arange(vertices * 3, dtype="<f4")
    faces = np.zeros(vertices // 2, dtype=[("n", "u1"), ("v", "<i4", 3)])
    faces["n"] = 3
    faces["v"] = np.arange(vertices // 2 * 3).reshape(-1, 3) % vertices
    header = ply_header("binary_little_endian", [
        ("vertex", vertices, [("float", "x"), ("float", "y"), ("float", "z")]),
        ("face", len(faces), [("list", "uchar", "int", "vertex_indices")])])
    return write_ply("big.ply", header, positions.tobytes() + faces.tobytes()), positions.reshape(-1, 3)


def test_lists_share_the_scenes_storage_and_keep_it_alive(write_ply):
    path, positions = big_mesh(write_ply)
    imported = meshport.import_scene(path, decode=False)
    first = imported.objects[0].attributes
    again = imported.objects[0].attributes
    for name in ["positions", "indices"]:
        # Two views of the same storage: no copy was made for either.
        assert first[name].ctypes.data == again[name].ctypes.data
        assert not first[name].flags.writeable and not first[name].flags.owndata
    with pytest.raises(ValueError):
        first["positions"][0, 0] = 1.0
    kept = first["positions"]
    del imported, first, again
    gc.collect()
    assert np.array_equal(kept, positions)


def test_decoded_indices_are_made_once_per_scene(write_ply):
    path, _ = big_mesh(write_ply, vertices=1 << 12)
    imported = meshport.import_scene(path)
    assert imported.objects[0].attributes["indices"].ctypes.data == imported.objects[0].attributes["indices"].ctypes.data


def test_parameters_reach_the_importer():
    path = DATA / "ply" / "valid" / "ascii_unknown_elements_and_properties.ply"
    plain = meshport.import_scene(path).objects[0].attributes
    kept = meshport.import_scene(path, importCustomProperties=True).objects[0].attributes
    assert not any(name.startswith("ply:") for name in plain)
    assert any(name.startswith("ply:") for name in kept)
    with pytest.raises(TypeError, match="unexpected parameter 'noSuchParameter'"):
        meshport.import_scene(path, noSuchParameter=1)
    with pytest.raises(ValueError, match="importCustomProperties: 'perhaps' is no bool"):
        meshport.import_scene(path, importCustomProperties="perhaps")


def test_failures_raise_the_modules_exceptions(tmp_path, write_ply):
    with pytest.raises(meshport.NotFoundError, match="nothing.ply: no such file"):
        meshport.import_scene(tmp_path / "nothing.ply")
    other = tmp_path / "mesh.xyz"
    other.write_text("1 2 3\n")
    with pytest.raises(meshport.UnsupportedError, match="mesh.xyz: no scene plug-in imports this kind of file"):
        meshport.import_scene(other)
    with pytest.raises(meshport.CorruptError, match="bad.ply: Invalid .ply file: Missing format"):
        meshport.import_scene(write_ply("bad.ply", b"ply\nelement vertex 1\nend_header\n"))


@pytest.mark.parametrize("path", sorted((DATA / "ply" / "invalid").glob("*.ply")), ids=lambda path: path.name)
def test_hostile_files_import_or_raise_the_modules_exception(scenetool, path):
    _, status = run_scenetool(scenetool, "import", str(path))
    if status == 0:
        assert meshport.import_scene(path).objects
    else:
        with pytest.raises(meshport.Error):
            meshport.import_scene(path)


def test_imports_on_several_threads_give_what_one_gives():
    paths = VALID * 3
    alone = [meshport.import_scene(path).summary() for path in paths]
    with concurrent.futures.ThreadPoolExecutor(max_workers=4) as pool:
        together = list(pool.map(lambda path: meshport.import_scene(path).summary(), paths))
    assert together == alone
