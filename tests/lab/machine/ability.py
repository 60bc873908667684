"""Whether this machine can boot others."""

import os
import shutil
import subprocess
from pathlib import Path


def what_is_missing() -> str | None:
    """The first reason why the lab cannot be used here, for a person to read."""
    if os.geteuid() != 0:
        return "only root can boot containers"
    for program in ("mmdebstrap", "nsenter", "systemctl", "systemd-nspawn", "unshare"):
        if not shutil.which(program):
            return f"the program {program} is not installed"
    if not _group_files():
        return "there are no control groups in /sys/fs/cgroup that could be written to"
    return _overlay_refusal()


def _group_files() -> list[Path]:
    roots = [Path("/sys/fs/cgroup"), *(Path("/sys/fs/cgroup") / n for n in ("systemd", "unified"))]
    files = [root / "cgroup.procs" for root in roots]
    return [file for file in files if os.access(file, os.W_OK)]


def _overlay_refusal() -> str | None:
    layers = "lowerdir=/mnt/a,upperdir=/mnt/b,workdir=/mnt/c"
    attempt = (
        "mount -t tmpfs lab /mnt && mkdir /mnt/a /mnt/b /mnt/c /mnt/d &&"
        f"mount -t overlay -o {layers} lab /mnt/d"
    )
    done = subprocess.run(
        ["unshare", "--mount", "--propagation", "private", "sh", "-c", attempt],
        capture_output=True,
        text=True,
    )
    if done.returncode == 0:
        return None
    return f"file systems cannot be laid over one another here: {done.stderr.strip()}"
