#!/usr/bin/env python3
"""Checks the PLY reader against the shared corpus of PLY files written by other tools.

Each file is read with `scenetool ply FILE --values --json` and compared with
oracle/<file>.json, what an independent raw reader saw in it.

Usage: check_plycorpus.py --scenetool PATH --corpus DIR [--only FILE]
Prints `ok NAME` or `FAIL NAME: reason` per file, then `N passed, M failed`.
Exit status 0 when nothing failed, 1 otherwise, 77 when the corpus is missing outside CI.
"""

import argparse
import json
import math
import os
import re
import struct
import subprocess
import sys
from collections import Counter

# Files whose header must fail here: name -> (piece of the error line, why). A file the
# oracle rejects at the header has to be listed, so that each outcome is decided once.
HEADER_FAILURES = {
    # The oracle rejects these too.
    "plywoot__ascii.ply": ("Error reading ply header.", "the file ends after the format line"),
    "plywoot__invalid.ply": ("Magic number 'ply' is not there", "text file, no magic word"),
    "plywoot__invalid_format.ply": ("Unknown file format some_invalid_format", "unknown encoding"),
    "plywoot__missing_format.ply": ("Missing format", "a comment line comes first"),
    "plywoot__valid.ply": ("Missing format", "nothing after the magic word"),
    # Intended divergences: the oracle reads past the header of these.
    "pyntcloud__diamond_with_bool.ply":
        ("unknown data type in PLY file: bool", "an unknown type word would shift every later value, so the header fails"),
    "plywoot__missing_element_property_data.ply":
        ("", "one instance declared but no bytes follow end_header: a hostile count"),
}

ELEMENT_SEMANTICS = ["vertex", "face", "tristrips", "edge", "material"]  # code = index; else 5
PROPERTY_SEMANTICS = {
    "x": 0, "y": 1, "z": 2, "nx": 3, "ny": 4, "nz": 5,
    "u": 6, "s": 6, "tx": 6, "v": 7, "t": 7, "ty": 7,
    "red": 8, "r": 8, "green": 9, "g": 9, "blue": 10, "b": 10, "alpha": 11,
    "tz": 14, "bx": 15, "by": 16, "bz": 17,
    "vertex_index": 18, "vertex_indices": 18, "material_index": 21,
    "ambient_red": 22, "ambient_green": 23, "ambient_blue": 24,
    "ambient_alpha": 25, "ambient_coeff": 25,
    "diffuse_red": 26, "diffuse_green": 27, "diffuse_blue": 28,
    "diffuse_alpha": 29, "diffuse_coeff": 29,
    "specular_red": 30, "specular_green": 31, "specular_blue": 32,
    "specular_alpha": 33, "specular_coeff": 33, "specular_power": 34, "opacity": 35,
}  # any other name: 36
TYPE_WORDS = {
    "char": "char", "int8": "char", "uchar": "uchar", "uint8": "uchar",
    "short": "short", "int16": "short", "ushort": "ushort", "uint16": "ushort",
    "int": "int", "int32": "int", "uint": "uint", "uint32": "uint",
    "float": "float", "float32": "float", "double": "double", "double64": "double",
    "float64": "double",
}
NON_FINITE = {"NaN": math.nan, "Infinity": math.inf, "-Infinity": -math.inf}
EXACT_STATS = {"count", "non_finite", "total_items", "length_histogram"}
TIMEOUT_SECONDS = 120  # a hang is a fault; the largest file reads in well under a second


class Mismatch(Exception):
    pass


def as_float32(v):
    """Both sides are rounded to float32, the precision the importer keeps."""
    v = NON_FINITE.get(v, v) if isinstance(v, str) else v
    if isinstance(v, bool) or not isinstance(v, (int, float)):
        raise Mismatch(f"not a number: {v!r}")
    try:
        return struct.unpack("f", struct.pack("f", float(v)))[0]
    except OverflowError:
        return math.inf if v > 0 else -math.inf


def as_int(v):
    if isinstance(v, bool) or not isinstance(v, int):
        raise Mismatch(f"not an integer: {v!r}")
    return v


def converter(type_word):
    return as_float32 if type_word in ("float", "double") else as_int


def same(what, want, got, conv):
    """Compares nested lists of values, reporting the first entry that differs."""
    if isinstance(want, list):
        if not isinstance(got, list) or len(got) != len(want):
            size = len(got) if isinstance(got, list) else repr(got)
            raise Mismatch(f"{what}: expected {len(want)} entries, got {size}")
        for i, (w, g) in enumerate(zip(want, got)):
            same(f"{what}[{i}]", w, g, conv)
        return
    a, b = conv(want), conv(got)
    if a != b and not (math.isnan(a) and math.isnan(b)):
        raise Mismatch(f"{what}: expected {want!r}, got {got!r}")


