"""kel: small, exact and fast computer vision on NumPy arrays.

Pictures are arrays: H x W uint8 grey, H x W int16, H x W x 3 and x 4 uint8, H x W x 2 uint8 for UYVY, of any strides. They are never
changed, and not copied where rows follow each other at a multiple of 16 pixels, as they do in what kel returns; results are arrays of
their own, whose rows may be further apart than they are wide. What cannot be used raises TypeError or ValueError that opens with the
name of the argument. Every function lets other threads run meanwhile.
"""

from kel._files import read, write
from kel._geometry import decompose_camera, find_homography, find_projection, seed
from kel._images import (
    add_border, add_noise, adaptive_threshold, convert, crop_border, cross, flip, gaussian, halve, keypoints, rank_filter, resize,
    sobel, stretch_contrast, threshold, warp)
from kel._kel import version
from kel._registration import (
    NotRegistered, Prepared, Registration, find_features, match_features, prepare, register)

__version__ = version

__all__ = [
    "NotRegistered", "Prepared", "Registration", "add_border", "add_noise", "adaptive_threshold", "convert", "crop_border", "cross",
    "decompose_camera", "find_features", "find_homography", "find_projection", "flip", "gaussian", "halve", "keypoints",
    "match_features", "prepare", "rank_filter", "read", "register", "resize", "seed", "sobel", "stretch_contrast", "threshold",
    "warp", "write"]
