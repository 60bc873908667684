"""Who is at the console, and who is there in the background."""

from machine.checks import check


def active_session(lab) -> str:
    show = ["loginctl", "show-seat", "seat0", "--property=ActiveSession", "--value"]
    return lab.root(*show).output.strip()


def come_back(lab, user: str) -> None:
    """To a session at the console that went into the background."""
    sessions = lab.root("loginctl", "--no-legend").output.splitlines()
    (session,) = [line.split()[0] for line in sessions if line.split()[2:4] == [user, "seat0"]]
    lab.root("loginctl", "activate", session)
    lab.wait_until(f"{user} is back", lambda: active_session(lab) == session)


def set_locked(lab, locked: bool) -> None:
    """Does for the session at the console what a screen locker does."""
    session = active_session(lab)
    # A digit at the head of a path's part is written by its code.
    path = f"/org/freedesktop/login1/session/_3{session[0]}{session[1:]}"
    member = ["org.freedesktop.login1.Session", "SetLockedHint", "b", str(locked).lower()]
    done = lab.root("busctl", "call", "org.freedesktop.login1", path, *member)
    check.assertEqual(done.status, 0, done)