def compare_stats(stats, got, conv):
    """Checks every statistic the oracle recorded against the one computed here."""
    for key, want in stats.items():
        if key not in got:
            raise Mismatch(f"{key}: the oracle has {want!r}, nothing to compare here")
        if key in EXACT_STATS:
            if got[key] != want:
                raise Mismatch(f"{key}: expected {want!r}, got {got[key]!r}")
        else:
            same(key, want, got[key], conv)


def extremes(values, prefix=""):
    """Minimum and maximum over the finite values, as the oracle keeps them."""
    finite = [v for v in values if math.isfinite(v)]
    return {prefix + "min": min(finite), prefix + "max": max(finite)} if finite else {}


def scalar_stats(column, conv):
    values = [conv(v) for v in column]
    out = {"count": len(values), "values": column,
           "non_finite": sum(1 for v in values if not math.isfinite(v)), **extremes(values)}
    if column:
        out.update(first=column[0], last=column[-1])
    return out


def list_stats(column, conv):
    items = [conv(v) for entry in column for v in entry]
    lengths = Counter(len(entry) for entry in column)
    return {"count": len(column), "total_items": len(items),
            "length_histogram": {str(n): k for n, k in lengths.items()},
            "lists": column, "first10": column[:10], "last10": column[-10:],
            **{key + "_item": v for key, v in extremes(items).items()}}


def xyz_stats(xyz):
    axes = [extremes([as_float32(v) for v in axis]) for axis in zip(*xyz)]
    return {"count": len(xyz),
            "min": [axis.get("min") for axis in axes], "max": [axis.get("max") for axis in axes],
            "first10": xyz[:10], "last10": xyz[-10:]}


def expected_property(prop):
    semantic = PROPERTY_SEMANTICS.get(prop["name"], 36)
    is_list = prop.get("list", False)
    item = prop["item_type"] if is_list else prop["type"]
    return {"name": "" if semantic < 36 else prop["name"], "semantic": semantic,
            "type": TYPE_WORDS.get(item, item), "list": is_list,
            "countType": TYPE_WORDS.get(prop["count_type"]) if is_list else None}


def expected_element(element):
    name = element["name"]
    semantic = ELEMENT_SEMANTICS.index(name) if name in ELEMENT_SEMANTICS else 5
    return {"name": "" if semantic < 5 else name, "semantic": semantic,
            "count": element["count"]}


def same_fields(what, want, got):
    for key, value in want.items():
        if key not in got or got[key] != value or type(got[key]) is not type(value):
            raise Mismatch(f"{what} {key}: expected {value!r}, got {got.get(key)!r}")


def check_declaration(element, got):
    name = element["name"]
    same_fields(f"element {name}", expected_element(element), got)
    props = element["properties"]
    if len(got["properties"]) != len(props):
        raise Mismatch(f"element {name}: {len(got['properties'])} properties, expected {len(props)}")
    for prop, got_prop in zip(props, got["properties"]):
        same_fields(f"{name}.{prop['name']}", expected_property(prop), got_prop)


def check_rows(element, got, data, stderr):
    """The instances read: well formed, as many as the oracle read, a warning when short."""
    name, rows, props = element["name"], got["instances"], element["properties"]
    for i, row in enumerate(rows):
        shape = [isinstance(v, list) for v in row]
        if shape != [p.get("list", False) for p in props]:
            raise Mismatch(f"{name} instance {i}: {row!r} does not fit the properties")
    if len(rows) != data["rows_read"]:
        raise Mismatch(f"{name}: {len(rows)} instances read, expected {data['rows_read']}")
    short = len(rows) < element["count"]
    warned = any(name in line and re.search(rf"\b{len(rows)}\b", line)
                 for line in stderr.splitlines())
    if short and not warned:
        raise Mismatch(f"{name}: no warning naming the element and {len(rows)} instances read")
    return rows


