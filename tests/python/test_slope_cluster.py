"""The example that computes slope window by window on a cluster, on small rasters."""

from __future__ import annotations

import os
import runpy
import signal
import subprocess
import sys
from pathlib import Path
from typing import Any

import numpy as np
import pytest
import rasterio
from rasterio.transform import from_origin

import gridmill

SCRIPT = Path(__file__).parents[2] / "examples" / "python" / "slope_cluster.py"


def run(*words: Any) -> subprocess.CompletedProcess:
    command = [sys.executable, str(SCRIPT), *map(str, words)]
    return subprocess.run(command, capture_output=True, text=True, timeout=100)


def write(path: Path, samples: np.ndarray, **profile: Any) -> None:
    height, width = samples.shape
    profile = {"crs": "EPSG:32633", "transform": from_origin(5000, 9000, 30, 20), **profile}
    with rasterio.open(
        path, "w", driver="GTiff", dtype=samples.dtype, count=1, width=width, height=height, **profile
    ) as target:
        target.write(samples, 1)


def test_windows_join_without_a_seam(tmp_path: Path) -> None:
    samples = np.random.default_rng(5).integers(0, 900, (300, 530)).astype("int16")
    samples[100:200, 200:300] = -99
    write(tmp_path / "in.tif", samples, nodata=-99)
    done = run(tmp_path / "in.tif", tmp_path / "out.tif", "--tile", 256, "--z-factor", "2.5")
    assert (done.returncode, done.stderr.splitlines()[-1]) == (0, "slope 100 %")
    assert "530 x 300 pixels in " in done.stdout and " MB: " in done.stdout
    with rasterio.open(tmp_path / "out.tif") as result:
        expected = gridmill.slope(
            samples, cellsize=(30, 20), z_factor=2.5, mask=samples != -99, background=-9999
        )
        np.testing.assert_array_equal(result.read(1), expected)
        assert result.crs.to_epsg() == 32633 and result.transform == from_origin(5000, 9000, 30, 20)
        assert result.block_shapes == [(256, 256)] and result.nodata == -9999
    assert sorted(path.name for path in tmp_path.iterdir()) == ["in.tif", "out.tif"]


def test_a_terrain_is_made(tmp_path: Path) -> None:
    done = run(tmp_path / "in.tif", tmp_path / "out.tif", "--make", 300, "--workers", 1, "--tile", 256)
    assert done.returncode == 0
    with rasterio.open(tmp_path / "in.tif") as made, rasterio.open(tmp_path / "out.tif") as result:
        assert made.shape == result.shape == (300, 300) and made.res == (10, 10)
        elevation = made.read(1)
        np.testing.assert_array_equal(result.read(1), gridmill.slope(elevation, cellsize=10))
    assert len(np.unique(elevation)) > 1000


REFUSED = {
    "no argument": ((), "arguments: "),
    "unknown option": (("in.tif", "out.tif", "--fast"), "arguments: "),
    "no input": (("none.tif", "out.tif"), "input: no file"),
    "no raster": (("text.tif", "out.tif"), "input: "),
    "same file": (("in.tif", "in.tif"), "output: the input"),
    "no folder": (("in.tif", "none/out.tif"), "output: no folder"),
    "folder": (("in.tif", "."), "output: the folder"),
    "exists": (("in.tif", "out.tif", "--make", "300"), "input: "),
    "size": (("new.tif", "out.tif", "--make", "1"), "--make: '1'"),
    "workers": (("in.tif", "out.tif", "--workers", "0"), "--workers: '0'"),
    "tile": (("in.tif", "out.tif", "--tile", "300"), "--tile: 300"),
    "factor": (("in.tif", "out.tif", "--z-factor", "nan"), "--z-factor: 'nan'"),
    "degrees": (("degrees.tif", "out.tif"), "--z-factor: none"),
}


@pytest.fixture
def folder(tmp_path: Path, monkeypatch: pytest.MonkeyPatch) -> Path:
    """The current folder, with some rasters."""
    monkeypatch.chdir(tmp_path)
    samples = np.random.default_rng(5).integers(0, 900, (300, 300)).astype("int16")
    write(tmp_path / "in.tif", samples)
    write(tmp_path / "degrees.tif", samples, crs="EPSG:4326", transform=from_origin(9, 50, 0.01, 0.01))
    (tmp_path / "text.tif").write_text("no raster")
    (tmp_path / "cut.tif").write_bytes((tmp_path / "in.tif").read_bytes()[:90_000])
    return tmp_path


def check_refusal(returned: int, messages: str, beginning: str) -> None:
    last = messages.splitlines()[-1]
    assert last.startswith(f"slope_cluster: {beginning}") and "; expected " in last
    assert returned == 2 and "Traceback" not in messages


@pytest.mark.parametrize("words, beginning", REFUSED.values(), ids=REFUSED)
def test_refusals_name_the_argument(
    folder: Path, capsys: pytest.CaptureFixture, words: tuple[str, ...], beginning: str
) -> None:
    before = sorted(path.name for path in folder.iterdir())
    handler = signal.getsignal(signal.SIGTERM)
    script = runpy.run_path(str(SCRIPT))
    try:
        returned = script["main"](list(words))
    finally:
        signal.signal(signal.SIGTERM, handler)
    check_refusal(returned, capsys.readouterr().err, beginning)
    assert sorted(path.name for path in folder.iterdir()) == before


def test_a_damaged_raster_leaves_nothing_behind(folder: Path) -> None:
    before = sorted(path.name for path in folder.iterdir())
    done = run("cut.tif", "out.tif", "--workers", 1)
    check_refusal(done.returncode, done.stderr, "input: ")
    assert sorted(path.name for path in folder.iterdir()) == before


@pytest.mark.parametrize("ending", [signal.SIGINT, signal.SIGTERM])
def test_an_interrupted_run_leaves_nothing_behind(tmp_path: Path, ending: signal.Signals) -> None:
    write(tmp_path / "in.tif", np.zeros((3000, 3000), "uint8"))
    (tmp_path / "out.tif").write_text("what was there")
    command = [
        sys.executable,
        str(SCRIPT),
        str(tmp_path / "in.tif"),
        str(tmp_path / "out.tif"),
        "--tile",
        "256",
    ]
    with subprocess.Popen(command, stderr=subprocess.PIPE, text=True, start_new_session=True) as process:
        assert process.stderr is not None
        for line in process.stderr:
            if line.startswith("slope "):
                break
        if ending == signal.SIGINT:
            os.killpg(process.pid, ending)  # as a terminal does it
        else:
            process.send_signal(ending)
        messages = process.stderr.read()
        assert process.wait(30) == 130
    assert messages.splitlines()[-1] == "slope_cluster: interrupted; nothing was left behind"
    assert sorted(path.name for path in tmp_path.iterdir()) == ["in.tif", "out.tif"]
    assert (tmp_path / "out.tif").read_text() == "what was there"
