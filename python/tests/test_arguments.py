"""What cannot be used is refused by name, and nothing that is passed ends the process."""

import numpy as np
import pytest

import kel

grey = np.zeros((40, 50), np.uint8)
colour = np.zeros((40, 50, 3), np.uint8)
uyvy = np.zeros((40, 50, 2), np.uint8)
wide = np.zeros((40, 50), np.int16)
ten = np.random.default_rng(1).random((10, 2))

REFUSED = [
    (TypeError, "grey", lambda: kel.cross([[1, 2]])),
    (TypeError, "grey", lambda: kel.sobel(wide)),
    (ValueError, "grey", lambda: kel.gaussian(colour)),
    (ValueError, "grey", lambda: kel.threshold(grey[:0], 3)),
    (ValueError, "grey", lambda: kel.threshold(np.broadcast_to(np.uint8(1), (60000, 60000)), 3)),
    (TypeError, "grey", lambda: kel.adaptive_threshold(grey.astype(float))),
    (ValueError, "t ", lambda: kel.threshold(grey, 256)),
    (ValueError, "t ", lambda: kel.threshold(grey, -10**30)),
    (TypeError, "t ", lambda: kel.threshold(grey, 3.0)),
    (ValueError, "size", lambda: kel.gaussian(grey, 6)),
    (ValueError, "radius", lambda: kel.rank_filter(grey, 0)),
    (ValueError, "amplitude", lambda: kel.add_noise(grey, -1)),
    (ValueError, "maximum", lambda: kel.keypoints(grey, -1)),
    (ValueError, "source", lambda: kel.convert(grey, "GRAY", "BGR")),
    (TypeError, "target", lambda: kel.convert(grey, "GREY", 7)),
    (ValueError, "target", lambda: kel.convert(grey, "GREY", "UYVY")),
    (ValueError, "image", lambda: kel.convert(colour, "BGRA", "GREY")),
    (TypeError, "image", lambda: kel.convert(wide.astype(wide.dtype.newbyteorder()), "GREY16", "GREY")),
    (ValueError, "image", lambda: kel.flip(uyvy)),
    (ValueError, "direction", lambda: kel.flip(grey, "sideways")),
    (ValueError, "image", lambda: kel.halve(grey[:1])),
    (ValueError, "size", lambda: kel.crop_border(grey, 20)),
    (ValueError, "size", lambda: kel.add_border(grey, 2**29 - 1)),
    (ValueError, "size", lambda: kel.resize(grey, (2**31 - 1, 2**31 - 1))),
    (ValueError, "size", lambda: kel.resize(grey, (7, 7), "nearest")),
    (TypeError, "size", lambda: kel.resize(grey, 7)),
    (TypeError, "image", lambda: kel.resize(wide, (9, 9))),
    (ValueError, "method", lambda: kel.resize(grey, (9, 9), "cubic")),
    (ValueError, "homography", lambda: kel.warp(grey, np.ones((3, 3)), (9, 9))),
    (ValueError, "homography", lambda: kel.warp(grey, np.eye(3) * np.nan, (9, 9))),
    (ValueError, "homography", lambda: kel.warp(grey, np.eye(4), (9, 9))),
    (TypeError, "homography", lambda: kel.warp(grey, [["a"] * 3] * 3, (9, 9))),
    (ValueError, "src", lambda: kel.find_homography(ten[:3], ten[:3])),
    (ValueError, "src", lambda: kel.find_homography(np.zeros((10001, 2)), np.zeros((10001, 2)))),
    (ValueError, "dst", lambda: kel.find_homography(ten, ten[:9])),
    (ValueError, "dst", lambda: kel.find_homography(ten, ten * np.inf)),
    (ValueError, "threshold", lambda: kel.find_homography(ten, ten, threshold=0)),
    (ValueError, "points3d", lambda: kel.find_projection(ten, ten)),
    (ValueError, "P ", lambda: kel.decompose_camera(np.zeros((3, 4)))),
    (ValueError, "n ", lambda: kel.seed(2**32)),
    (ValueError, "threshold", lambda: kel.register(grey, grey, threshold=np.nan)),
    (ValueError, "features", lambda: kel.prepare(grey, features=3)),
    (TypeError, "second", lambda: kel.register(grey, None)),
    (TypeError, "first", lambda: kel.match_features(ten, ten)),
]


@pytest.mark.parametrize("number", range(len(REFUSED)))
def test_refused(number):
    error, name, call = REFUSED[number]
    with pytest.raises(error, match="^" + name):
        call()


def test_fuzz(request):
    import fuzz

    fuzz.run(request.config.getoption("--fuzz-calls"), seed=1)
