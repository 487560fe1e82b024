#!/usr/bin/env python3
"""Writes the C++ classes and tables of the schema from the catalogue. See schema/README.md."""

import argparse
import os
import sys

sys.dont_write_bytecode = True

import check
import emit_class
import emit_definitions
import emit_tables
import output
import parse
from catalogue import CatalogueError

STAMP = "generated.stamp"


def load(paths):
    """The checked catalogue of the files. Raises CatalogueError."""
    catalogue = parse.parse_files(paths)
    check.check(catalogue)
    catalogue.finish()
    return catalogue


def outputs(catalogue, namespace, version):
    """File names and texts."""
    def text(origin, body):
        return output.header(version, origin) + body

    files = {}
    for s in catalogue.structs:
        files[f"{s.class_name}.h"] = text(f"{s.family}.toml", emit_class.emit(s, namespace))
    for stem, structs in emit_definitions.group(catalogue.structs):
        body = emit_definitions.emit(structs, namespace, catalogue)
        files[f"{stem}.cpp"] = text(f"{structs[0].family}.toml", body)
    files["enums.h"] = text("the enumerations", emit_tables.emit_enum_header(catalogue.enums, namespace))
    files["all.h"] = text("the catalogue", emit_tables.emit_all_header(catalogue.structs, namespace))
    files["Enums.cpp"] = text("the enumerations", emit_tables.emit_enum_tables(catalogue.enums))
    files["Schema.cpp"] = text("the catalogue", emit_tables.emit_schema(catalogue, namespace))
    return files


def main(arguments):
    parser = argparse.ArgumentParser(description=__doc__)
    parser.add_argument("--out", required=True, metavar="DIR", help="output goes to DIR/NAMESPACE/")
    parser.add_argument("--namespace", default="sornschema", help="of the classes (default: sornschema)")
    parser.add_argument("--list-outputs", action="store_true", help="print the output paths and write nothing")
    parser.add_argument("files", nargs="+", metavar="FILE", help="catalogue files (TOML)")
    options = parser.parse_args(arguments)
    try:
        catalogue = load(options.files)
    except CatalogueError as error:
        print(error, file=sys.stderr)
        return 1
    folder = os.path.join(options.out, options.namespace)
    files = outputs(catalogue, options.namespace, output.generator_version())
    if options.list_outputs:
        print("\n".join(os.path.join(folder, name) for name in sorted([*files, STAMP])))
        return 0
    for name, text in files.items():
        output.write_if_changed(os.path.join(folder, name), text)
    output.touch(os.path.join(folder, STAMP))
    return 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1:]))
