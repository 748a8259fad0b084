"""Reading and writing a 200 MiB file of numeric variables through the Python
package, beside NumPy moving the same bytes: numpy.fromfile of the file's
case data (the floor for getting those bytes into Python) and
numpy.ndarray.tofile of the same array. Figures are bytes of case data per
second, best of a few runs, with the page cache warm. The "calls" line is
the library's own share: the same cases moved by the package's C case loop
between one block and the exported calls, with no DataFrame on either side.

    python3 bench/python_bench.py          (after building into build/)
"""

import ctypes
import os
import sys
import tempfile
import time
from pathlib import Path

import numpy as np
import pandas as pd

sys.path.insert(0, str(Path(__file__).resolve().parent.parent / "python"))
import qoraio  # noqa: E402
from qoraio._lib import lib, loops  # noqa: E402

VARIABLES, CASES = 100, 262144  # 200 MiB of case data, as the C benchmarks
RUNS = 3


def best(action):
    times = []
    for _ in range(RUNS):
        start = time.perf_counter()
        action()
        times.append(time.perf_counter() - start)
    return min(times)


def report(what, seconds, floor_seconds, target):
    size = VARIABLES * CASES * 8
    ratio = floor_seconds / seconds
    print("%-8s qoraio %7.0f MB/s   numpy %7.0f MB/s   %3.0f%% of numpy (target %d%%)"
          % (what, size / seconds / 1e6, size / floor_seconds / 1e6, 100 * ratio, target))


def calls_read(path, block):
    h, done = ctypes.c_int(), ctypes.c_int64()
    lib.qoraOpenRead(path.encode(), ctypes.byref(h))
    loops.qoraio_read_cases(ctypes.cast(lib.qoraWholeCaseIn, ctypes.c_void_p), h.value, block.ctypes.data, CASES,
                            VARIABLES, None, 0, ctypes.byref(done))
    lib.qoraCloseRead(h.value)
    assert done.value == CASES


def calls_write(path, block):
    h = ctypes.c_int()
    lib.qoraOpenWrite(path.encode(), ctypes.byref(h))
    for i in range(VARIABLES):
        lib.qoraSetVarName(h.value, b"V%d" % (i + 1), 0)
    lib.qoraCommitHeader(h.value)
    loops.qoraio_write_cases(ctypes.cast(lib.qoraWholeCaseOut, ctypes.c_void_p), h.value, block.ctypes.data, CASES,
                             VARIABLES, None, 0)
    lib.qoraCloseWrite(h.value)


def main():
    values = np.random.default_rng(1).random((CASES, VARIABLES)) * 1000
    frame = pd.DataFrame(values, columns=["V%d" % (i + 1) for i in range(VARIABLES)])
    with tempfile.TemporaryDirectory() as folder:
        path, plain = os.path.join(folder, "bench.qsf"), os.path.join(folder, "plain.bin")
        write = best(lambda: qoraio.write(frame, path, compress=False))
        tofile = best(lambda: values.tofile(plain))
        report("write", write, tofile, 50)
        report("  calls", best(lambda: calls_write(plain + ".qsf", values)), tofile, 50)
        offset = os.path.getsize(path) - values.nbytes  # the case data ends the file
        read = best(lambda: qoraio.read(path))
        fromfile = best(lambda: np.fromfile(path, np.float64, offset=offset))
        report("read", read, fromfile, 70)
        report("  calls", best(lambda: calls_read(path, np.empty_like(values))), fromfile, 70)
        assert np.array_equal(qoraio.read(path).to_numpy(), values)


if __name__ == "__main__":
    main()
