"""Operations on pictures beside NumPy's slicing and arithmetic, at sizes round the blocks of 16, in arrays of any layout."""

import numpy as np
import pytest

import kel

SIZES = [(1, 1), (2, 7), (5, 3), (16, 1), (16, 16), (17, 33), (31, 40), (33, 34), (40, 9), (48, 33), (49, 50), (64, 48)]
random = np.random.default_rng(7)


def pictures(width, height):
    yield random.integers(0, 256, (height, width), np.uint8)
    yield random.integers(-32768, 32768, (height, width), np.int16)
    for channels in (3, 4):
        yield random.integers(0, 256, (height, width, channels), np.uint8)


def layouts(image):
    """The same pixels laid out in other ways."""
    yield image
    yield np.asfortranarray(image)
    apart = np.repeat(np.repeat(image, 2, axis=0), 3, axis=1)
    yield apart[::2, ::3]
    yield image[::-1, ::-1].copy()[::-1, ::-1]
    height, width = image.shape[:2]
    pitched = np.full((height, (width + 15) // 16 * 16) + image.shape[2:], 99, image.dtype)
    pitched[:, :width] = image
    yield pitched[:, :width]
    shifted = np.frombuffer(b"\0" + image.tobytes(), np.uint8)[1:].view(image.dtype).reshape(image.shape)
    yield shifted  # not aligned, not writable


def shifted(image, dx, dy):
    height, width = image.shape[:2]
    result = np.zeros_like(image)
    if abs(dx) < width and abs(dy) < height:
        result[max(dy, 0):height + min(dy, 0), max(dx, 0):width + min(dx, 0)] = \
            image[max(-dy, 0):height + min(-dy, 0), max(-dx, 0):width + min(-dx, 0)]
    return result


@pytest.mark.parametrize("width,height", SIZES)
def test_moves(width, height):
    for original in pictures(width, height):
        for image in layouts(original):
            before = image.copy()
            np.testing.assert_array_equal(kel.flip(image), before[:, ::-1])
            np.testing.assert_array_equal(kel.flip(image, "vertical"), before[::-1])
            np.testing.assert_array_equal(kel.flip(kel.flip(image), "both"), before[::-1])
            border = kel.add_border(image, 5)
            np.testing.assert_array_equal(border, np.pad(before, ((5, 5), (5, 5)) + ((0, 0),) * (before.ndim - 2), "edge"))
            np.testing.assert_array_equal(kel.crop_border(border, 5), before)
            if min(width, height) > 1:
                np.testing.assert_array_equal(kel.halve(image), before[:height // 2 * 2:2, :width // 2 * 2:2])
            for dx, dy in [(0, 0), (1, 0), (0, 1), (2, -1), (-3, 2), (-1, -1), (100, 3)]:
                np.testing.assert_array_equal(kel.warp(image, [[1, 0, dx], [0, 1, dy], [0, 0, 1]], (width, height)),
                                              shifted(before, dx, dy))
            np.testing.assert_array_equal(image, before)


def nearest(image, forward, size):
    """The nearest pixel under the inverse, in double precision, and where that is no near thing."""
    x, y = np.meshgrid(np.arange(size[0]), np.arange(size[1]))
    u, v, w = np.einsum("rc,cyx->ryx", np.linalg.inv(forward), np.stack([x, y, np.ones_like(x)]).astype(float))
    with np.errstate(all="ignore"):
        u, v = np.nan_to_num(u / w, nan=1e9) + 0.5, np.nan_to_num(v / w, nan=1e9) + 0.5
    clear = (w != 0) & (np.abs(u - np.round(u)) > 1e-2) & (np.abs(v - np.round(v)) > 1e-2)
    inside = (u >= 0) & (v >= 0) & (u < image.shape[1]) & (v < image.shape[0])
    result = np.zeros((size[1], size[0]) + image.shape[2:], image.dtype)
    result[inside] = image[np.floor(v[inside]).astype(int), np.floor(u[inside]).astype(int)]
    return result, clear


def test_warp():
    turned = np.array([[0.9, -0.5, 20], [0.4, 1.1, -15], [1e-3, -2e-3, 1]])
    horizon = np.array([[1, 0, 0], [0, 1, 0], [0.02, 0.01, 1]])  # its inverse has the line where it divides by zero in the result
    for forward in (turned, np.linalg.inv(turned), horizon, 1e6 * horizon, -turned):
        for image in pictures(61, 47):
            expected, clear = nearest(image, forward, (90, 70))
            assert clear.mean() > 0.9
            np.testing.assert_array_equal(kel.warp(image, forward, (90, 70))[clear], expected[clear])


@pytest.mark.parametrize("width,height", SIZES)
def test_convert(width, height):
    grey, wide, bgr, bgra = pictures(width, height)
    mean = (bgr.astype(int).sum(2) // 3).astype(np.uint8)
    zero = np.zeros((height, width, 1), np.uint8)
    spread = (np.abs(wide.astype(int)) >> 7).astype(np.uint8)
    three = np.repeat(grey[:, :, None], 3, 2)
    table = [
        (grey, "GREY", "GREY16", grey), (grey, "GREY", "BGR", three), (grey, "GREY", "RGBA", np.dstack([three, zero])),
        (wide, "GREY16", "GREY", spread), (wide, "GREY16", "RGB", np.repeat(spread[:, :, None], 3, 2)), (wide, "GREY16", "GREY16", wide),
        (bgr, "BGR", "GREY", mean), (bgr, "RGB", "GREY16", mean), (bgr, "BGR", "RGB", bgr[:, :, ::-1]),
        (bgr, "BGR", "BGRA", np.dstack([bgr, zero])), (bgr, "BGR", "RGBA", np.dstack([bgr[:, :, ::-1], zero])),
        (bgr, "RGB", "BGRA", np.dstack([bgr[:, :, ::-1], zero])), (bgr, "RGB", "RGBA", np.dstack([bgr, zero])),
        (bgra, "BGRA", "GREY", bgra[:, :, :3].astype(int).sum(2) // 3), (bgra, "RGBA", "GREY16", bgra[:, :, :3].astype(int).sum(2) // 3),
        (bgra, "BGRA", "BGR", bgra[:, :, :3]), (bgra, "RGBA", "BGR", bgra[:, :, 2::-1]), (bgra, "RGBA", "BGRA", bgra[:, :, [2, 1, 0, 3]]),
        (bgra, "RGBA", "RGBA", bgra)]
    for image, source, target, expected in table:
        for laid in layouts(image):
            np.testing.assert_array_equal(kel.convert(laid, source, target), expected, f"{source} to {target}")


@pytest.mark.parametrize("width,height", SIZES)
def test_uyvy(width, height):
    image = random.integers(0, 256, (height, width, 2), np.uint8)
    pairs = np.pad(image[:, :, 0].astype(float), ((0, 0), (0, width % 2)))
    if width % 2:
        pairs[:, -1] = pairs[:, -3] if width > 1 else 128
    u, v = (np.repeat(pairs[:, i::2], 2, axis=1)[:, :width] - 128 for i in (0, 1))
    c = (image[:, :, 1] - 16.0) * 1.164
    colours = np.clip(np.dstack([c + 1.793 * v, c - 0.213 * u - 0.534 * v, c + 2.115 * u]), 0, 255)
    for laid in layouts(image):
        np.testing.assert_array_equal(kel.convert(laid, "UYVY", "GREY"), image[:, :, 1])
        np.testing.assert_array_equal(kel.convert(laid, "UYVY", "GREY16"), image[:, :, 1])
        np.testing.assert_array_equal(kel.convert(laid, "UYVY", "UYVY"), image)
        assert np.abs(kel.convert(laid, "UYVY", "RGB") - np.floor(colours)).max() <= 1
        rgba = kel.convert(laid, "UYVY", "RGBA")
        assert np.abs(rgba[:, :, :3] - np.round(colours)).max() <= 1 and not rgba[:, :, 3].any()
        np.testing.assert_array_equal(kel.convert(laid, "UYVY", "BGRA"), rgba[:, :, [2, 1, 0, 3]])


def framed(result, columns, rows, outside):
    """`result` within its frame, `outside` in it."""
    height, width = outside.shape
    whole = outside.copy()
    whole[rows:height - rows, columns:max(columns, width - columns)] = result[rows:height - rows, columns:max(columns, width - columns)]
    return whole if height > 2 * rows else outside


def window(image, offsets, weights, rounding, shift, axis):
    padded = np.pad(image.astype(int), 16, "edge")
    total = sum(w * np.roll(padded, -o, axis) for o, w in zip(offsets, weights))
    return ((total + rounding) >> shift)[16:-16, 16:-16]


def smooth7(grey, step=1, rounding=32):
    weights, offsets = (2, 7, 14, 18, 14, 7, 2), range(-3 * step, 4 * step, step)
    return window(window(grey, offsets, weights, rounding, 6, 1), offsets, weights, rounding, 6, 0)


@pytest.mark.parametrize("width,height", SIZES)
def test_filters(width, height):
    original = random.integers(0, 256, (height, width), np.uint8)
    at = lambda dx, dy: np.pad(original.astype(int), 5)[5 + dy:5 + dy + height, 5 + dx:5 + dx + width]
    none = np.zeros((height, width), int)
    five = window(window(original, range(-2, 3), (1, 4, 6, 4, 1), 0, 0, 1), range(-2, 3), (1, 4, 6, 4, 1), 128, 8, 0)
    gx = sum(k * (at(-1, d) - at(1, d)) for d, k in ((-1, 1), (0, 2), (1, 1)))
    gy = sum(k * (at(d, -1) - at(d, 1)) for d, k in ((-1, 1), (0, 2), (1, 1)))
    low, high = int(original.min()), int(original.max())
    expected = {
        "five": framed(five, 2, 2, original), "seven": framed(smooth7(original), 8, 3, original),
        "cross": framed(at(-5, 0) + at(5, 0) + at(0, -5) + at(0, 5) - 4 * at(0, 0), 8, 5, none),
        "sobel": framed(np.round(np.sqrt(gx**2 + gy**2)).astype(int), 16, 1, none),
        "threshold": np.where(original >= 100, 255, 0),
        "adaptive": framed(np.where(original >= smooth7(original, 4, 0), 255, 0), 16, 16, none),
        "stretched": np.round((original - low) * (np.float32(255) / np.float32(max(1, high - low)))).astype(int)}
    for image in layouts(original):
        five, half5 = kel.gaussian(image, 5, half=True)
        seven, half7 = kel.gaussian(image, half=True)
        got = {"five": five, "seven": seven, "cross": kel.cross(image), "sobel": kel.sobel(image),
               "threshold": kel.threshold(image, 100), "adaptive": kel.adaptive_threshold(image),
               "stretched": kel.stretch_contrast(image)}
        for name, values in expected.items():
            np.testing.assert_array_equal(got[name], values, name)
        np.testing.assert_array_equal(half5, five[::2, ::2])
        np.testing.assert_array_equal(half7, seven[::2, ::2])
        np.testing.assert_array_equal(kel.gaussian(image, 5), five)
    kel.seed(3)
    noisy = kel.add_noise(original, 20).astype(int)
    assert np.abs(noisy - original).max() <= 20 and (np.ptp(noisy - original) > 5 or original.size < 30)
    for radius in (1, 4):
        side = 2 * radius + 1
        ranks = none.copy()
        if min(width, height) >= side:
            blocks = np.lib.stride_tricks.sliding_window_view(original, (side, side)).reshape(height - side + 1, width - side + 1, -1)
            ranks[radius:height - radius, radius:width - radius] = np.sort(blocks, axis=2)[:, :, 2 * radius * (radius + 1) + 1]
        np.testing.assert_array_equal(kel.rank_filter(original, radius), ranks)


@pytest.mark.parametrize("width,height", SIZES)
def test_resize(width, height):
    for image in pictures(width, height):
        big = np.repeat(np.repeat(image, 3, axis=0), 3, axis=1)
        for laid in layouts(big):
            np.testing.assert_array_equal(kel.resize(laid, (width, height), "nearest"), image)
            if image.dtype == np.uint8:
                np.testing.assert_array_equal(kel.resize(laid, (width, height)), image)  # means of equals
        if image.dtype == np.uint8:
            np.testing.assert_array_equal(kel.resize(image, (width, height)), image)
            larger = kel.resize(np.full_like(image, 90), (2 * width + 1, max(1, height // 2)))
            assert (larger[..., :3] == 90).all() and larger.shape[:2] == (max(1, height // 2), 2 * width + 1)
    grey = random.integers(0, 256, (height, width), np.uint8)
    np.testing.assert_array_equal(kel.resize(np.repeat(np.repeat(grey, 2, 0), 2, 1), (width, height), "bilinear"), grey)
    ramp = np.tile(np.arange(0, 160, 10, dtype=np.uint8), (4, 1))
    assert np.abs(kel.resize(ramp, (64, 8))[0].astype(float) - np.minimum(np.arange(64) * 2.5, 150)).max() <= 1


def test_keypoints():
    grey = np.full((120, 161), 40, np.uint8)
    for x, y in ((30, 40), (101, 61), (140, 90)):
        grey[y - 2:y + 3, x - 2:x + 3] = 220
    points = kel.keypoints(grey)
    assert points.dtype.names == ("x", "y", "score") and len(points) >= 3
    for x, y in ((30, 40), (101, 61), (140, 90)):
        assert np.hypot(points["x"] - x, points["y"] - y).min() < 1
    assert len(kel.keypoints(grey, 2)) == 2 and len(kel.keypoints(grey, 0)) == 0 and len(kel.keypoints(grey[:5], smooth=False)) == 0
    np.testing.assert_array_equal(kel.keypoints(np.pad(grey, ((0, 0), (0, 15)))[:, :161]), points)


def test_no_copy():
    """What has kel's layout is handed over as it is: a result goes into the next call without a copy, whatever its width."""
    result = kel.flip(np.zeros((500, 1001, 4), np.uint8))
    assert result.strides == (1008 * 4, 4, 1) and not result.flags.c_contiguous
    result[:] = 7  # pixels that are written by hand count
    assert (kel.flip(result) == 7).all()
