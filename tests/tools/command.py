"""Running the sorn command. The command (with an emulator in front of it on a cross build) comes in SORN_TOOL."""

import os
import shlex
import subprocess
from pathlib import Path

TOOL = shlex.split(os.environ["SORN_TOOL"])
ROOT = Path(__file__).resolve().parents[2]
DONE, SOME_REFUSED, WRONG_USAGE = 0, 1, 2


def run(*arguments, text=b""):
    """Runs the tool on the text; gives its exit code, standard output and standard error."""
    done = subprocess.run([*TOOL, *arguments], input=text, capture_output=True, timeout=300)
    return done.returncode, done.stdout, done.stderr
