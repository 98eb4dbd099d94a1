"""Operations on pictures. Arguments are checked by the compiled module."""

from typing import Any, Literal, Tuple, Union, overload

import numpy as np
from numpy.typing import NDArray

from kel import _kel

Image = NDArray[Any]  # uint8, or int16 for H x W
Grey = NDArray[np.uint8]
Format = Literal["GREY", "GREY16", "BGR", "RGB", "BGRA", "RGBA", "UYVY"]


def convert(image: Image, source: Format, target: Format) -> Image:
    """The picture in another format: "GREY", "GREY16", "BGR", "RGB", "BGRA", "RGBA" or "UYVY".

    Grey is the unweighted mean of three channels, rounded down, also in GREY16; back from GREY16 it is the magnitude by 128. A new
    fourth channel is 0; between four and four channels it is kept. UYVY (Y, and U and V of a pair of pixels) gives colours by
    R = 1.164 (Y - 16) + 1.793 (V - 128) and so on; grey is Y. Only UYVY gives UYVY. Of an odd width the last pixel takes V from the
    pair before (128 where there is none).
    """
    return _kel.convert(image, source, target)


def stretch_contrast(grey: Grey) -> Grey:
    """The values spread linearly over 0 to 255; all 0 where they are equal."""
    return _kel.stretch_contrast(grey)


def threshold(grey: Grey, t: int) -> Grey:
    """255 where the value is t (0 to 255) or more, else 0."""
    return _kel.threshold(grey, t)


def adaptive_threshold(grey: Grey) -> Grey:
    """255 where the value is at least the mean of its neighbourhood, else 0.

    The mean is that of (2, 7, 14, 18, 14, 7, 2) / 64 at offsets -12, -8 ... 12 in both directions. The 16 rows and columns next to each
    edge are 0.
    """
    return _kel.adaptive_threshold(grey)


@overload
def gaussian(grey: Grey, size: int = ..., half: Literal[False] = ...) -> Grey: ...
@overload
def gaussian(grey: Grey, size: int = ..., *, half: Literal[True]) -> Tuple[Grey, Grey]: ...


def gaussian(grey: Grey, size: int = 7, half: bool = False) -> Union[Grey, Tuple[Grey, Grey]]:
    """The picture smoothed by 5 x 5, (1, 4, 6, 4, 1) / 16, or 7 x 7, (2, 7, 14, 18, 14, 7, 2) / 64, in both directions.

    A frame keeps its pixels: 2 wide for 5 x 5; 8 columns and 3 rows for 7 x 7. With `half` a pair: the smoothed picture, and every second
    pixel of every second row of it.
    """
    return _kel.gaussian(grey, size, bool(half))


def cross(grey: Grey) -> NDArray[np.int16]:
    """The sum of the four pixels five to the left, right, above and below, less four times the pixel itself: int16, -1020 to 1020.

    The 8 columns and 5 rows next to each edge are 0.
    """
    return _kel.cross(grey)


def sobel(grey: Grey) -> NDArray[np.int16]:
    """The magnitude of the Sobel gradient, int16, 0 to 1442. The 16 columns and the row next to each edge are 0."""
    return _kel.sobel(grey)


def rank_filter(grey: Grey, radius: int) -> Grey:
    """The value one above the median of the (2 radius + 1)^2 pixels around; 0 where these are not all in the picture."""
    return _kel.rank_filter(grey, radius)


def add_noise(grey: Grey, amplitude: int) -> Grey:
    """Uniform noise from -amplitude to amplitude (0 to 1000000) added, limited to 0 to 255; see seed()."""
    return _kel.add_noise(grey, amplitude)


def keypoints(grey: Grey, maximum: int = 10000, smooth: bool = True) -> NDArray[np.void]:
    """YAPE keypoints, row by row, at most `maximum`: a structured array of x, y (float32, fractions of a pixel) and score (int32).

    They are strong, not edge-like extrema of cross(gaussian(grey)), 9 pixels or more from every edge; of cross(grey) without `smooth`.
    """
    return _kel.keypoints(grey, maximum, bool(smooth))


def resize(image: Image, size: Tuple[int, int], method: Literal["smooth", "nearest", "bilinear"] = "smooth") -> Image:
    """The picture in another size, (width, height).

    "smooth", for uint8, takes any size: it averages where the picture gets smaller and interpolates linearly where it gets larger (a
    fourth channel then is 0). "nearest" (any type) and "bilinear" (grey) take the sample in the middle, or the mean of the four there,
    at sizes that divide the picture's own. UYVY has to be converted first.
    """
    return _kel.resize(image, size, method)


def halve(image: Image) -> Image:
    """The top left pixel of every block of 2 x 2: image[:h // 2 * 2:2, :w // 2 * 2:2]."""
    return _kel.halve(image)


def add_border(image: Image, size: int) -> Image:
    """A border of so many pixels that repeats the nearest one."""
    return _kel.add_border(image, size)


def crop_border(image: Image, size: int) -> Image:
    """The picture without so many pixels at every edge."""
    return _kel.crop_border(image, size)


def flip(image: Image, direction: Literal["horizontal", "vertical", "both"] = "horizontal") -> Image:
    """The picture mirrored left to right, upside down ("vertical"), or both."""
    return _kel.flip(image, direction)


def warp(image: Image, homography: Any, size: Tuple[int, int]) -> Image:
    """The picture under a homography that takes it to the result of size (width, height).

    Coordinates are those of pixel centres, (0, 0) the first. Each pixel of the result is the nearest one of the picture, or 0 where there
    is none. UYVY has to be converted first.
    """
    return _kel.warp(image, homography, size)
