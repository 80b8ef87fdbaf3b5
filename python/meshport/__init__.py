"""Meshport from Python: PLY files into NumPy arrays, and scenes through the scene plug-ins.

read_ply(path)
    A PLY file's raw elements as NumPy arrays by element and property name, as written.
import_scene(path, decode=True, **parameters)
    The real import through the scene plug-ins: a Scene whose objects hold their attributes,
    mesh lists as read-only NumPy arrays over the scene's storage.

Failures raise meshport.Error or one of its subclasses NotFoundError, UnsupportedError and
CorruptError, with the reader's own message. Warnings of a read or an import go to the
"meshport" logger of the logging module.

The package folder holds the compiled module, the core library base1 and the scene plug-ins
(scene_*) side by side, and data/ with importers.txt and the attribute descriptions; the
module loads its plug-ins and data from there, in the build tree and once installed alike.
"""

try:
    import numpy as _numpy  # noqa: F401  (the arrays need it; a clear message if it is missing)
except ImportError as missing:
    raise ImportError(
        "meshport needs NumPy: run it with the interpreter NumPy is installed for "
        "(on Debian, /usr/bin/python3 with the python3-numpy package)"
    ) from missing

from ._meshport import (
    CorruptError,
    Error,
    NotFoundError,
    Scene,
    SceneObject,
    UnsupportedError,
    import_scene,
    read_ply,
)

__all__ = [
    "CorruptError",
    "Error",
    "NotFoundError",
    "Scene",
    "SceneObject",
    "UnsupportedError",
    "import_scene",
    "read_ply",
]
