"""What a long call does to the process: threads, Ctrl-C, the standard output."""

from __future__ import annotations

import os
import signal
import subprocess
import sys
import threading
import time
from contextlib import contextmanager

import numpy as np
import pytest

import gridmill as gm
from calls import BY_NAME, CLASSES, named
from cases import assert_same, seeded


@contextmanager
def counting():
    """A thread that counts whenever it gets the interpreter, which nobody is made to give up meanwhile."""
    counter, stop = [0], threading.Event()

    def count():
        while not stop.is_set():
            counter[0] += 1
            time.sleep(0)

    interval = sys.getswitchinterval()
    thread = threading.Thread(target=count)
    thread.start()
    sys.setswitchinterval(1000)
    try:
        yield counter
    finally:
        sys.setswitchinterval(interval)
        stop.set()
        thread.join()


@pytest.mark.parametrize("each", **named(CLASSES))
def test_other_threads_run_during_a_call(each, capfd):
    """Without a release of the interpreter the counter stands still, however often the call is repeated."""
    shape = (800, 1200)
    image = each.image(seeded(each.name), shape, "uint8")
    operator = each.make()
    out = each.out(shape, "float32" if not each.short_list else "uint16") if each.has_out else None
    with counting() as counter:
        for _ in range(200):
            before = counter[0]
            process(each, operator, image, out)
            if counter[0] > before:
                break
    capfd.readouterr()
    assert counter[0] > before


def process(each, operator, image, out):
    """`Process` alone: nothing else here may give the interpreter away."""
    if each.kind == "result":
        operator.Process(image)
    else:
        each.run(operator, image, out=out)


def python(code: str) -> list[str]:
    return [sys.executable, "-c", code]


# A thread watches the output and interrupts the call once it has begun; what is left of the output then shows
# that the call did not run to its end.
INTERRUPTED = """
import os, signal, threading
import numpy as np
import gridmill as gm

SENTINEL = 77
shape = (20000, 3000)
image = np.zeros(shape, np.uint8)
out = np.empty(shape, np.uint8)
out2 = np.empty((*shape, 2), np.uint8)

calls = {
    "slope": lambda: gm.slope(image, cellsize=1, out=out, num_threads=1),
    "average": lambda: gm.average_channels(image, nodata=-1, out=out),
    "threshold": lambda: gm.threshold(image, 1, 2, out=out),
    "normalize": lambda: gm.normalize(image, 1, 2, out=out),
    "combine": lambda: gm.combine(image, image, out=out2),
    "difference": lambda: gm.channel_difference(image, image, out=out),
    "core": lambda: gm.core.BitmapFiltering(1, 2).Process(image, None, out),
}

def interrupt(target):
    while (target[1:3, 1:3] == SENTINEL).all():
        pass
    os.kill(os.getpid(), signal.SIGINT)

def attempt(call, target):
    target[...] = SENTINEL
    watch = threading.Thread(target=interrupt, args=(target,))
    watch.start()
    try:
        call()
        watch.join()
        return "returned"
    except KeyboardInterrupt:
        watch.join()
        return "at the end" if (target[-2, 1:3] != SENTINEL).all() else "on the way"

# On a busy machine the thread may come too late; a call that ignores signals is never stopped on its way.
for name, call in calls.items():
    target = out2 if name == "combine" else out
    ends = {}
    while len(ends) < 40 and "on the way" not in ends.values():
        ends[len(ends)] = attempt(call, target)
    print(name, ends[len(ends) - 1])
"""


def test_interrupt_ends_a_long_call_on_the_way():
    run = subprocess.run(python(INTERRUPTED), capture_output=True, text=True, timeout=200)
    assert run.returncode == 0, run.stderr
    lines = run.stdout.splitlines()
    assert len(lines) == 7
    assert [line for line in lines if not line.endswith("on the way")] == []


def test_interrupt_ends_a_program_of_many_calls():
    code = """
import numpy as np, gridmill as gm
image = np.zeros((500, 400), np.float32)
print("ready", flush=True)
while True:
    gm.slope(image, cellsize=1)
"""
    with subprocess.Popen(python(code), stdout=subprocess.PIPE, stderr=subprocess.PIPE, text=True) as child:
        assert child.stdout.readline() == "ready\n"
        child.send_signal(signal.SIGINT)
        _, errors = child.communicate(timeout=100)
    assert child.returncode == -signal.SIGINT
    assert errors.rstrip().endswith("KeyboardInterrupt")


