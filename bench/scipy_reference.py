"""Side-by-side speed of the level library and a scipy reference, on the same signal.

The reference is the plain way to get third-octave bands with scipy: 36 bands of
butter(3) band-pass second-order sections (base-10 mid-band frequencies 6.3 Hz .. 20 kHz,
edges fm * 10^(+-0.05)) through sosfilt at the full 48000 Hz rate, one thread, on the
60 s of noise that slm_bench analyses. Usage:

    scipy_reference.py [slm_bench.json ...]

Each JSON file is slm_bench output (--benchmark_format=json); its x_realtime figures are
printed next to the reference and divided by it.
"""
import json
import sys
import time

import numpy as np
from scipy import signal

RATE = 48000
SECONDS = 60


def bench_noise():
    """The xorshift32 noise of bench/slm_bench.cpp, sample for sample."""
    x = np.empty(RATE * SECONDS, dtype=np.float32)
    seed = 2463534242
    mask = 0xFFFFFFFF
    for i in range(x.size):
        seed ^= (seed << 13) & mask
        seed ^= seed >> 17
        seed ^= (seed << 5) & mask
        x[i] = np.float32(seed / 4294967296.0 - 0.5) * np.float32(2000.0)
    return x


def reference_x_realtime(x, repeats=3):
    bands = []
    for k in range(36):
        fm = 1000.0 * 10.0 ** ((k - 22) / 10.0)
        lo, hi = fm * 10.0 ** -0.05, fm * 10.0 ** 0.05
        bands.append(signal.butter(3, [lo, hi], btype="bandpass", fs=RATE, output="sos"))
    best = float("inf")
    for _ in range(repeats):
        start = time.process_time()
        for sos in bands:
            signal.sosfilt(sos, x)
        best = min(best, time.process_time() - start)
    return SECONDS / best


def main(paths):
    x = bench_noise()
    ref = reference_x_realtime(x)
    print(f"{'analysis':48s} {'x real time':>12s} {'vs scipy':>9s}")
    print(f"{'scipy sosfilt, 36 butter(3) band-passes at 48 kHz':48s} {ref:12.0f} {1.0:9.1f}")
    for path in paths:
        with open(path) as f:
            runs = json.load(f)["benchmarks"]
        for run in runs:
            if "x_realtime" in run:
                label = run["name"].removeprefix("BM_")
                if len(paths) > 1:
                    label = f"{path.rsplit('/', 1)[-1].removesuffix('.json')}: {label}"
                v = run["x_realtime"]
                print(f"{label:48s} {v:12.0f} {v / ref:9.1f}")


if __name__ == "__main__":
    main(sys.argv[1:])
