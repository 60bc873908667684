"""A machine that is booted from the lab's layers, with the project installed into it.

It lives in memory and in one folder, /run/vlm-lab/NAME, until it is taken down.
"""

import ctypes
import os
import shutil
import signal
import socket
import subprocess
import time
from pathlib import Path

from machine import image

STATES = Path("/run/vlm-lab")
BOOT_SECONDS = 60
DOWN_SECONDS = 10
PATH = "/usr/local/sbin:/usr/local/bin:/usr/sbin:/usr/bin:/sbin:/bin"


class LabError(Exception):
    """What went wrong, for the person who runs the lab."""


class Container:
    def __init__(self, name: str) -> None:
        self.name = name
        self._state = STATES / name

    def is_up(self) -> bool:
        return self._leader() is not None

    def up(
        self, build: Path, ends_with_us: bool = False, more_packages: tuple[str, ...] = ()
    ) -> None:
        """Boots; returns when the machine and the desktop at its console are ready. A machine that
        ends with us does so however this process ends; what is left then, the next one clears."""
        if self.is_up():
            raise LabError(f"the machine {self.name} is up already")
        self.down()
        _clear_orphans()
        layers = image.layers(more_packages)
        try:
            self._state.mkdir(parents=True)
            if ends_with_us:
                (self._state / "owner").write_text(str(os.getpid()))
            installed = self._state / "installed"
            install(build, installed)
            self._boot([installed, *layers], ends_with_us)
        except BaseException:
            self.down()
            raise

    def down(self) -> None:
        """Leaves nothing of the machine, whatever state it was in."""
        for group in self._control_groups():
            _end(group)

        def removed() -> bool:  # An installation that was interrupted may still write a file.
            shutil.rmtree(self._state, ignore_errors=True)
            return not self._state.exists()

        if not _wait_until(removed, DOWN_SECONDS):
            raise LabError(f"{self._state} cannot be removed")

    def command(self, arguments: list[str]) -> list[str]:
        """What runs these arguments inside, as root and outside of any session or service."""
        leader = self._leader()
        if leader is None:
            raise LabError(f"the machine {self.name} is not up")
        inside = ["env", "-i", f"PATH={PATH}", "LANG=C.UTF-8", "HOME=/root"]
        return ["nsenter", "--target", str(leader), "--all", "--", *inside, *arguments]

    def run(self, arguments: list[str], **how) -> subprocess.CompletedProcess:
        return subprocess.run(self.command(arguments), **how)

    def _boot(self, lower: list[Path], ends_with_us: bool) -> None:
        with socket.socket(socket.AF_UNIX, socket.SOCK_DGRAM) as ready:
            ready.bind(str(self._state / "ready"))
            boot = [str(image.LAB / "machine/boot"), self.name, str(self._state)]
            with (self._state / "console").open("w") as console:
                process = subprocess.Popen(
                    ["unshare", "--mount", "--propagation", "private", *boot]
                    + [":".join(str(each) for each in lower)],
                    env={**os.environ, "NOTIFY_SOCKET": str(self._state / "ready")},
                    stdin=subprocess.DEVNULL,
                    stdout=console,
                    stderr=subprocess.STDOUT,
                    start_new_session=True,
                    preexec_fn=_end_with_parent if ends_with_us else None,
                )
            (self._state / "nspawn").write_text(str(process.pid))
            leader = self._wait_until_ready(ready, process)
        (self._state / "leader").write_text(str(leader))

    def _wait_until_ready(self, ready: socket.socket, process: subprocess.Popen) -> int:
        leader = 0
        ready.settimeout(0.2)
        end = time.monotonic() + BOOT_SECONDS
        while time.monotonic() < end:
            if process.poll() is not None:
                raise LabError(f"the machine did not boot:\n{self.console()}")
            try:
                said = ready.recv(4096).decode().splitlines()
            except TimeoutError:
                continue
            for line in said:
                if line.startswith("X_NSPAWN_LEADER_PID="):
                    leader = int(line.partition("=")[2])
            if "READY=1" in said:
                return leader
        raise LabError(f"the machine was not ready within {BOOT_SECONDS} s:\n{self.console()}")

    def console(self) -> str:
        return (self._state / "console").read_text(errors="replace")

    def _leader(self) -> int | None:
        pid = _number_in(self._state / "nspawn")
        return _number_in(self._state / "leader") if pid and _is_ours(pid, self.name) else None

    def _control_groups(self) -> list[Path]:
        group = f"vlm-lab-{self.name}"
        return [*Path("/sys/fs/cgroup").glob(f"*/{group}"), *Path("/sys/fs/cgroup").glob(group)]


def install(build: Path, target: Path) -> None:
    """What an administrator does with a build, into a folder; and the programs of the scenarios."""
    if not (build / "CMakeCache.txt").exists():
        raise LabError(f"there is no build in {build}; build first")
    into_usr = ["cmake", "--install", str(build), "--prefix", "/usr", "--strip"]
    commands = [
        into_usr,
        [*into_usr, "--component", "lab"],
        ["systemctl", "--quiet", "--global", f"--root={target}", "enable", "vlmhintsd.service"],
    ]
    for command in commands:
        done = subprocess.run(
            command, env={**os.environ, "DESTDIR": str(target)}, capture_output=True, text=True
        )
        if done.returncode != 0:
            raise LabError(f"{command[0]} failed:\n{done.stdout}{done.stderr}")


def _clear_orphans() -> None:
    for owner in STATES.glob("*/owner"):
        pid = _number_in(owner)
        if pid and not Path(f"/proc/{pid}").exists():
            Container(owner.parent.name).down()


def _end_with_parent() -> None:
    """On this signal systemd-nspawn halts its machine; killed, it would leave it running."""
    PR_SET_PDEATHSIG = 1
    ctypes.CDLL(None).prctl(PR_SET_PDEATHSIG, signal.SIGTERM)


def _number_in(file: Path) -> int | None:
    try:
        return int(file.read_text())
    except (FileNotFoundError, ValueError):
        return None


def _is_ours(pid: int, name: str) -> bool:
    """Not another process that got the number since."""
    try:
        status = Path(f"/proc/{pid}/stat").read_text().rpartition(")")[2].split()[0]
        groups = Path(f"/proc/{pid}/cgroup").read_text()
    except (FileNotFoundError, ProcessLookupError):
        return False
    return status != "Z" and f"/vlm-lab-{name}" in groups


def _end(group: Path) -> None:
    """Ends all processes of a control group, and removes it when the kernel has let go of them."""

    def ended() -> bool:
        for folder, _, _ in os.walk(group, topdown=False):
            try:
                for pid in Path(folder, "cgroup.procs").read_text().split():
                    os.kill(int(pid), signal.SIGKILL)
                os.rmdir(folder)
            except (FileNotFoundError, ProcessLookupError):
                pass
            except OSError:
                return False
        return not group.exists()

    if not _wait_until(ended, DOWN_SECONDS):
        raise LabError(f"processes in {group} do not end")


def _wait_until(reached, seconds: float) -> bool:
    end = time.monotonic() + seconds
    while not reached():
        if time.monotonic() > end:
            return False
        time.sleep(0.01)
    return True
