"""The root file system of the lab's machine: two layers, made once and kept for all who ask for the
same.

    packages   Debian, the release of this machine, with the packages of image/packages
    lab        over it: accounts, desktop, cards, and the programs of those who answer prompts
"""

import fcntl
import hashlib
import os
import platform
import shutil
import subprocess
import time
from contextlib import contextmanager
from pathlib import Path

LAB = Path(__file__).resolve().parent.parent
CACHE = Path(os.environ.get("VLM_LAB_CACHE", "/var/cache/vlm-lab"))
KEPT_SECONDS = 14 * 24 * 3600


class ImageError(Exception):
    """Why the layers cannot be made, for the person who runs the lab."""


def packages() -> list[str]:
    lines = (LAB / "image/packages").read_text().splitlines()
    return [line for line in lines if line and not line.startswith("#")]


def layers(more_packages: tuple[str, ...] = ()) -> list[Path]:
    """The folders of the layers, the uppermost first; made when they are not there yet."""
    CACHE.mkdir(mode=0o755, parents=True, exist_ok=True)
    wanted = [*packages(), *more_packages]
    with _only_one():
        base = _layer(
            "packages", _packages_recipe(wanted), lambda target: _make_packages(wanted, target)
        )
        lab = _layer("lab", _lab_recipe(base), lambda target: _make_lab(base, target))
        _forget_old()
    return [lab, base]


@contextmanager
def _only_one():
    with (CACHE / "lock").open("w") as lock:
        fcntl.flock(lock, fcntl.LOCK_EX)
        yield


def _layer(kind: str, recipe: bytes, make) -> Path:
    folder = CACHE / f"{kind}-{hashlib.sha256(recipe).hexdigest()[:16]}"
    if not folder.exists():
        unfinished = CACHE / f"{kind}.unfinished"
        _remove(unfinished)
        make(unfinished)
        unfinished.rename(folder)
    os.utime(folder)
    return folder


def _forget_old() -> None:
    for folder in CACHE.glob("*-*"):
        if time.time() - folder.stat().st_mtime > KEPT_SECONDS:
            _remove(folder)


def _remove(folder: Path) -> None:
    if folder.exists():
        shutil.rmtree(folder)


def _codename() -> str:
    release = platform.freedesktop_os_release()
    if release.get("ID") != "debian":
        raise ImageError("the lab's machine is made of Debian packages, and this is no Debian")
    return release["VERSION_CODENAME"]


def _packages_recipe(wanted: list[str]) -> bytes:
    return "\n".join([_codename(), platform.machine(), *wanted, *_MMDEBSTRAP]).encode()


# Documents and translations are two thirds of the files of some packages.
_MMDEBSTRAP = [
    "--mode=root",
    "--variant=minbase",
    "--dpkgopt=path-exclude=/usr/share/doc/*",
    "--dpkgopt=path-exclude=/usr/share/locale/*",
    "--dpkgopt=path-exclude=/usr/share/man/*",
    '--aptopt=Acquire::Languages "none"',
    "--quiet",
]


def _make_packages(wanted: list[str], target: Path) -> None:
    sources = [str(each) for each in sorted(Path("/etc/apt").glob("sources.list.d/*.sources"))]
    if Path("/etc/apt/sources.list").exists():
        sources.append("/etc/apt/sources.list")
    include = "--include=" + ",".join(wanted)
    _run(["mmdebstrap", *_MMDEBSTRAP, include, _codename(), str(target), *sources])


def _lab_files() -> list[tuple[Path, str]]:
    """Each file that is laid into the lab layer, and its place there."""
    laid = [(LAB / "image/files", ""), (LAB / "card", "usr/lib/vlm-lab/card")]
    return [
        (file, os.path.join(place, file.relative_to(folder)))
        for folder, place in laid
        for file in sorted(folder.rglob("*"))
        if file.is_file() and not {"__pycache__", "tests"} & set(file.relative_to(folder).parts)
    ]


def _lab_recipe(base: Path) -> bytes:
    recipe = hashlib.sha256(base.name.encode())
    for file, place in [*_lab_files(), (LAB / "image/set_up", "set_up")]:
        recipe.update(f"\n{place} {file.stat().st_mode:o} {file.stat().st_size}\n".encode())
        recipe.update(file.read_bytes())
    return recipe.digest()


def _make_lab(base: Path, target: Path) -> None:
    target.mkdir()
    for file, place in _lab_files():
        (target / place).parent.mkdir(parents=True, exist_ok=True)
        shutil.copy(file, target / place)
    _run(
        ["unshare", "--mount", "--propagation", "private", str(LAB / "image/in_layer")]
        + [str(base), str(target), str(LAB / "image/set_up")]
    )


def _run(command: list[str]) -> None:
    done = subprocess.run(command, stdin=subprocess.DEVNULL, capture_output=True, text=True)
    if done.returncode != 0:
        said = "\n".join((done.stdout + done.stderr).strip().splitlines()[-20:])
        raise ImageError(f"{command[0]} failed:\n{said}")
