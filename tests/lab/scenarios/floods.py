"""What comes without a pause from one account, while another is served and the daemon does not grow.

How it is measured: alice asks the bus itself and the daemon in turn, while bob sends. The bus is one
thread for everybody, which bob keeps busy too, and the machine may have other work; so what counts is
the usual answer, and how much longer the daemon takes for it than the bus.
"""

import json
from contextlib import contextmanager
from statistics import median

from machine.attack import TOOLS, Attacker, daemon_pid, nothing_changes
from machine.checks import check
from machine.listing import only_identity, pair, present

TIMES = "50"
SERVED_MILLISECONDS = 50
GROWTH_KIB = 4 << 10


def requests_keep_nobody_out(lab):
    _others_are_served(lab, "requests")


def requests_that_want_no_answer_keep_nobody_out(lab):
    _others_are_served(lab, "unanswered")


def logins_keep_nobody_out(lab):
    _others_are_served(lab, "logins")


def registrations_keep_nobody_out(lab):
    _others_are_served(lab, "registrations")


def malformed_messages_keep_nobody_out(lab):
    _others_are_served(lab, "malformed")


def big_messages_are_not_kept(lab):
    """The bus itself refuses more than it keeps for one receiver, whoever sends it; so some of alice's
    requests may get lost there, and the time is not asked for."""
    pair(lab, "alice", present(lab, "rsa", "Alice Archer"))
    before = _memory(lab, daemon_pid(lab))

    with nothing_changes(lab), _flood(lab, "bob", "big"):
        _milliseconds(lab)

    lab.wait_until(
        "what they took is given back",
        lambda: _memory(lab, daemon_pid(lab)) < before + GROWTH_KIB,
    )


def connections_keep_nobody_out(lab):
    _others_are_served(lab, "connections")


def notifications_open_no_second_window(lab):
    lab.insert("rsa")
    only_identity(lab, "Alice Archer")
    lab.wait_until("the window is there", lambda: "SmartCard Pairing" in lab.windows())
    pid = _agent_pid(lab)
    before = _memory(lab, pid)

    with nothing_changes(lab), _flood(lab, "alice", "notifications"):
        for _ in range(3):
            check.assertEqual(lab.windows().count("dialog: SmartCard Pairing"), 1)

    check.assertLess(_memory(lab, pid), before + GROWTH_KIB)
    lab.windows("press", "Cancel")
    lab.wait_until("the window is gone", lambda: "SmartCard Pairing" not in lab.windows())


def _others_are_served(lab, what: str) -> None:
    pair(lab, "alice", present(lab, "rsa", "Alice Archer"))
    _milliseconds(lab)
    before = _memory(lab, daemon_pid(lab))

    with nothing_changes(lab), _flood(lab, "bob", what):
        waited = _milliseconds(lab)

    check.assertEqual(waited["lost"], 0)
    daemon, bus = median(waited["daemon"]), median(waited["bus"])
    print(
        f"{what}: the daemon {daemon:.1f} ms, at most {waited['daemon'][-1]:.1f}; the bus {bus:.1f}"
    )
    check.assertLess(daemon - bus, SERVED_MILLISECONDS, waited)
    check.assertLess(_memory(lab, daemon_pid(lab)), before + GROWTH_KIB)


def _milliseconds(lab) -> dict:
    done = lab.user("alice", f"{TOOLS}/time-hints", TIMES)
    check.assertEqual(done.status, 0, done)
    return json.loads(done.output)


def _memory(lab, pid: str) -> int:
    """What is resident, in KiB."""
    return int(lab.root("awk", "/^VmRSS/ { print $$2 }", f"/proc/{pid}/status").output)


def _agent_pid(lab) -> str:
    show = ("systemctl", "--user", "show", "vlmbind.service", "--property=MainPID", "--value")
    return lab.user("alice", *show).output.strip()


@contextmanager
def _flood(lab, user: str, what: str):
    # Who keeps the traffic would keep gigabytes.
    lab.root("systemctl", "stop", "lab-bus-monitor", "lab-session-bus-monitor@alice")
    with Attacker(lab, user, "flood", what) as flood:
        check.assertEqual(flood.first_line, "flooding")
        yield
        sent = int(flood.end())
    print(f"{what}: {sent} were sent")
    check.assertGreater(sent, 10)