def test_trace_of_the_squared_gradient_is_on_the_standard_output():
    code = """
import numpy as np, gridmill as gm
gm.squared_gradient(np.array([[[1, 2]], [[4, 6]]], np.uint8))
"""
    run = subprocess.run(python(code), capture_output=True, text=True, timeout=100)
    assert (run.returncode, run.stderr) == (0, "")
    assert run.stdout == "\n BEFORE - 101 9.000000\n\n BEFORE - 101 16.000000\n"


def test_trace_of_the_squared_gradient_is_held_back_by_the_file_descriptor():
    code = """
import os
import numpy as np, gridmill as gm
output = os.dup(1)
os.dup2(os.open(os.devnull, os.O_WRONLY), 1)
gm.squared_gradient(np.array([[1, 2], [4, 6]], np.uint8))
os.dup2(output, 1)
print("done")
"""
    run = subprocess.run(python(code), capture_output=True, text=True, timeout=100)
    assert (run.returncode, run.stderr, run.stdout) == (0, "", "done\n")


@pytest.mark.parametrize("each", **named([BY_NAME[name] for name in ("slope", "aspect", "average_channels")]))
def test_number_of_threads_changes_no_bit(each):
    images = each.images(seeded(each.name), (700, 900), "float32")
    mask = seeded("threads").random((700, 900)) < 0.9
    want = each.call(images, mask=mask)
    for threads in (1, 2, 5):
        assert_same(each.call(images, mask=mask, num_threads=threads), want, f"{threads} threads")


@pytest.mark.parametrize("name", ["FilterSlp", "FilterAsp", "AverageChannels"])
def test_number_of_threads_of_a_class_changes_no_bit(name):
    each = next(each for each in CLASSES if each.name == name)
    image = each.image(seeded(name), (700, 900), "float32")
    want = each.run(each.make(), image, out=each.out((700, 900), "float32"))
    margin = {} if name == "AverageChannels" else {"margin": 1}
    for threads in (1, 2, 5):
        out = each.out((700, 900), "float32")
        each.make().Process(image, None, out, num_threads=threads, **margin)
        assert_same(out, want, f"{threads} threads")


def test_a_call_in_a_thread_is_not_interrupted():
    """Signals are for the main thread; a call elsewhere goes on."""
    image = seeded("thread").random((900, 800)).astype(np.float32)
    results = []
    thread = threading.Thread(target=lambda: results.append(gm.slope(image, cellsize=1)))
    try:
        thread.start()
        os.kill(os.getpid(), signal.SIGINT)
        thread.join()
    except KeyboardInterrupt:
        thread.join()
    assert_same(results[0], gm.slope(image, cellsize=1))


# An object whose call is under way on this very thread may answer or refuse, but not wait for itself.
REENTRANT = """
import signal
import numpy as np
from gridmill import core

answers = []

def attempt(call):
    try:
        call()
        answers.append("answered")
    except Exception as failure:
        answers.append(type(failure).__name__)
"""


def test_signal_handler_may_touch_its_own_object():
    code = (
        REENTRANT
        + """
image = np.zeros((20000, 3000), np.uint8)
out = np.zeros_like(image)
operator = core.BitmapFiltering(1, 2)

def handler(number, frame):
    signal.setitimer(signal.ITIMER_REAL, 0)
    attempt(lambda: operator.thresholdMin)
    attempt(lambda: operator.Process(image[:3], None, out[:3]))

signal.signal(signal.SIGALRM, handler)
signal.setitimer(signal.ITIMER_REAL, 0.001)
while not answers:
    operator.Process(image, None, out)
print("done")
"""
    )
    run = subprocess.run(python(code), capture_output=True, text=True, timeout=60)
    assert (run.stdout, run.stderr) == ("done\n", "")


def test_decision_may_touch_its_own_object():
    code = (
        REENTRANT
        + """
image = np.zeros((2, 3), np.uint8)
operator = core.RasterStatistics()
operator.SetChans([0])
operator.SetType(8)

def decide(pixel):
    if not answers:
        attempt(lambda: operator.histogramType)
        attempt(lambda: operator.Process(image))
    return True

operator.SetMask(decide)
operator.Process(image)
print("done", len(answers))
"""
    )
    run = subprocess.run(python(code), capture_output=True, text=True, timeout=60)
    assert (run.stdout, run.stderr) == ("done 2\n", "")
