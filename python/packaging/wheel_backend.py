# SPDX-License-Identifier: Apache-2.0
"""Makes the wheel of the package, with the library and its modules inside, for `pip install ./python`.

The library is built in build/wheel beside the sources. `pip install --config-settings folder=BUILD` packs what was
built elsewhere.
"""

import base64
import hashlib
import subprocess
import sys
import sysconfig
import tempfile
import zipfile
from pathlib import Path

SOURCES = Path(__file__).resolve().parents[2]


def _built():
    """The folder of a build for the Python that asks."""
    folder = SOURCES / "build" / "wheel"
    without = [f"-DQUO_BUILD_{part}=OFF" for part in ("TESTS", "BENCH", "TOOLS")]
    options = ["-DCMAKE_BUILD_TYPE=Release", "-DQUO_PYTHON=ON", f"-DPython_EXECUTABLE={sys.executable}", *without]
    subprocess.run(["cmake", "-S", SOURCES, "-B", folder, "-G", "Ninja", *options], check=True)
    targets = ["quo_python", "quo_base_fftw", "quo_base_tiff"]
    subprocess.run(["cmake", "--build", folder, "--target", *targets], check=True)
    return folder


def _recorded(name, content):
    digest = base64.urlsafe_b64encode(hashlib.sha256(content).digest()).rstrip(b"=").decode()
    return f"{name},sha256={digest},{len(content)}\n"


def _packed(stage, folder):
    """The wheel of a folder of installed files: its name."""
    if not (stage / "quo_base" / ("_core" + sysconfig.get_config_var("EXT_SUFFIX"))).exists():
        raise RuntimeError("the package was built for another Python")
    (metadata,) = stage.glob("*.dist-info")
    python = f"cp{sys.version_info.major}{sys.version_info.minor}"
    tag = f"{python}-{python}-{sysconfig.get_platform().replace('-', '_').replace('.', '_')}"
    (metadata / "WHEEL").write_text(
        f"Wheel-Version: 1.0\nGenerator: quo_base\nRoot-Is-Purelib: false\nTag: {tag}\n"
    )
    name = f"{metadata.stem}-{tag}.whl"
    record = ""
    with zipfile.ZipFile(Path(folder) / name, "w", zipfile.ZIP_DEFLATED) as wheel:
        for file in sorted(path for path in stage.rglob("*") if path.is_file()):
            inside = file.relative_to(stage).as_posix()
            wheel.write(file, inside)
            record += _recorded(inside, file.read_bytes())
        listing = f"{metadata.name}/RECORD"
        wheel.writestr(listing, f"{record}{listing},,\n")
    return name


def build_wheel(wheel_directory, config_settings=None, metadata_directory=None):
    """What pip calls: writes the wheel and tells its name."""
    folder = (config_settings or {}).get("folder") or _built()
    with tempfile.TemporaryDirectory() as stage:
        install = ["cmake", "--install", folder, "--component", "wheel", "--strip", "--prefix", stage]
        subprocess.run(install, check=True)
        return _packed(Path(stage), wheel_directory)
