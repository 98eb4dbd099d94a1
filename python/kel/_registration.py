"""Registration of two pictures: the homography from one to the other, judged by the pictures themselves."""

import io
from typing import Any, Tuple, Union

import numpy as np
from numpy.typing import NDArray

from kel import _kel
from kel._images import Format, Image, convert, resize, warp
from kel._kel import Prepared


class NotRegistered(RuntimeError):
    """There is no reliable answer; the message, also `reason`, tells why."""

    def __init__(self, reason: str) -> None:
        super().__init__(reason)
        self.reason = reason


class Registration:
    """What register() found. In a notebook it shows itself: the first picture laid over the second one, half and half.

    homography       3 x 3, (x2, y2, 1) ~ H (x1, y1, 1) between pixel centres, H[2, 2] = 1
    agreement        the share of tested patches that look alike, 0.35 to 1
    tested, agreeing the numbers behind it
    expected_error   of the homography where the pictures overlap, in pixels of the second one
    matches          structured array, a row a tentative pair: first, second (rows of keypoints), x1, y1, x2, y2, inlier
    inliers          how many of these the homography fits
    keypoints        a pair of structured arrays, the features of both pictures as of find_features()
    elapsed          seconds
    """

    homography: NDArray[np.float64]
    agreement: float
    tested: int
    agreeing: int
    expected_error: float
    matches: NDArray[np.void]
    inliers: int
    keypoints: Tuple[NDArray[np.void], NDArray[np.void]]
    elapsed: float

    def __init__(self, found: "dict[str, Any]", first: Any, second: Any) -> None:
        for name in ("homography", "agreement", "tested", "agreeing", "expected_error", "matches", "keypoints", "elapsed"):
            setattr(self, name, found[name])
        self.inliers = int(np.count_nonzero(self.matches["inlier"]))
        self._pictures = (first, second)

    def __repr__(self) -> str:
        return f"<Registration: agreement {self.agreement:.2f}, {self.inliers} of {len(self.matches)} matches fit>"

    def _repr_png_(self) -> Union[bytes, None]:
        from PIL import Image as Pillow

        if any(isinstance(picture, Prepared) for picture in self._pictures):
            return None  # which keeps no pixels
        first, second = (_to_rgb(picture) for picture in self._pictures)
        height, width = second.shape[:2]
        laid = warp(first, self.homography, (width, height))
        inside = warp(np.full(first.shape[:2], 255, np.uint8), self.homography, (width, height)) > 0
        both = second.copy()
        both[inside] = (laid[inside].astype(np.uint16) + second[inside]) // 2
        longer = max(width, height)
        if longer > 800:
            both = resize(both, (max(1, width * 800 // longer), max(1, height * 800 // longer)))
        file = io.BytesIO()
        Pillow.fromarray(np.ascontiguousarray(both)).save(file, "PNG")
        return file.getvalue()


def _to_rgb(image: Image) -> Image:
    if image.ndim == 2 and image.dtype == np.int16:  # over its own range, as register() takes it
        low, high = int(image.min()), int(image.max())
        image = ((image.astype(np.int32) - low) * 255 // max(1, high - low)).astype(np.uint8)
    formats: "dict[int, Format]" = {2: "UYVY", 3: "RGB", 4: "RGBA"}
    return convert(image, "GREY" if image.ndim == 2 else formats[image.shape[2]], "RGB")


def register(first: Union[Image, Prepared], second: Union[Image, Prepared], threshold: float = 3.0, features: int = 1200,
             working_size: int = 1000, views: bool = True) -> Registration:
    """The homography that takes the first picture to the second one, or NotRegistered.

    Either may be any picture, of another size or type than the other, or what prepare() made of it. Colours count by their mean.
    `threshold` (0.1 to 100) is the distance at which matches fit, in pixels of the smaller working picture; `features` (50 to 5000) the
    most keypoints a picture; `working_size` (200 to 8000) what the longer side is halved to; `views` whether squeezed views are tried
    where the first attempt is refused. Pictures are kept with the result for its _repr_png_(), not copied.
    """
    found = _kel.register(first, second, threshold, features, working_size, bool(views))
    if not found["found"]:
        raise NotRegistered(found["reason"])
    return Registration(found, first, second)


def prepare(image: Image, features: int = 1200, working_size: int = 1000) -> Prepared:
    """A picture made ready once for register() with many others, which halves their time. The picture is not kept; the result can be
    pickled, for another process or machine."""
    return _kel.prepare(image, features, working_size)


def find_features(image: Image, features: int = 1200, working_size: int = 1000) -> NDArray[np.void]:
    """Keypoints with descriptions: a structured array of x, y, scale, angle, squeeze, direction, score and descriptor (128 uint8)."""
    return _kel.find_features(image, features, working_size)


def match_features(first: NDArray[np.void], second: NDArray[np.void]) -> NDArray[np.void]:
    """Pairs of features that are each other's nearest and stand out: first and second (rows), x1, y1, x2, y2; inlier is False."""
    return _kel.match_features(first, second)
