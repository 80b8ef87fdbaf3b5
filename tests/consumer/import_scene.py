"""Imports a file through the installed Python package and prints the scene's summary."""

import sys

import meshport

print(meshport.import_scene(sys.argv[1]).summary(), end="")
