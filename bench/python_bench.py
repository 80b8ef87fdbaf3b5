#!/usr/bin/env python3
"""Times meshport.read_ply and meshport.import_scene on the generated benchmark files against
the floor: NumPy reading the same layout with fromfile, knowing it in advance.

usage: python_bench.py FOLDER [RUNS]

FOLDER holds the files ply_bench writes (meshport-bench under the temporary directory). The
package must be importable (PYTHONPATH=build/release/python). Prints a Markdown table of
medians; scripts/bench puts it into docs/performance.md.
"""

import gc
import pathlib
import statistics
import sys
import time

import numpy as np

import meshport

FILES = [
    ("mesh, binary little-endian", "mesh_binary_little_endian_9g.ply"),
    ("mesh, binary big-endian", "mesh_binary_big_endian_9g.ply"),
    ("mesh, ASCII", "mesh_ascii_9g.ply"),
    ("cloud, binary little-endian", "cloud_binary_little_endian_9g.ply"),
    ("cloud, ASCII", "cloud_ascii_9g.ply"),
]
CODES = {"char": "i1", "uchar": "u1", "short": "i2", "ushort": "u2", "int": "i4", "uint": "u4", "float": "f4",
         "double": "f8"}


def header_of(path):
    """(encoding, header bytes, [(element, count, [(name, type, list count type or None)])])."""
    with open(path, "rb") as file:
        head = file.read(1 << 16)
    size = head.index(b"end_header\n") + len(b"end_header\n")
    encoding, elements = None, []
    for line in head[:size].decode().splitlines():
        words = line.split()
        if words[0] == "format":
            encoding = words[1]
        elif words[0] == "element":
            elements.append((words[1], int(words[2]), []))
        elif words[0] == "property" and words[1] == "list":
            elements[-1][2].append((words[4], words[3], words[2]))
        elif words[0] == "property":
            elements[-1][2].append((words[2], words[1], None))
    return encoding, size, elements


def binary_floor(path, encoding, size, elements):
    """Each element as one record array (lists as fixed fields of the first list's length),
    then split into native, contiguous columns: what read_ply gives."""
    order = "<" if encoding == "binary_little_endian" else ">"
    result = {}
    with open(path, "rb") as file:
        file.seek(size)
        for name, count, properties in elements:
            fields = []
            for prop, kind, count_kind in properties:
                if count_kind:
                    length = int(np.frombuffer(file.peek(1)[:1], CODES[count_kind])[0]) if count else 0
                    fields += [(prop + ".count", order + CODES[count_kind]), (prop, order + CODES[kind], (length,))]
                else:
                    fields.append((prop, order + CODES[kind]))
            records = np.fromfile(file, dtype=np.dtype(fields), count=count)
            result[name] = {prop: np.ascontiguousarray(records[prop]).astype(records.dtype[prop].base.newbyteorder("="),
                                                                                copy=False)
                            for prop, _, _ in properties}
    return result


def ascii_floor(path, size, elements):
    """Every word of the body as a number in one call, then sliced into columns."""
    with open(path, "rb") as file:
        file.seek(size)
        words = np.fromfile(file, sep=" ")
    result, at = {}, 0
    for name, count, properties in elements:
        # Lists have the first instance's length throughout, as in the binary floor.
        end = at
        for _, _, count_kind in properties:
            end += 1 + (int(words[end]) if count_kind and count else 0)
        width = end - at
        block = words[at:at + count * width].reshape(count, width)
        at += count * width
        columns, column = {}, 0
        for prop, kind, count_kind in properties:
            if count_kind:
                length = int(block[0, column]) if count else 0
                columns[prop] = block[:, column + 1:column + 1 + length].astype(CODES[kind])
                column += 1 + length
            else:
                columns[prop] = block[:, column].astype(CODES[kind])
                column += 1
        result[name] = columns
    return result


def median_ms(action, runs):
    times = []
    for _ in range(runs):
        gc.collect()
        start = time.perf_counter()
        result = action()
        times.append((time.perf_counter() - start) * 1000)
        del result
    return statistics.median(times)


def check_same(floor, read):
    for element, columns in floor.items():
        for prop, column in columns.items():
            if not np.array_equal(column, read[element][prop]):
                sys.exit(f"the floor and read_ply differ in {element}.{prop}")


def ms(value):
    return f"{value:.1f} ms" if value < 100 else f"{value:.0f} ms"


def main():
    if len(sys.argv) not in (2, 3):
        sys.exit(__doc__)
    folder = pathlib.Path(sys.argv[1])
    runs = int(sys.argv[2]) if len(sys.argv) == 3 else 5
    print("| file | size | `read_ply` | NumPy `fromfile` floor | `read_ply` / floor | `import_scene(...).objects` "
          "| the same, `decode=False` |")
    print("|---|---|---|---|---|---|---|")
    for title, name in FILES:
        path = folder / name
        encoding, size, elements = header_of(path)
        if encoding == "ascii":
            floor = lambda: ascii_floor(path, size, elements)  # noqa: E731
        else:
            floor = lambda: binary_floor(path, encoding, size, elements)  # noqa: E731
        check_same(floor(), meshport.read_ply(path))
        floor_ms = median_ms(floor, runs)
        read_ms = median_ms(lambda: meshport.read_ply(path), runs)
        # The arrays are made when the objects are asked for: that is where the faces are decoded.
        import_ms = median_ms(lambda: meshport.import_scene(path).objects, runs)
        stored_ms = median_ms(lambda: meshport.import_scene(path, decode=False).objects, runs)
        print(f"| {title} | {path.stat().st_size / 1e6:.0f} MB | {ms(read_ms)} | {ms(floor_ms)} "
              f"| {read_ms / floor_ms:.2f}x | {ms(import_ms)} | {ms(stored_ms)} |")


if __name__ == "__main__":
    main()
