#!/usr/bin/env python3
"""The raw voxel operations of bench_rawdata done the usual NumPy way on volumes of the same sizes
and types; prints one line per case: its name and the median of three timed runs in seconds.
Each NumPy expression builds its result in a new array, as NumPy code does."""
import time

import numpy as np

rng = np.random.default_rng(1)


def median_time(f):
    times = []
    for _ in range(3):
        start = time.perf_counter()
        f()
        times.append(time.perf_counter() - start)
    return sorted(times)[1]


def report(name, f):
    print(f"{name} {median_time(f):.6f}", flush=True)


n = 1 << 27
short = rng.integers(0, 16384, n, dtype=np.int16)
report("ZmRawData_convert/short-byte", lambda: np.clip(short, 0, 255).astype(np.uint8))
floats = ((np.arange(n // 2, dtype=np.int64) % 70000 - 35000) * 1.25).astype(np.float32)
report("ZmRawData_convert/float-short", lambda: np.clip(floats, -32768, 32767).astype(np.int16))
ushort = short.view(np.uint16)
report("ZmRawData_convert/ushort-float", lambda: ushort.astype(np.float32))
ints = rng.integers(-(1 << 30), 1 << 30, n // 2, dtype=np.int32)
report("ZmRawData_convert/int-double", lambda: ints.astype(np.float64))
report("ZmRawData_mapLinear", lambda: (short.astype(np.float32) + np.float32(-1024)) * np.float32(0.5))
del floats, ints, ushort

cube = short.reshape(512, 512, 512)  # z, y, x
for axis in range(3):
    report(f"ZmRawData_flip/{axis}", lambda a=axis: np.flip(cube, axis=2 - a).copy())
report("ZmRawData_downSample/short",
       lambda: cube.reshape(256, 2, 256, 2, 256, 2).mean(axis=(1, 3, 5)).astype(np.int16))
del cube, short

volume = rng.integers(-1024, 3072, 512 * 512 * 256, dtype=np.int16).reshape(256, 512, 512)
perms = [(0, 2, 1), (1, 0, 2), (1, 2, 0), (2, 0, 1), (2, 1, 0)]
for k, perm in enumerate(perms):
    # New axis i is old axis perm[i]; NumPy numbers the axes the other way round.
    axes = [2 - perm[2 - j] for j in range(3)]
    report(f"ZmRawData_swapDims/{k}", lambda a=axes: np.transpose(volume, a).copy())
del volume

fvol = rng.random(512 * 512 * 256, dtype=np.float32).reshape(256, 512, 512)
report("ZmRawData_downSample/float",
       lambda: fvol.reshape(128, 2, 256, 2, 256, 2).mean(axis=(1, 3, 5), dtype=np.float32))
