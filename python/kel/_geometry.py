"""Fits to pairs of points, and cameras. Arguments are checked by the compiled module."""

from typing import Any, Literal, Tuple

import numpy as np
from numpy.typing import NDArray

from kel import _kel

Method = Literal["ransac", "lsm", "taubin"]
Matrix = NDArray[np.float64]


def find_homography(src: Any, dst: Any, method: Method = "ransac", threshold: float = 3.0) -> Tuple[Matrix, NDArray[np.bool_]]:
    """The homography, 3 x 3, from points src to points dst (N x 2 each, 4 to 10000), and the mask of pairs that it fits.

    "ransac" bears wrong pairs, "lsm" is least squares on normalised coordinates, "taubin" weights noise in both. Four pairs give the
    one homography through them. A pair fits where the error in dst is below the threshold (1e-6 to 1e6). Single precision; "ransac"
    draws from seed()'s generator and expects pixels as units.

    RuntimeError: there is none. That there is one says little: compare mask.sum() with N.
    """
    return _kel.find_homography(src, dst, method, threshold)


def find_projection(points3d: Any, points2d: Any, method: Method = "ransac",
                    threshold: float = 3.0) -> Tuple[Matrix, NDArray[np.bool_]]:
    """The projection, 3 x 4, from points in space (N x 3, 6 to 10000, not in one plane) to points of a picture (N x 2), and the mask.

    As find_homography(); "lsm" is to be preferred to "taubin", which for many sets finds a poor fit.
    """
    return _kel.find_projection(points3d, points2d, method, threshold)


def decompose_camera(P: Any) -> Tuple[Matrix, Matrix, Matrix]:
    """K (upper triangular, K[2, 2] = 1), R (orthonormal rows) and t (t[2] >= 0) of a 3 x 4 projection P ~ K [R | t]."""
    return _kel.decompose_camera(P)


def seed(n: int) -> None:
    """Starts the random numbers of add_noise(), of "ransac" and of register() anew, 0 to 2^32 - 1: the same seed, the same results.

    There is one generator for the process, that of the C library: with calls from several threads at a time the order decides.
    """
    _kel.seed(n)
