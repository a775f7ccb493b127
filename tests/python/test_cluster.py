"""A cluster of two worker processes: the same bits, also if a worker dies in mid-run."""

from __future__ import annotations

import os
import signal
import time
from typing import Any, Iterator

import numpy as np
import pytest
from distributed import Client, LocalCluster

import gridmill
from lazy_support import CASES, assert_same, lazy, operands_of, parts_of


@pytest.fixture(scope="module")
def client() -> Iterator[Client]:
    with LocalCluster(
        n_workers=2, threads_per_worker=1, dashboard_address="127.0.0.1:0", silence_logs=50
    ) as cluster:
        with Client(cluster) as client:
            yield client


def test_two_workers_give_the_bits_of_one_call(client: Client) -> None:
    expected, lists = {}, []
    for name, case in CASES.items():
        plain = operands_of(
            case, np.random.default_rng(3), (11, 9), case.bands[-1], "uint8", "few", bool(case.masks)
        )
        expected[name] = case.call(**plain)
        result = case.call(**{key: lazy(array, (5, 4)) for key, array in plain.items()})
        lists.append(list(parts_of(result)))
    flat = iter(client.gather(client.compute([part for parts in lists for part in parts])))
    for name, parts in zip(expected, lists):
        for wanted in parts_of(expected[name])[: len(parts)]:
            assert_same(next(flat), wanted)


def slowly(block: np.ndarray, seconds: float) -> np.ndarray:
    time.sleep(seconds)
    return block


def test_a_worker_that_dies_costs_no_result(client: Client) -> None:
    image = np.random.default_rng(8).integers(0, 900, (40, 40)).astype("float32")
    blocks = lazy(image, (10, 10)).map_blocks(
        slowly, 0.1, dtype=image.dtype, meta=np.empty((0, 0), "float32")
    )
    pids = client.run(os.getpid)
    future = client.compute(gridmill.percentile_stretch(blocks, nodata=-1))
    held: dict[str, Any] = {}
    deadline = time.monotonic() + 20
    while not any(held.values()) and time.monotonic() < deadline:
        time.sleep(0.05)
        held = client.has_what()
    victim = next(address for address, keys in held.items() if keys)
    assert not future.done()
    os.kill(pids[victim], signal.SIGKILL)
    assert_same(future.result(timeout=40), gridmill.percentile_stretch(image, nodata=-1))
    with pytest.raises(ProcessLookupError):
        _wait_for_end(pids[victim])


def _wait_for_end(pid: int) -> None:
    """Until a signal finds nothing: the process was killed and reaped."""
    for _ in range(100):
        os.kill(pid, 0)
        time.sleep(0.05)
