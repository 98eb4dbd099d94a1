"""Builds the wheel for pip: CMake (with pybind11-dev, ninja-build and g++ from Debian), both libraries inside the module."""

import base64
import hashlib
import os
import re
import subprocess
import sys
import sysconfig
import tempfile
import zipfile

HERE = os.path.dirname(os.path.abspath(__file__))
ROOT = os.path.dirname(HERE)


def _version():
    with open(os.path.join(ROOT, "kelImage", "src", "kelImage.h"), encoding="utf-8") as header:
        return re.search(r'#define KEL_VERSION "([^"]*)"', header.read()).group(1)


def _metadata():
    return (f"Metadata-Version: 2.1\nName: kel\nVersion: {_version()}\nSummary: Small, exact and fast computer vision\n"
            "Requires-Python: >=3.10\nRequires-Dist: numpy\nRequires-Dist: pillow\n")


def get_requires_for_build_wheel(config_settings=None):
    return []


def build_wheel(wheel_directory, config_settings=None, metadata_directory=None):
    tag = f"cp{sys.version_info[0]}{sys.version_info[1]}"
    platform = sysconfig.get_platform().replace("-", "_").replace(".", "_")
    name = f"kel-{_version()}-{tag}-{tag}-{platform}.whl"
    info = f"kel-{_version()}.dist-info"
    with tempfile.TemporaryDirectory() as work:
        built = os.path.join(work, "package")
        subprocess.run(
            ["cmake", "-S", ROOT, "-B", os.path.join(work, "build"), "-G", "Ninja", "-DCMAKE_BUILD_TYPE=Release",
             "-DBUILD_SHARED_LIBS=OFF", "-DKEL_BUILD_TESTS=OFF", "-DKEL_BUILD_EXAMPLES=OFF", "-DKEL_INSTALL=OFF",
             "-DKEL_BUILD_PYTHON=ON", f"-DKEL_PYTHON={sys.executable}", f"-DKEL_PYTHON_DIR={built}"], check=True)
        subprocess.run(["cmake", "--build", os.path.join(work, "build"), "--target", "kel_python"], check=True)
        files = {}
        for file in sorted(os.listdir(os.path.join(built, "kel"))):
            if file.endswith((".py", ".pyi", ".so", ".typed")):
                with open(os.path.join(built, "kel", file), "rb") as opened:
                    files[f"kel/{file}"] = opened.read()
    files[f"{info}/METADATA"] = _metadata().encode()
    files[f"{info}/WHEEL"] = f"Wheel-Version: 1.0\nGenerator: kel\nRoot-Is-Purelib: false\nTag: {tag}-{tag}-{platform}\n".encode()
    with zipfile.ZipFile(os.path.join(wheel_directory, name), "w", zipfile.ZIP_DEFLATED) as wheel:
        record = ""
        for path, content in files.items():
            digest = base64.urlsafe_b64encode(hashlib.sha256(content).digest()).rstrip(b"=").decode()
            record += f"{path},sha256={digest},{len(content)}\n"
            wheel.writestr(path, content)
        wheel.writestr(f"{info}/RECORD", record + f"{info}/RECORD,,\n")
    return name
