"""Where the programs are and where trials live."""
import os
import pathlib
import shutil
import subprocess

CHECKOUT = pathlib.Path(__file__).resolve().parents[2]
BIN = pathlib.Path(os.environ.get("LAB_BIN_DIR", CHECKOUT / "build/release/bin"))
MEMORY = pathlib.Path(os.environ.get("LAB_DIR", "/dev/shm"))
SOURCE = CHECKOUT / "lab/faultpoint.cpp"


def binary(name):
    return str(BIN / name)


def build_faultpoint():
    """The tracer is no part of the product, so its build knows nothing of it."""
    target = BIN / "faultpoint"
    if not target.exists() or target.stat().st_mtime < SOURCE.stat().st_mtime:
        subprocess.run(["c++", "-std=c++20", "-O2", "-Wall", "-Wextra", "-Werror", str(SOURCE), "-o", str(target)],
                       check=True)


def _without_sockets(folder, names):
    return [name for name in names if pathlib.Path(folder, name).is_socket()]


def replace_folder(source, target):
    shutil.rmtree(target, ignore_errors=True)
    shutil.copytree(source, target, symlinks=True, ignore=_without_sockets)
