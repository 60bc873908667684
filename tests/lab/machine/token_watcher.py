"""A program on alice's desktop that watches tokens, and writes down what it is told."""

from machine.checks import check

_TOLD = "/run/vlm-lab/tokens"


def watch(lab) -> None:
    # Without software tokens, which are looked at now and then, nothing but events tells.
    lab.root("rm", "/usr/share/p11-kit/modules/softhsm2.module")
    lab.root("install", "-o", "alice", "/dev/null", _TOLD)
    # fmt: off
    started = lab.user(
        "alice", "systemd-run", "--user", "--quiet", "--unit=watch", "--collect",
        f"--property=StandardOutput=append:{_TOLD}",
        "sh", "-c", "sleep infinity | vlm-watch-tokens",
    )
    # fmt: on
    check.assertEqual(started.status, 0, started)


def told(lab) -> list[str]:
    """A line for each token that came ("+ TOKEN") or went ("- TOKEN")."""
    return lab.root("cat", _TOLD).output.splitlines()


def wait_for(lab, signs: list[str], seconds: float = 20) -> None:
    lab.wait_until(f"{signs} is told", lambda: [line[0] for line in told(lab)] == signs, seconds)
