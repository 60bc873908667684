"""Who sits at the machine, as the tool sees it from what logind says."""

from machine.checks import check
from machine.sessions import come_back


def alice_is_at_the_console(lab):
    check.assertEqual(_seen(lab), ["alice", "alice console"])


def a_session_from_afar_is_not_at_the_console(lab):
    seen = lab.user("bob", "vlm-console-user").output.splitlines()

    check.assertEqual(seen[0], "alice")
    check.assertEqual(sorted(seen[1:]), ["alice console", "bob away"])


def alice_from_afar_is_away_when_nobody_is_at_the_console(lab):
    _leave_console(lab, "alice")

    seen = lab.user("alice", "vlm-console-user").output.splitlines()

    check.assertEqual(seen, ["nobody", "alice away"])


def a_session_in_the_background_is_not_at_the_console(lab):
    options = ["--unit=background", "--property=User=bob", "--property=PAMName=login"]
    lab.root(
        "systemd-run", "--quiet", *options, "--setenv=XDG_SESSION_CLASS=background", "sleep", "60"
    )
    lab.wait_until("bob has a session", lambda: "bob away" in _seen(lab))

    check.assertEqual(_seen(lab)[0], "alice")


def switching_to_bob_and_back_changes_the_answer(lab):
    lab.root("systemctl", "start", "console@bob")
    check.assertEqual(_seen(lab)[0], "bob")
    check.assertEqual(sorted(_seen(lab)[1:]), ["alice away", "bob console"])

    come_back(lab, "alice")

    check.assertEqual(_seen(lab)[0], "alice")
    check.assertEqual(sorted(_seen(lab)[1:]), ["alice console", "bob away"])


def nobody_is_at_the_console_when_alice_has_left(lab):
    _leave_console(lab, "alice")

    check.assertEqual(_seen(lab), ["nobody"])


def who_left_a_program_behind_has_left(lab):
    _leave_console(lab, "alice")
    session = ["--property=User=bob", "--property=PAMName=login"]
    for name, value in (("SEAT", "seat0"), ("SESSION_TYPE", "x11"), ("SESSION_CLASS", "user")):
        session.append(f"--setenv=XDG_{name}={value}")
    leave = "setsid sleep 60 & until test -e /tmp/leave; do sleep 0.1; done"
    lab.root("systemd-run", "--quiet", *session, "sh", "-c", leave)
    lab.wait_until("bob has come", lambda: _seen(lab) == ["bob", "bob console"])

    lab.root("touch", "/tmp/leave")

    lab.wait_until("bob has left", lambda: _seen(lab) == ["nobody", "bob away"])


def root_at_the_console_counts_as_nobody(lab):
    _leave_console(lab, "alice")
    lab.root("systemctl", "start", "console@root")

    check.assertEqual(_seen(lab), ["nobody", "root console"])


def a_locked_screen_is_still_the_users(lab):
    lab.root("loginctl", "lock-sessions")

    check.assertEqual(_seen(lab), ["alice", "alice console"])


def without_logind_nobody_is_known_to_be_there(lab):
    lab.root("systemctl", "stop", "systemd-logind.service")
    # What it published stays for the next one; a machine without logind has none of it.
    lab.root("rm", "-r", "/run/systemd/sessions")

    check.assertEqual(_seen(lab), ["nobody"])


def _seen(lab) -> list[str]:
    return lab.root("vlm-console-user").output.splitlines()


def _leave_console(lab, user: str) -> None:
    lab.root("systemctl", "stop", f"console@{user}")
    lab.wait_until("the session has ended", lambda: f"{user} console" not in _seen(lab))
    lab.wait_until("and is forgotten", lambda: f"{user} away" not in _seen(lab))
