# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""What the scripts in Python share: the folders of a clone, which others may be at work in, and files that are whole."""

import contextlib
import fcntl
import os
import sys
from pathlib import Path

ROOT = Path(__file__).resolve().parent.parent
PROGRAM = Path(sys.argv[0]).name


def say(text):
    print(f"{PROGRAM}: {text}", file=sys.stderr, flush=True)


def require_writable(*names):
    """Ends the program with a sentence where a folder of the clone, which may not be there yet, cannot be written to."""
    for name in names:
        folder = ROOT / name
        probe = folder / f".writable.{os.getpid()}"
        try:
            folder.mkdir(parents=True, exist_ok=True)
            probe.write_text("probe\n")
        except OSError:
            say(f"{folder} cannot be written to: it is no folder, or read-only, or its disk is full")
            sys.exit(1)
        finally:
            with contextlib.suppress(OSError):
                probe.unlink()


@contextlib.contextmanager
def alone(name):
    """Waits until no other script of this clone works on a folder of build/ or out/; others wait as long as this lasts.

    The lock is that of `alone` in common.sh.
    """
    folder = ROOT / name
    require_writable(folder.parent.relative_to(ROOT))
    with (folder.parent / f".{folder.name}.lock").open("w") as lock:
        try:
            fcntl.flock(lock, fcntl.LOCK_EX | fcntl.LOCK_NB)
        except BlockingIOError:
            say(f"waiting for another script that works on {name}")
            fcntl.flock(lock, fcntl.LOCK_EX)
        yield


def replace(path, text):
    """Writes a file, which is whole then, or as it was before where that fails."""
    new = path.with_name(f".{path.name}.new")
    try:
        new.write_text(text)
        new.replace(path)
    finally:
        new.unlink(missing_ok=True)
