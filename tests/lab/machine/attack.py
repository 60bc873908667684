"""What scenarios of attacks share: what must be as before, and the programs of those who attack."""

import subprocess
from contextlib import contextmanager

from machine.by_hand import pairings
from machine.checks import check
from machine.hints_daemon import SERVICE

TOOLS = "/usr/lib/vlm-lab"
DAEMON = "org.vlm.token.hints.daemon"
AGENT = "org.vlm.token.hints.agent"
EXCHANGE = (DAEMON, "/org/vlm/token/hints", "org.vlm.token.hints", "Exchange", "a{sv}")
NOT_PERMITTED = "-2001"


@contextmanager
def nothing_changes(lab):
    """Neither pairings, their file nor settings; the daemon is the same, and serves."""
    check.assertEqual(lab.root("vlmbind", "-i").status, 0)  # From here on it has its file.
    before = _state(lab)
    yield
    check.assertEqual(_state(lab), before)
    check.assertEqual(lab.user("alice", "vlmbind", "-i").status, 0)


def _state(lab) -> dict:
    # A reader of the log leaves its mark in the third file, -shm.
    files = "sha256sum /var/lib/vlm/hints.sqlite3 /var/lib/vlm/hints.sqlite3-wal"
    return {
        "pairings": pairings(lab),
        "files": lab.root("sh", "-c", files).output,
        "settings": lab.root("vlmctl", "settings").output,
        "daemon": daemon_pid(lab),
    }


def exchange(lab, user: str, *keys: str):
    """One request of the user's to the daemon; KEY TYPE VALUE for each key, as busctl wants them."""
    count = sum(1 for each in keys if each in KEYS)
    return lab.user(user, "busctl", "call", "--", *EXCHANGE, str(count), *keys)


KEYS = ("op", "uid", "dat1", "str1", "str2", "str3", "num1")


def hash_words(hash_: str) -> tuple[str, ...]:
    return "dat1", "ay", "32", *(str(each) for each in bytes.fromhex(hash_))


def result(done) -> str:
    """The status in an answer."""
    check.assertEqual(done.status, 0, done)
    words = done.output.split()
    return words[words.index('"res"') + 2]


def daemon_pid(lab) -> str:
    return lab.root("systemctl", "show", SERVICE, "--property=MainPID", "--value").output.strip()


def instance_pid(lab, user: str) -> str:
    """Of the user's own instance."""
    return lab.root("pgrep", "--uid", user, "--exact", "vlmhintsd").output.strip()


def user_id(lab, user: str) -> str:
    return lab.root("id", "-u", user).output.strip()


class Attacker:
    """A program of somebody's that goes on until its input ends."""

    def __init__(self, lab, user: str, tool: str, *words: str) -> None:
        command = lab.command_for(user, [f"{TOOLS}/{tool}", *words])
        self._process = subprocess.Popen(
            command,
            stdin=subprocess.PIPE,
            stdout=subprocess.PIPE,
            stderr=subprocess.STDOUT,
            text=True,
        )
        self._rest = ""
        self.first_line = self._process.stdout.readline().strip()

    def __enter__(self) -> "Attacker":
        return self

    def __exit__(self, *_) -> None:
        self.end()

    def next_line(self) -> str:
        """Waits for it."""
        return self._process.stdout.readline()

    def end(self) -> str:
        """What else it printed."""
        if self._process.poll() is None:
            self._rest, _ = self._process.communicate(timeout=60)
        return self._rest
