"""Two views of a scene, registered: each part is a cell in editors that know them, or run it whole. Pictures go to a folder otherwise."""

# %% Two views: blocks of grey, smoothed, and the same seen from elsewhere with some noise
import os
import sys

import numpy as np

import kel

random = np.random.default_rng(4)
blocks = random.integers(0, 256, (30, 40), np.uint8)
first = kel.gaussian(kel.gaussian(np.repeat(np.repeat(blocks, 12, 0), 12, 1)))
true = np.array([[0.96, -0.12, 30], [0.10, 1.02, -18], [6e-5, -4e-5, 1]])
second = kel.add_noise(kel.warp(first, true, (480, 360)), 10)


def show(name, png):
    """In a notebook the picture, otherwise a file."""
    if "IPython" in sys.modules:
        from IPython.display import Image, display

        display(Image(png))
        return
    folder = sys.argv[1] if len(sys.argv) > 1 else "kel-out"
    os.makedirs(folder, exist_ok=True)
    with open(os.path.join(folder, name), "wb") as file:
        file.write(png)
    print("wrote", os.path.join(folder, name))


# %% Keypoints of the first
points = kel.keypoints(first)
strongest = points[np.argsort(-points["score"])[:5]]
print(len(points), "keypoints, the strongest at", [(round(float(p["x"])), round(float(p["y"]))) for p in strongest])

# %% The registration; in a notebook the last line would do
found = kel.register(first, second)
print(found, "in", round(1000 * found.elapsed), "ms")
print(np.round(found.homography, 4))
show("laid-over.png", found._repr_png_())

# %% How far it is from the truth at the corners
corners = np.array([[0, 0, 1], [479, 0, 1], [479, 359, 1], [0, 359, 1]]).T
a, b = (m @ corners for m in (found.homography, true))
print("off by at most", round(float(np.hypot(*(a[:2] / a[2] - b[:2] / b[2])).max()), 2), "pixels at a corner")
