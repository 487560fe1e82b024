"""Writing files: only those whose text changed, each stamped with the generator's version."""

import hashlib
import os


def generator_version():
    """A short hash over the generator's own sources."""
    here = os.path.dirname(os.path.abspath(__file__))
    digest = hashlib.sha256()
    for name in sorted(os.listdir(here)):
        if name.endswith(".py"):
            with open(os.path.join(here, name), "rb") as f:
                digest.update(name.encode() + b"\0" + f.read())
    return digest.hexdigest()[:12]


def header(version, origin):
    """The first line of a generated file."""
    return f"// Written by schema/generator {version} from {origin}. Do not edit.\n"


def write_if_changed(path, text):
    """Whether the file had to be written."""
    data = text.encode("utf-8")
    try:
        with open(path, "rb") as f:
            if f.read() == data:
                return False
    except FileNotFoundError:
        os.makedirs(os.path.dirname(path), exist_ok=True)
    temporary = path + ".new"
    with open(temporary, "wb") as f:
        f.write(data)
    os.replace(temporary, path)
    return True


def touch(path):
    with open(path, "a", encoding="utf-8"):
        os.utime(path)
