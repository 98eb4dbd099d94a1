"""Calls of the package beside the same C functions on images that are there already, and beside OpenCV's: python3 bench.py.

The C functions are called through ctypes. Times are the least of many, taken in turns, in one thread; the last line is two threads
beside one, on arrays of their own, the best of many.
"""

import ctypes
import glob
import os
import threading
import time

import numpy as np

import kel

try:
    import cv2

    cv2.setNumThreads(1)
except ImportError:
    cv2 = None

WIDTH, HEIGHT = 1920, 1080
U8G, S16G, U8XYZ, U8XYZA, U8ZYX = 0, 3, 8, 16, 24


def library():
    near = glob.glob(os.path.join(os.path.dirname(kel.__file__), "..", "..", "release", "libkel.so.1"))
    return ctypes.CDLL((near + ["libkel.so.1"])[0])


class Record(ctypes.Structure):
    """An image of the C library, over an array's pixels: where they lie in memory makes a difference."""

    _fields_ = [(name, ctypes.c_int32) for name in ("reserved", "type", "width", "height", "channels", "depth", "step", "size")]
    _fields_ += [("data", ctypes.c_void_p), ("buffer", ctypes.c_void_p)]


def record(c, kind, array):
    c.createKelImageHeader.restype = ctypes.POINTER(Record)
    made = c.createKelImageHeader(array.shape[1], array.shape[0], kind)
    made.contents.data = array.ctypes.data
    made.array = array
    return made


def cases(c):
    random = np.random.default_rng(1)
    grey = cv2.GaussianBlur(random.integers(0, 256, (HEIGHT, WIDTH), np.uint8), (9, 9), 2) if cv2 else \
        kel.gaussian(kel.gaussian(random.integers(0, 256, (HEIGHT, WIDTH), np.uint8)))
    colour, four = np.dstack([grey, grey[::-1], grey[:, ::-1]]), np.dstack([grey] * 4)
    p, p3 = record(c, U8G, grey), record(c, U8XYZ, colour)
    empty = lambda kind, image: record(c, kind, kel.flip(image))
    d, t, d16 = empty(U8G, grey), empty(U8G, grey), record(c, S16G, kel.cross(grey))
    d3, same3, d4, h = empty(U8ZYX, colour), empty(U8XYZ, colour), empty(U8XYZA, four), record(c, U8G, kel.halve(grey))
    H = np.array([[0.9, -0.1, 60], [0.12, 0.95, -40], [5e-5, -2e-5, 1]])
    inverse = np.linalg.inv(H)
    nine = [ctypes.c_float(v) for v in (inverse / inverse[2, 2]).flat]
    return [
        ("convert BGR to RGB", lambda: kel.convert(colour, "BGR", "RGB"), lambda: c.convertKelImage(d3, p3),
         lambda: cv2.cvtColor(colour, cv2.COLOR_BGR2RGB)),
        ("convert GREY to BGRA", lambda: kel.convert(grey, "GREY", "BGRA"), lambda: c.convertKelImage(d4, p),
         lambda: cv2.cvtColor(grey, cv2.COLOR_GRAY2BGRA)),
        ("stretch_contrast", lambda: kel.stretch_contrast(grey), lambda: c.adjustKelImage(d, p),
         lambda: cv2.normalize(grey, None, 0, 255, cv2.NORM_MINMAX)),
        ("threshold", lambda: kel.threshold(grey, 100), lambda: c.binalizeKelImage(d, p, 100),
         lambda: cv2.threshold(grey, 99, 255, cv2.THRESH_BINARY)),
        ("adaptive_threshold", lambda: kel.adaptive_threshold(grey), lambda: c.binalizeKelImageAdaptive(d, p, t),
         lambda: cv2.adaptiveThreshold(grey, 255, cv2.ADAPTIVE_THRESH_GAUSSIAN_C, cv2.THRESH_BINARY, 25, 0)),
        ("gaussian 7", lambda: kel.gaussian(grey), lambda: c.applyKelFilterGaussian7X7(d, p, t),
         lambda: cv2.GaussianBlur(grey, (7, 7), 0)),
        ("gaussian 5", lambda: kel.gaussian(grey, 5), lambda: c.applyKelFilterGaussian5X5(d, p, d16),
         lambda: cv2.GaussianBlur(grey, (5, 5), 0)),
        ("cross", lambda: kel.cross(grey), lambda: c.applyKelFilterLaplacian3X3(d16, p),
         lambda: cv2.Laplacian(grey, cv2.CV_16S)),
        ("sobel", lambda: kel.sobel(grey), lambda: c.applyKelFilterSobel3X3(d16, p),
         lambda: cv2.magnitude(cv2.Sobel(grey, cv2.CV_32F, 1, 0), cv2.Sobel(grey, cv2.CV_32F, 0, 1))),
        ("halve", lambda: kel.halve(grey), lambda: c.resizeKelImageHalf(h, p),
         lambda: cv2.resize(grey, (WIDTH // 2, HEIGHT // 2), interpolation=cv2.INTER_NEAREST)),
        ("flip BGR", lambda: kel.flip(colour), lambda: c.rotateKelImageH(same3, p3), lambda: cv2.flip(colour, 1)),
        ("warp BGR", lambda: kel.warp(colour, H, (WIDTH, HEIGHT)),
         lambda: c.rotateKelImageHomography(same3, p3, *nine),
         lambda: cv2.warpPerspective(colour, H, (WIDTH, HEIGHT), flags=cv2.INTER_NEAREST)),
    ]


def least(calls, rounds=60):
    best = [float("inf")] * len(calls)
    for _ in range(rounds):
        for i, call in enumerate(calls):
            start = time.perf_counter()
            call()
            best[i] = min(best[i], time.perf_counter() - start)
    return [1e6 * seconds for seconds in best]


def threads(number, rounds=20):
    images = [np.random.default_rng(i).integers(0, 256, (HEIGHT, WIDTH), np.uint8) for i in range(number)]

    def work(image):
        for _ in range(rounds):
            kel.sobel(kel.gaussian(image))

    running = [threading.Thread(target=work, args=(image,)) for image in images]
    start = time.perf_counter()
    for thread in running:
        thread.start()
    for thread in running:
        thread.join()
    return number * rounds / (time.perf_counter() - start)


if __name__ == "__main__":
    print(f"| {WIDTH}x{HEIGHT} | kel, µs | C call, µs | above it, µs | OpenCV, µs |\n|---|---:|---:|---:|---:|")
    for name, ours, plain, peer in cases(library()):
        ours, plain, peer = least([ours, plain, peer if cv2 else lambda: None])
        print(f"| {name} | {ours:.0f} | {plain:.0f} | {ours - plain:.0f} ({100 * (ours - plain) / plain:.0f} %) |"
              f" {f'{peer:.0f}' if cv2 else '-'} |", flush=True)
    rates = [(threads(1), threads(2)) for _ in range(60)]
    one, two = max(rate[0] for rate in rates), max(rate[1] for rate in rates)
    print(f"gaussian and sobel, pictures a second: one thread {one:.0f}, two {two:.0f} ({two / one:.2f} times)")
