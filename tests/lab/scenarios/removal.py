"""What becomes of a session when the card is pulled with which it was logged in."""

import json
import time

from machine.checks import check
from machine.sessions import active_session
from machine.token_watcher import wait_for, watch

RECORDS = "/run/vlm/sessions"


def the_session_of_a_pulled_card_is_locked(lab):
    session = _log_in_with(lab, "lock")

    lab.remove()

    lab.wait_until("logind locks the session", lambda: _locks(lab) == [session])
    check.assertEqual(active_session(lab), session)


def the_session_of_a_pulled_card_is_logged_out(lab):
    session = _log_in_with(lab, "logout")

    lab.remove()

    lab.wait_until("logind ends the session", lambda: session not in _sessions(lab))


def nothing_happens_where_nothing_is_asked_for(lab):
    session = _log_in_with(lab, "none")

    lab.remove()

    _nothing_comes_of_it(lab, session)


def another_card_is_no_concern_of_the_session(lab):
    session = _log_in_with(lab, "lock")
    lab.insert("second", 2)
    wait_for(lab, ["+", "+"])

    lab.remove(2)
    wait_for(lab, ["+", "+", "-"])
    _nothing_comes_of_it(lab, session)

    lab.remove(1)
    lab.wait_until("logind locks the session", lambda: _locks(lab) == [session])


def a_session_that_was_logged_in_otherwise_is_left_alone(lab):
    session = _log_in_with(lab, "logout")
    lab.root("rm", f"{RECORDS}/{session}")

    lab.remove()

    _nothing_comes_of_it(lab, session)


def pcscd_and_the_daemon_may_be_restarted(lab):
    session = _log_in_with(lab, "logout")

    lab.root("systemctl", "restart", "vlmhintsd.service")
    lab.root("systemctl", "kill", "--signal=KILL", "pcscd.service")
    wait_for(lab, ["+", "-"])
    lab.root("systemctl", "restart", "virtual-readers")
    lab.insert("rsa")
    wait_for(lab, ["+", "-", "+"])
    _nothing_comes_of_it(lab, session)

    # Once the readers count as back, a card that is pulled is one.
    time.sleep(11)
    lab.remove()
    lab.wait_until("logind ends the session", lambda: session not in _sessions(lab))


def _log_in_with(lab, action: str) -> str:
    """Inserts a card, and records what the daemon records of a login; the session at the console."""
    check.assertEqual(lab.root("vlmctl", "set", "tokenRemovalAction", action).status, 0)
    watch(lab)
    lab.insert("rsa")
    wait_for(lab, ["+"])
    (token,) = json.loads(lab.root("vlmctl", "--json", "tokens").output)["tokens"]
    session = active_session(lab)
    lab.root("mkdir", "-p", RECORDS)
    lab.root("tee", f"{RECORDS}/{session}", typed=token["token"] + "\n")
    return session


def _nothing_comes_of_it(lab, session: str) -> None:
    """Longer than it would take."""
    time.sleep(4)
    check.assertIn(session, _sessions(lab))
    check.assertEqual(_locks(lab), [])


def _sessions(lab) -> list[str]:
    lines = lab.root("loginctl", "list-sessions", "--no-legend").output.splitlines()
    return [line.split()[0] for line in lines]


def _locks(lab) -> list[str]:
    """The sessions that logind told to lock, as the traffic of the bus has it."""
    traffic = lab.root("grep", "-A4", "Type=signal", "/run/vlm-lab/system-bus").output
    paths = [
        line.split("Path=")[1].split()[0] for line in traffic.splitlines() if "Member=Lock" in line
    ]
    # A digit at the head of a path's part is written by its code.
    return [path.rsplit("/", 1)[1].replace("_3", "", 1) for path in paths]
