"""What scenarios ask of the service by hand, as a program of a user's own could."""

import subprocess

from machine.checks import check

ASK = "/usr/lib/vlm-lab/ask-hints"
ADMINISTRATOR = "password pw-carol"


def ask(lab, *requests: str):
    """As alice; all from one process."""
    return lab.user("alice", ASK, *requests)


def ask_to_pair(lab, hash_: str):
    return ask(lab, *pairing(hash_))


def pairing(hash_: str, account: str = "alice") -> tuple[str, str]:
    return f"login {hash_} 123456", f"pair {account} {hash_}"


def begin(lab, *requests: str) -> subprocess.Popen:
    command = lab.command_for("alice", [ASK, *requests])
    return subprocess.Popen(command, stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True)


def end(asking: subprocess.Popen) -> str:
    """What it printed, when all was answered."""
    output, _ = asking.communicate(timeout=30)
    return output


def statuses(done) -> list[str]:
    check.assertEqual(done.status, 0, done)
    return statuses_in(done.output)


def statuses_in(output: str) -> list[str]:
    return [line.split()[0] for line in output.splitlines()]


def pairings(lab) -> list[tuple[str, str]]:
    """Accounts and the hashes that they are paired with."""
    lines = [line.split() for line in lab.root("vlmctl", "pairings").output.splitlines()]
    return sorted((words[0], word) for words in lines for word in words if len(word) == 64)
