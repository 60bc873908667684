"""The login keyring of alice, and what the daemon has stored to open it."""

import sqlite3
import tempfile

from machine.checks import check

SECRETS = "org.freedesktop.secrets"
LOGIN = "/org/freedesktop/secrets/collection/login"


def lock(lab) -> None:
    call = ["busctl", "--user", "call", SECRETS, "/org/freedesktop/secrets"]
    done = lab.user("alice", *call, "org.freedesktop.Secret.Service", "Lock", "ao", "1", LOGIN)
    check.assertEqual(done.status, 0, done)
    check.assertTrue(is_locked(lab))


def is_locked(lab) -> bool:
    get = ["busctl", "--user", "get-property", SECRETS, LOGIN]
    done = lab.user("alice", *get, "org.freedesktop.Secret.Collection", "Locked")
    check.assertIn(done.output, ("b true\n", "b false\n"), done)
    return done.output == "b true\n"


def has_owner(lab) -> bool:
    names = lab.user("alice", "busctl", "--user", "list", "--acquired", "--no-legend").output
    return any(line.split()[0] == SECRETS for line in names.splitlines())


def take_away(lab) -> None:
    """No provider runs, and none is started."""
    lab.root("pkill", "--uid", "alice", "--full", "gnome-keyring-daemon")
    lab.wait_until("no keyring is there", lambda: not has_owner(lab))


def start_a_plain_one(lab) -> None:
    """Another provider, which takes no password from programs."""
    take_away(lab)
    program = "/usr/lib/vlm-lab/desktop/plain-secrets"
    lab.user("alice", "systemd-run", "--user", "--quiet", "--collect", program)
    lab.wait_until("it is there", lambda: has_owner(lab))


def unlock_keys(lab) -> list[tuple[str, str]]:
    """Accounts and the hashes that an unlock key is stored for, as the database has it."""
    with tempfile.TemporaryDirectory() as folder:
        for end in ("", "-wal", "-shm"):
            read = ["sh", "-c", f"cat /var/lib/vlm/hints.sqlite3{end} 2>/dev/null"]
            content = lab.container.run(read, capture_output=True).stdout
            with open(f"{folder}/hints.sqlite3{end}", "wb") as file:
                file.write(content)
        with sqlite3.connect(f"{folder}/hints.sqlite3") as database:
            rows = database.execute("SELECT account, hex(hash) FROM unlock_key").fetchall()
    return sorted(rows)
