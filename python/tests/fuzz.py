"""Random calls of every function: python3 fuzz.py CALLS [SEED]. Anything but an answer, or an error of the kinds promised, ends it."""

import random
import sys

import numpy as np

import kel
from test_images import layouts

TYPES = [np.uint8] * 50 + [np.int16] * 10 + [np.int8, np.uint16, np.float32, np.float64, bool, object, ">i2", complex, "S3", "M8[s]"]


class Odd:
    """Answers whatever it is asked for with an error."""

    def __index__(self):
        raise KeyError("odd")

    def __float__(self):
        raise KeyError("odd")

    def __array__(self, *arguments):
        raise KeyError("odd")


def integer(r):
    if r.random() < 0.7:
        return r.randint(0, 20)
    return r.choice([0, -1, r.randint(0, 300), r.randint(-10, 60), 2**31 - 1, -2**31, 2**31, 2**63, -10**40,
                     np.int16(7), np.uint64(2**64 - 1), True])


def scalar(r):
    return integer(r) if r.random() < 0.9 else r.choice(
        [1.5, float("nan"), float("inf"), -0.0, 1e300, None, "x", "", "\ud800", b"x", (), [], Odd(), np.float32(3), 1j])


def extent(r):
    n = r.random()
    if n < 0.8:
        return (r.randint(1, 90), r.randint(1, 90))
    if n < 0.9:
        return r.choice([(0, 5), (-3, 5), (2**31 - 1, 2**31 - 1), (2**40, 1), (1, 2, 3), (), [7, 9], (1.5, 2), (60000, 60000), "ab"])
    return scalar(r)


def layout(r, array):
    n = r.random()
    if n < 0.4 or array.dtype == object:
        return array
    if array.ndim < 2:
        return array[::-1]
    if n < 0.5:
        return array.swapaxes(0, 1)
    if n < 0.6 and array.dtype in (np.uint8, np.int16):
        try:
            return kel.crop_border(kel.add_border(array, 3), 2)
        except (TypeError, ValueError):
            return array
    return r.choice(list(layouts(array)))


def image(r, grey=False):
    n = r.random()
    if n < 0.03:
        return scalar(r)
    if n < 0.06:
        shape = r.choice([(10**5, 10**5), (2**31, 1), (1, 2**31 - 1), (2**40, 1), (0, 5), (2**20, 2**20, 3)])
        return np.broadcast_to(np.zeros((1,) * len(shape), r.choice([np.uint8, np.int16])), shape)
    dtype = r.choice(TYPES)
    shape = (r.choice([0, 1, 2] + [r.randint(1, 70)] * 30) for _ in range(2))
    tail = r.choice([()] * 10 + [(3,), (4,)] * 6 + [(2,), (2,), (1,), (5,), (0,), (3, 2)])
    if (grey or np.dtype(dtype) == np.int16) and r.random() < 0.9:
        tail = ()
    array = np.frombuffer(r.randbytes(70 * 70 * 6), np.uint8)
    shape = tuple(shape) + tail
    size = int(np.prod(shape))
    array = np.resize(array, size).reshape(shape)
    if r.random() < 0.03:
        array = array[0] if len(array) else array
    return layout(r, array.astype(dtype) if dtype not in ("M8[s]",) else array.astype("i8").astype(dtype))


def numbers(r, shape):
    if r.random() < 0.1:
        return image(r)
    array = np.array([r.gauss(0, r.choice([1e-3, 1, 300])) for _ in range(int(np.prod(shape)))]).reshape(shape)
    n = r.random()
    if n < 0.1 and array.size:
        array.flat[r.randrange(array.size)] = r.choice([np.nan, np.inf, 1e300, 1e38, 1e-45, -1e30, 0])
    elif n < 0.2:
        array = np.round(array)  # repeated and collinear points
    elif n < 0.25:
        array *= 0
    elif n < 0.3:
        array = array.astype(r.choice([np.float32, np.int8, object, complex, "U8"])) if np.isfinite(array).all() else array
    elif n < 0.35:
        array *= r.choice([1e20, 1e37, 1e-30])
    return layout(r, array) if r.random() < 0.9 else array.tolist()


def homography(r):
    n = r.random()
    if n < 0.3:
        return [[1, 0, r.randint(-40, 40)], [0, 1, r.randint(-40, 40)], [0, 0, 1]]
    if n < 0.6:
        extents = ((0.3, 0.3, 30), (0.3, 0.3, 30), (0.01, 0.01, 0))
        return np.eye(3) + [[r.gauss(0, extent) for extent in row] for row in extents]
    return numbers(r, (3, 3))


