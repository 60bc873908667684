"""Whether any of our processes wakes while nothing happens."""

import time

from machine.checks import check
from machine.hints_daemon import runs

QUIET_SECONDS = 60
# More than between two tries, two looks, and whatever else has an end.
SETTLING_SECONDS = 10


def expect_quiet(lab, *programs: str) -> None:
    """No thread of these programs of alice's runs, and the daemon has left and stays away."""
    # Not by a command of the user's: each begins a session, which the user's instance is told of.
    pids = [lab.root("pgrep", "--uid", "alice", "--exact", each).output for each in programs]
    check.assertTrue(all(pids), pids)
    lab.wait_until(
        "what had to be done is done",
        lambda: not runs(lab) and len(_switches(lab, pids, SETTLING_SECONDS)) == 1,
        90,
    )

    quiet = _switches(lab, pids, QUIET_SECONDS)
    check.assertEqual(len(quiet), 1, quiet)
    check.assertFalse(runs(lab))


def _switches(lab, pids: list[str], seconds: float) -> set[str]:
    """How often each thread has gone to sleep, before and after that time."""
    files = " ".join(f"/proc/{pid.strip()}/task/*/status" for pid in pids)
    count = ["sh", "-c", f"grep ^voluntary_ctxt {files}"]
    before = lab.root(*count).output
    time.sleep(seconds)
    return {before, lab.root(*count).output}
