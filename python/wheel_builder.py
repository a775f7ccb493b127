"""Builds the wheel: the package, its extension module and the library, by way of CMake alone.

A build backend of its own, since the build has to work without a network: it needs the standard library and
what CMake finds on the system (a compiler, OpenMP, pybind11).
"""

from __future__ import annotations

import base64
import hashlib
import os
import pathlib
import re
import subprocess
import sys
import sysconfig
import tempfile
import zipfile

HERE = pathlib.Path(__file__).resolve().parent
TREE = HERE.parent


def build_wheel(wheel_directory, config_settings=None, metadata_directory=None):
    """Builds the wheel in `wheel_directory` and returns its name. CMake gets what `CMAKE_ARGS` holds."""
    version = _version()
    python = f"cp{sys.version_info.major}{sys.version_info.minor}"
    tag = f"{python}-{python}-{re.sub('[-.]', '_', sysconfig.get_platform())}"
    name = f"gridmill-{version}-{tag}.whl"
    with tempfile.TemporaryDirectory() as folder:
        root = _install(pathlib.Path(folder))
        files = {path.relative_to(root).as_posix(): path.read_bytes() for path in _files(root)}
    info = f"gridmill-{version}.dist-info"
    files[f"{info}/WHEEL"] = (
        f"Wheel-Version: 1.0\nGenerator: gridmill\nRoot-Is-Purelib: false\nTag: {tag}\n".encode()
    )
    files[f"{info}/LICENSE"] = (TREE / "LICENSE").read_bytes()
    files[f"{info}/RECORD"] = _record(files, f"{info}/RECORD").encode()
    _write(pathlib.Path(wheel_directory) / name, files)
    return name


def build_sdist(sdist_directory, config_settings=None):
    """Refused: the package is built from the library's whole tree."""
    raise NotImplementedError("gridmill has no source distribution of its own; build the wheel from the tree")


def _version():
    text = (TREE / "CMakeLists.txt").read_text(encoding="utf-8")
    return re.search(r"project\(gridmill VERSION ([0-9.]+)", text)[1]


def _install(folder):
    """Configures, builds and installs the package below `folder`, and returns the place."""
    build, prefix = folder / "build", folder / "install"
    settings = {
        "CMAKE_BUILD_TYPE": "Release",
        "GRIDMILL_BUILD_PYTHON": "ON",
        "GRIDMILL_BUILD_TESTS": "OFF",
        "GRIDMILL_PYTHON_BUNDLED": "ON",
        "GRIDMILL_PYTHON_DIR": ".",
        "Python3_EXECUTABLE": sys.executable,
    }
    definitions = [f"-D{name}={value}" for name, value in settings.items()]
    given = os.environ.get("CMAKE_ARGS", "").split()
    commands = (
        ["cmake", "-S", str(TREE), "-B", str(build), *definitions, *given],
        ["cmake", "--build", str(build), "--parallel", str(os.cpu_count() or 1)],
        ["cmake", "--install", str(build), "--prefix", str(prefix), "--component", "python", "--strip"],
    )
    for command in commands:
        subprocess.run(command, check=True, stdout=sys.stderr)
    return prefix


def _files(root):
    """All files but the library under its full version: a wheel has no links, and the loader asks for the
    short one."""
    full_version = re.compile(r"libgridmill\.so\.\d+\..*")
    return sorted(
        path for path in root.rglob("*") if path.is_file() and not full_version.fullmatch(path.name)
    )


def _record(files, own):
    lines = []
    for name, content in files.items():
        digest = base64.urlsafe_b64encode(hashlib.sha256(content).digest()).rstrip(b"=").decode()
        lines.append(f"{name},sha256={digest},{len(content)}")
    return "\n".join([*lines, f"{own},,"]) + "\n"


def _write(path, files):
    """Writes the archive under another name first, so that no half-written wheel is left behind."""
    part = path.with_suffix(".part")
    try:
        with zipfile.ZipFile(part, "w", zipfile.ZIP_DEFLATED) as archive:
            for name, content in files.items():
                entry = zipfile.ZipInfo(name, date_time=(1980, 1, 1, 0, 0, 0))
                entry.compress_type = zipfile.ZIP_DEFLATED
                entry.external_attr = 0o644 << 16
                archive.writestr(entry, content)
        part.replace(path)
    finally:
        part.unlink(missing_ok=True)
