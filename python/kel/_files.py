"""Pictures from files and back, through Pillow."""

import os
import tempfile
from typing import Any, Union

import numpy as np
from numpy.typing import NDArray

Path = Union[str, "os.PathLike[str]"]


def read(path: Path) -> NDArray[Any]:
    """A picture from a file, the way up that its camera notes: H x W uint8, H x W x 3 RGB, H x W x 4 RGBA, or H x W int16.

    The last is grey of 16 bits, halved, as int16 does not hold it. OSError: the file cannot be read.
    """
    from PIL import Image, ImageOps

    with Image.open(path) as opened:
        try:
            picture = ImageOps.exif_transpose(opened)
            if picture.mode.startswith("I"):
                return (np.clip(np.asarray(picture, np.int64), 0, 65535) // 2).astype(np.int16)
            if picture.mode not in ("L", "RGB", "RGBA"):
                alpha = picture.mode in ("LA", "PA", "La", "RGBa") or "transparency" in picture.info
                picture = picture.convert("L" if picture.mode == "1" else "RGBA" if alpha else "RGB")
            return np.array(picture)
        except (SyntaxError, ValueError, IndexError, EOFError) as error:  # what Pillow throws for broken files
            raise OSError(f"{os.fspath(path)}: {error}") from error


def write(path: Path, image: NDArray[Any]) -> None:
    """Writes a picture to a file, its format by the name: H x W uint8, RGB, RGBA, or H x W int16 from 0 on (PNG, TIFF), doubled.

    The file appears whole or not at all.
    """
    from PIL import Image

    if not isinstance(image, np.ndarray):
        raise TypeError("image must be a NumPy array")
    if image.dtype == np.int16 and image.ndim == 2 and image.size and image.min() >= 0:
        image = image.astype(np.uint16) * 2
    elif image.dtype != np.uint8 or not (image.ndim == 2 or (image.ndim == 3 and image.shape[2] in (3, 4))) or not image.size:
        raise ValueError("image must be H x W, H x W x 3 or H x W x 4 of type uint8, or H x W int16 from 0 on")
    path = os.fspath(path)
    extension = os.path.splitext(path)[1].lower()
    kind = Image.registered_extensions().get(extension)
    if kind is None:
        raise ValueError(f"path must end as a kind of picture does, not in '{extension}'")
    handle, name = tempfile.mkstemp(dir=os.path.dirname(path) or ".", suffix=extension)
    try:
        with os.fdopen(handle, "wb") as file:
            Image.fromarray(np.ascontiguousarray(image)).save(file, kind)
        umask = os.umask(0)
        os.umask(umask)
        os.chmod(name, 0o666 & ~umask)
        os.replace(name, path)
    except BaseException:
        os.unlink(name)
        raise
