#!/usr/bin/env python3
"""process_tiles_memory_test.py PROGRAM SCRATCH: does process_tiles keep to the memory that it is given?

Each picture goes through twice: in one tile with plenty of memory, which has to take more than the limit (else the
limit would say nothing), and within the limit. Looked at is the peak of the resident memory, and nothing of time.
"""
import os
import random
import shutil
import struct
import subprocess
import sys


def write_picture(path, width, height):
    """An uncompressed TIFF file of 8-bit RGB: noise, in strips of 64 rows."""
    row_bytes, strip_rows = 3 * width, 64
    strips = (height + strip_rows - 1) // strip_rows
    tags = 10
    bits = 8 + 2 + 12 * tags + 4
    offsets = bits + 6
    counts = offsets + 4 * strips
    pixels = counts + 4 * strips
    short, long = 3, 4
    entries = [(256, long, 1, width), (257, long, 1, height), (258, short, 3, bits), (259, short, 1, 1),
               (262, short, 1, 2), (273, long, strips, offsets), (277, short, 1, 3), (278, long, 1, strip_rows),
               (279, long, strips, counts), (284, short, 1, 1)]
    noise = random.Random(7).randbytes(2 * row_bytes)
    with open(path, "wb") as file:
        file.write(b"II*\0" + struct.pack("<IH", 8, tags))
        for entry in entries:
            file.write(struct.pack("<HHII", *entry))
        file.write(struct.pack("<I3H", 0, 8, 8, 8))
        for strip in range(strips):
            file.write(struct.pack("<I", pixels + strip * strip_rows * row_bytes))
        for strip in range(strips):
            file.write(struct.pack("<I", row_bytes * min(strip_rows, height - strip * strip_rows)))
        for row in range(height):
            start = row * 7919 % row_bytes
            file.write(noise[start:start + row_bytes])


def peak(arguments):
    """The largest resident memory of a run, in MiB."""
    program = subprocess.Popen(arguments)
    _, status, usage = os.wait4(program.pid, 0)
    if status != 0:
        sys.exit(f"FAILED: status {status}: {' '.join(arguments)}")
    return usage.ru_maxrss / 1024


def keeps_limit(what, arguments, source, target, limit):
    """Says and gives whether a run keeps to its limit, and whether one without tiles would not."""
    untiled = peak(arguments + ["--memory-limit", "16384", "--tile", "8192", source, target])
    tiled = peak(arguments + ["--memory-limit", str(limit), source, target])
    print(f"{what}: {tiled:.0f} MiB of {limit}, {untiled:.0f} MiB in one tile")
    if tiled > limit:
        print(f"FAILED: {what} takes more than its limit")
    if untiled <= limit:
        print(f"FAILED: {what} would fit without tiles, which says nothing")
    return tiled <= limit < untiled


def main():
    program, scratch = sys.argv[1:]
    shutil.rmtree(scratch, ignore_errors=True)
    os.makedirs(scratch)
    large, small, target, again = (os.path.join(scratch, name)
                                   for name in ("large.tif", "small.tif", "target.tif", "again.tif"))
    write_picture(large, 3000, 6000)
    write_picture(small, 1800, 1200)
    bilateral = [program, "--filter", "FastBilateralBlur"]
    kept = [
        keeps_limit("colour on the CPU", bilateral + ["--set", "colorize=true"], large, target, 210),
        # What was written are tiles, which are read by whole rows of tiles.
        keeps_limit("luminance on the CPU, from tiles", bilateral, target, again, 210),
        keeps_limit("luminance on OpenGL", bilateral + ["--target", "gl"], small, target, 410),
    ]
    shutil.rmtree(scratch)
    sys.exit(0 if all(kept) else 1)


main()