def check_values(element, data, rows):
    for i, prop in enumerate(element["properties"]):
        stats = data["properties"].get(prop["name"])
        if stats is None:
            continue
        want = expected_property(prop)
        column = [row[i] for row in rows]
        conv = converter(want["type"])
        make = list_stats if want["list"] else scalar_stats
        try:
            compare_stats(stats, make(column, conv), conv)
        except Mismatch as e:
            raise Mismatch(f"{element['name']}.{prop['name']} {e}") from None
    if "xyz" in data or "xyz_summary" in data:
        names = [p["name"] for p in element["properties"]]
        xyz = [[row[names.index(axis)] for axis in "xyz"] for row in rows]
        if "xyz" in data:
            same("xyz", data["xyz"], xyz, as_float32)
        if "xyz_summary" in data:
            compare_stats(data["xyz_summary"], xyz_stats(xyz), as_float32)


def reject_constant(word):
    raise ValueError(f"bare {word} in JSON; non-finite values must be strings")


def check_read(oracle, proc):
    if proc.returncode != 0:
        last = (proc.stderr.strip().splitlines() or ["no message"])[-1]
        raise Mismatch(f"exit status {proc.returncode}, expected 0 ({last})")
    out = json.loads(proc.stdout, parse_constant=reject_constant)
    if out["format"] != oracle["format"]:
        raise Mismatch(f"format {out['format']!r}, expected {oracle['format']!r}")
    if len(out["elements"]) != len(oracle["elements"]):
        raise Mismatch(f"{len(out['elements'])} elements, expected {len(oracle['elements'])}")
    for element, got in zip(oracle["elements"], out["elements"]):
        # An element the oracle never reached must have no instances here either.
        data = oracle.get("data", {}).get(element["name"], {"rows_read": 0, "properties": {}})
        check_declaration(element, got)
        rows = check_rows(element, got, data, proc.stderr)
        check_values(element, data, rows)


def check_header_failure(name, oracle, proc):
    if name not in HEADER_FAILURES:
        raise Mismatch(f"the oracle reports {oracle['status']}; decide the outcome here and "
                       "add the file to HEADER_FAILURES")
    piece, why = HEADER_FAILURES[name]
    if proc.returncode != 1:
        raise Mismatch(f"exit status {proc.returncode}, expected 1 for a header error ({why})")
    errors = [l for l in proc.stderr.splitlines() if l.startswith("scenetool: error: ")]
    if len(errors) != 1 or piece not in errors[0]:
        raise Mismatch(f"expected one error line carrying {piece!r}, got {errors!r}")


def run_scenetool(scenetool, path):
    try:
        proc = subprocess.run([scenetool, "ply", path, "--values", "--json"],
                              capture_output=True, encoding="utf-8", errors="replace",
                              timeout=TIMEOUT_SECONDS)
    except subprocess.TimeoutExpired:
        raise Mismatch(f"no answer within {TIMEOUT_SECONDS} s") from None
    except OSError as e:
        raise Mismatch(f"cannot run {scenetool}: {e}") from None
    if proc.returncode < 0:
        raise Mismatch(f"killed by signal {-proc.returncode}")
    return proc


def check_file(scenetool, corpus, name):
    try:
        with open(os.path.join(corpus, "oracle", name + ".json"), encoding="utf-8") as f:
            oracle = json.load(f)
    except OSError as e:
        raise Mismatch(f"no oracle: {e}") from None
    proc = run_scenetool(scenetool, os.path.join(corpus, "files", name))
    if name in HEADER_FAILURES or oracle["status"] == "header_error":
        check_header_failure(name, oracle, proc)
    else:
        check_read(oracle, proc)


def main():
    parser = argparse.ArgumentParser(description=__doc__.splitlines()[0])
    parser.add_argument("--scenetool", required=True, help="the scenetool program")
    parser.add_argument("--corpus", required=True, help="the corpus folder")
    parser.add_argument("--only", help="check this one file")
    args = parser.parse_args()
    if not os.path.isdir(args.corpus):
        in_ci = os.environ.get("CI") == "true"
        print(f"PLY corpus not found at {args.corpus}" + ("" if in_ci else "; skipped"))
        return 1 if in_ci else 77
    names = ([os.path.basename(args.only)] if args.only else
             sorted(f[:-5] for f in os.listdir(os.path.join(args.corpus, "oracle"))
                    if f.endswith(".json")))
    failed = 0
    for name in names:
        try:
            check_file(args.scenetool, args.corpus, name)
            print(f"ok {name}")
        except Mismatch as e:
            failed += 1
            print(f"FAIL {name}: {e}")
        except (KeyError, IndexError, TypeError, ValueError) as e:
            failed += 1
            print(f"FAIL {name}: unexpected output ({type(e).__name__}: {e})")
    print(f"{len(names) - failed} passed, {failed} failed")
    return 1 if failed else 0


if __name__ == "__main__":
    sys.exit(main())
