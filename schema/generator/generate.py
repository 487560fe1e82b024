#!/usr/bin/env python3
"""Writes the C++ classes and tables of the schema from the catalogue. See schema/README.md."""

import argparse
import os
import sys

sys.dont_write_bytecode = True

import check
import emit_class
import emit_definitions
import emit_proto
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


def write_proto(catalogue, path, is_oneof):
    package = os.path.splitext(os.path.basename(path))[0]
    text = output.header(output.generator_version(), "the catalogue") + emit_proto.emit(catalogue, package, is_oneof)
    output.write_if_changed(path, text)
    output.touch(path)
    return 0


def main(arguments):
    parser = argparse.ArgumentParser(description=__doc__)
    target = parser.add_mutually_exclusive_group(required=True)
    target.add_argument("--out", metavar="DIR", help="output goes to DIR/NAMESPACE/")
    target.add_argument("--proto", metavar="FILE", help="write only the schema as a proto2 file, for tests against a peer")
    parser.add_argument("--oneof", action="store_true", help="with --proto: the fields of known dicts stand in a oneof")
    parser.add_argument("--namespace", default="sornschema", help="of the classes (default: sornschema)")
    parser.add_argument("--list-outputs", action="store_true", help="print the output paths and write nothing")
    parser.add_argument("files", nargs="+", metavar="FILE", help="catalogue files (TOML)")
    options = parser.parse_args(arguments)
    try:
        catalogue = load(options.files)
        if options.proto:
            return write_proto(catalogue, options.proto, options.oneof)
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
