#!/usr/bin/env python3
"""zmtool raw on the pixels of real CT and MR images (read with pydicom), checked against NumPy.

usage: zmtool_raw_pydicom.py ZMTOOL
"""
import hashlib
import itertools
import os
import subprocess
import sys
import tempfile

import numpy as np
import pydicom
from pydicom.data import get_testdata_file

TOOL = sys.argv[1]
failures = []


def check(ok, what):
    if not ok:
        failures.append(what)


def raw(*args):
    r = subprocess.run([TOOL, "raw", *args], capture_output=True, text=True)
    if r.returncode != 0:
        sys.exit(f"zmtool raw {' '.join(args)}: status {r.returncode}: {r.stderr}")
    return r.stdout


def dims(a):
    return ",".join(str(n) for n in a.shape[::-1])  # x runs fastest: NumPy's last axis


def block_sums(v, b):
    bx, by, bz = b
    z, y, x = v.shape[0] // bz, v.shape[1] // by, v.shape[2] // bx
    return v[: z * bz, : y * by, : x * bx].astype(np.int64).reshape(z, bz, y, by, x, bx)


def block_mean(v, b):
    s = block_sums(v, b).sum(axis=(1, 3, 5))
    n = b[0] * b[1] * b[2]
    return (np.sign(s) * (np.abs(s) // n)).astype(v.dtype)  # divided with truncation toward zero


def block_mode(v, b):
    blocks = block_sums(v, b).transpose(0, 2, 4, 1, 3, 5)
    out = np.empty(blocks.shape[:3], dtype=v.dtype)
    for i in np.ndindex(out.shape):
        values, counts = np.unique(blocks[i], return_counts=True)
        out[i] = values[np.argmax(counts)]  # values are sorted: the lowest wins a tie
    return out


def crop(v, lo, hi, fill):
    out = np.full((hi[2] - lo[2] + 1, hi[1] - lo[1] + 1, hi[0] - lo[0] + 1), fill, dtype=v.dtype)
    src = tuple(slice(max(lo[a], 0), min(hi[a] + 1, v.shape[2 - a])) for a in (2, 1, 0))
    dst = tuple(slice(s.start - lo[a], s.stop - lo[a]) for s, a in zip(src, (2, 1, 0)))
    out[dst] = v[src]
    return out


def run_image(name, work):
    image = pydicom.dcmread(get_testdata_file(name)).pixel_array.astype("<i2")
    # A small volume: the image, mirrored, shifted and halved.
    vol = np.stack([image, image[::-1], np.roll(image, 5, axis=1), image // 2, image[:, ::-1]])
    shape = ["--dims", dims(vol), "--type", "short"]
    path = os.path.join(work, name + ".raw")
    out = os.path.join(work, "out.raw")
    vol.tofile(path)

    def result(dtype, shape_zyx):
        return np.fromfile(out, dtype=dtype).reshape(shape_zyx)

    def same(dtype, expected, what):
        got = np.fromfile(out, dtype=dtype)
        check(got.size == expected.size and np.array_equal(got, expected.ravel()), f"{name}: {what}")

    info = raw("info", path, *shape)
    check(f"md5:        {hashlib.md5(vol.tobytes()).hexdigest()}\n" in info, f"{name}: info md5")
    check(f"range:      {vol.min()} .. {vol.max()}\n" in info, f"{name}: info range\n{info}")
    big = os.path.join(work, name + ".be")
    vol.astype(">i2").tofile(big)
    info = raw("info", big, "--big-endian", *shape)
    check(f"md5:        {hashlib.md5(vol.astype('>i2').tobytes()).hexdigest()}\n" in info, f"{name}: md5 BE")
    check(f"range:      {vol.min()} .. {vol.max()}\n" in info, f"{name}: range BE")

    for b in ((2, 2, 2), (3, 3, 2), (1, 4, 5)):
        raw("downsample", path, *shape, "--block", ",".join(map(str, b)), "-o", out)
        same("<i2", block_mean(vol, b), f"downsample {b}")
    raw("downsample", big, *shape, "--big-endian", "--block", "2,2,2", "-o", out)
    same(">i2", block_mean(vol, (2, 2, 2)), "downsample big-endian")
    labels = os.path.join(work, "labels.raw")
    (vol % 5).astype("<i2").tofile(labels)
    raw("downsample", labels, *shape, "--block", "2,2,2", "--labels", "-o", out)
    same("<i2", block_mode(vol % 5, (2, 2, 2)), "label mode")

    for axis in range(3):
        raw("flip", path, *shape, "--axis", str(axis), "-o", out)
        same("<i2", np.flip(vol, axis=2 - axis), f"flip {axis}")
    for order in itertools.permutations(range(3)):
        raw("permute", path, *shape, "--order", ",".join(map(str, order)), "-o", out)
        # New axis i is old axis order[i]; NumPy numbers the axes the other way round.
        same("<i2", vol.transpose([2 - order[2 - j] for j in range(3)]), f"permute {order}")
    raw("crop", path, *shape, "--min", "-2,3,-1", "--max", "70,40,6", "--fill", "-7", "-o", out)
    same("<i2", crop(vol, (-2, 3, -1), (70, 40, 6), -7), "crop")

    raw("convert", path, *shape, "--to", "byte", "-o", out)
    same("u1", np.clip(vol, 0, 255).astype(np.uint8), "convert to byte")
    raw("convert", path, *shape, "--to", "double", "-o", out)
    same("<f8", vol.astype(np.float64), "convert to double")
    raw("convert", path, *shape, "--to", "float", "--offset", "-1024", "--scale", "0.25", "-o", out)
    same("<f4", (vol.astype(np.float32) - np.float32(1024)) * np.float32(0.25), "mapLinear to float")
    raw("convert", path, *shape, "--to", "byte", "--offset", "-1000", "--scale", "0.5", "-o", out)
    mapped = (vol.astype(np.float32) - np.float32(1000)) * np.float32(0.5)
    same("u1", np.trunc(np.clip(mapped, 0, 255)).astype(np.uint8), "mapLinear to byte")


with tempfile.TemporaryDirectory() as work:
    for name in ("CT_small.dcm", "MR_small.dcm"):
        run_image(name, work)
for f in failures:
    print("FAILED:", f)
print(f"{len(failures)} failure(s)")
sys.exit(1 if failures else 0)