def pairs(r, columns):
    count = r.choice([0, 1, 3, 4, 4, 5, 6, 7, 12, 12, 40])
    other = count if r.random() < 0.95 else count + 1
    method = r.choice(["ransac", "lsm", "taubin"] * 5 + ["x", None])
    threshold = r.choice([3.0, 3, 0.5, 1e5] * 4 + [ 0, -1, float("nan"), float("inf"), "x", None])
    return numbers(r, (count, columns)), numbers(r, (other, 2)), method, threshold


def formats(r):
    return r.choice(["GREY", "GREY16", "BGR", "RGB", "BGRA", "RGBA", "UYVY"] * 4 + ["grey", "", None, 3])


def convert(r):
    given, names = image(r), {(2, 1): ["GREY"], (2, 2): ["GREY16"], (3, 2): ["UYVY"], (3, 3): ["BGR", "RGB"], (3, 4): ["BGRA", "RGBA"]}
    source = formats(r)
    if isinstance(given, np.ndarray) and given.ndim and r.random() < 0.9:
        source = r.choice(names.get((given.ndim, given.itemsize if given.ndim == 2 else given.shape[-1]), [source]))
    return kel.convert, (given, source, formats(r))


def register(r):
    first = image(r)
    return kel.register, (first, first if r.random() < 0.5 else image(r), r.choice([3, 0.1, 100, scalar(r)]),
                          r.choice([50, 1200, scalar(r)]), r.choice([1000, 200, scalar(r)]), r.choice([True, False]))


def features(r):
    def some():
        found = np.zeros(r.choice([0, 1, 5, 60]), kel._kel.FEATURE)
        if r.random() < 0.9:
            found["descriptor"] = np.frombuffer(r.randbytes(128 * len(found)), np.uint8).reshape(-1, 128)
            found["x"] = r.choice([0, 1e30, float("nan"), float("inf")])
            return found[::r.choice([1, -1, 2])]
        return image(r)
    return kel.match_features, (some(), some())


# One call each: a function of the package and its arguments. Costlier ones come less often.
CALLS = [
    convert, lambda r: (kel.stretch_contrast, (image(r, True),)),
    lambda r: (kel.threshold, (image(r, True), scalar(r))), lambda r: (kel.adaptive_threshold, (image(r, True),)),
    lambda r: (kel.gaussian, (image(r, True), r.choice([5, 7, scalar(r)]), r.choice([False, True, Odd()]))),
    lambda r: (kel.cross, (image(r, True),)), lambda r: (kel.sobel, (image(r, True),)),
    lambda r: (kel.add_noise, (image(r, True), scalar(r))), lambda r: (kel.keypoints, (image(r, True), scalar(r), r.random() < 0.5)),
    lambda r: (kel.resize, (image(r), extent(r), r.choice(["smooth", "smooth", "nearest", "bilinear", "x"]))),
    lambda r: (kel.halve, (image(r),)), lambda r: (kel.add_border, (image(r), scalar(r))),
    lambda r: (kel.crop_border, (image(r), scalar(r))), lambda r: (kel.flip, (image(r), r.choice(["horizontal", "vertical", "both", 1]))),
    lambda r: (kel.warp, (image(r), homography(r), extent(r))), lambda r: (kel.seed, (scalar(r),)),
    lambda r: (kel.decompose_camera, (numbers(r, (3, 4)),)), lambda r: (kel.find_homography, pairs(r, 2)),
]
SELDOM = [
    lambda r: (kel.find_projection, pairs(r, 3)), lambda r: (kel.rank_filter, (image(r, True), scalar(r))),
    lambda r: (kel.prepare, (image(r), r.choice([1200, scalar(r)]), r.choice([1000, scalar(r)]))), register, features,
    lambda r: (kel.find_features, (image(r), r.choice([1200, scalar(r)]), r.choice([1000, scalar(r)]))),
]


def run(calls, seed):
    r = random.Random(seed)
    answers = 0
    for number in range(calls):
        function, arguments = r.choice(SELDOM if r.random() < 0.05 else CALLS)(r)
        try:
            function(*arguments)
            answers += 1
        except (TypeError, ValueError, RuntimeError):
            pass
        except Exception as error:
            raise AssertionError(f"call {number} of seed {seed}: {function.__name__}{arguments!r:.500}") from error
    assert answers > calls // 5, f"{answers} answers only"
    return answers


if __name__ == "__main__":
    wanted, start = int(sys.argv[1]), int(sys.argv[2]) if len(sys.argv) > 2 else 1
    print(f"{wanted} calls, {run(wanted, start)} answered, the others refused")
