"""Who logs in: at a terminal, and through the service of a display manager."""

import os
import pty
import re
import select
import subprocess
import time

from machine.checks import check
from machine.listing import only_identity

PATIENCE_SECONDS = 30
PIN_PROMPT = re.compile(r'PIN of the card "[^"]*": $')
PASSWORD_PROMPT = re.compile(r"[Pp]assword: $")
NAME_PROMPT = re.compile(r"login: $")

# As display managers have it: everything but the keyring is the machine's own.
DISPLAY_MANAGER = """
auth requisite pam_nologin.so
@include common-auth
auth optional pam_gnome_keyring.so
@include common-account
session required pam_env.so
@include common-session
session optional pam_gnome_keyring.so auto_start
@include common-password
"""


class Terminal:
    """A program on a terminal, before which a person sits."""

    def __init__(self, lab, *command: str) -> None:
        whole = lab.command_for(None, list(command), terminal=True)
        self._ours, theirs = pty.openpty()
        self._process = subprocess.Popen(whole, stdin=theirs, stdout=theirs, stderr=theirs)
        os.close(theirs)
        self._new = ""
        self.shown = ""

    def wait_for(self, pattern: re.Pattern) -> str:
        """What was shown since the last answer, up to a prompt."""
        end = time.monotonic() + PATIENCE_SECONDS
        while not pattern.search(self._new):
            left = end - time.monotonic()
            if left <= 0 or not self._read(left):
                raise AssertionError(f"waited for {pattern.pattern} in vain: {self.shown!r}")
        return self._new

    def type(self, text: str) -> None:
        self._new = ""
        os.write(self._ours, (text + "\n").encode())

    def answer(self, prompt: re.Pattern, text: str) -> str:
        shown = self.wait_for(prompt)
        self.type(text)
        return shown

    def end(self) -> str:
        """All that it showed until it ended by itself."""
        while self._read(PATIENCE_SECONDS):
            pass
        os.close(self._ours)
        self._process.wait(PATIENCE_SECONDS)
        return self.shown

    def give_up(self) -> str:
        os.write(self._ours, b"\x03")
        return self.end()

    def _read(self, seconds: float) -> bool:
        if not select.select([self._ours], [], [], seconds)[0]:
            raise AssertionError(f"nothing more is shown: {self.shown!r}")
        try:
            more = os.read(self._ours, 65536).decode(errors="replace").replace("\r\n", "\n")
        except OSError:
            return False
        self._new += more
        self.shown += more
        return bool(more)


def turn_on(lab) -> None:
    _pam_auth_update(lab, "--enable")
    lab.root("tee", "/etc/pam.d/lab-display-manager", typed=DISPLAY_MANAGER)


def turn_off(lab) -> None:
    _pam_auth_update(lab, "--disable")


def _pam_auth_update(lab, verb: str) -> None:
    profiles = ["vlm", "vlm-session"]
    done = lab.root("env", "DEBIAN_FRONTEND=noninteractive", "pam-auth-update", verb, *profiles)
    check.assertEqual(done.status, 0, done)


def pair(lab, account: str, name: str, card: str, reader: int = 1) -> str:
    """Inserts a card and pairs it, without any question; the hash of its identity with that name."""
    lab.insert(card, reader)
    hash_ = only_identity(lab, name)
    pair_inserted(lab, account, hash_)
    return hash_


def pair_unoffered(lab, account: str, card: str) -> None:
    """Likewise for a card whose identity nobody is offered any more."""
    lab.insert(card)
    pair_inserted(lab, account, lab.wait_until(f"{card} is in", lambda: hash_of(lab, card)))


def pair_inserted(lab, account: str, hash_: str) -> None:
    done = lab.root(
        "/usr/lib/vlm-lab/ask-hints", f"login {hash_} 123456", f"pair {account} {hash_}"
    )
    check.assertEqual(done.output.split(), ["0", "0"], done)


def hash_of(lab, card: str) -> str:
    """Of the key 9a, as the card's certificate has it."""
    certificate = f"/var/lib/vlm-lab/cards/{card}/9a.cert.pem"
    key = f"openssl x509 -in {certificate} -noout -pubkey | openssl pkey -pubin -outform DER"
    hash_ = lab.root("sh", "-c", f"{key} | sha256sum").output[:64].upper()
    listed = lab.root("vlmctl", "tokens", "--json").output.upper()
    return hash_ if hash_ in listed else ""


class Greeter(Terminal):
    """A display manager's greeter, which knows whose name was clicked."""

    # What a program shows just before it ends may get lost on the way, so its end is waited for.
    AND_SAY_WHEN_DONE = '"$@"; echo "(ended with $?)"; read -r wait'
    DONE = re.compile(r"\(ended with \d+\)")

    def __init__(
        self,
        lab,
        user: str,
        terminal: str = ":0",
        environment: str = "LANG=C",
        remote_host: str = "",
    ) -> None:
        items = ["-I", f"tty={terminal}", *(["-I", f"rhost={remote_host}"] if remote_host else [])]
        what = ["lab-display-manager", user, "authenticate", "acct_mgmt"]
        program = ["env", environment, "pamtester", *items, *what]
        super().__init__(lab, "sh", "-c", self.AND_SAY_WHEN_DONE, "sh", *program)

    def end(self) -> str:
        self.answer(self.DONE, "")
        return super().end()


def greeted_with(lab, user: str, terminal: str = ":0", remote_host: str = "", **typed: str) -> str:
    """What the greeter shows when the person types these answers, a PIN or a password."""
    prompts = {"pin": PIN_PROMPT, "password": PASSWORD_PROMPT}
    greeter = Greeter(lab, user, terminal, remote_host=remote_host)
    for which, text in typed.items():
        greeter.answer(prompts[which], text)
    return greeter.end()


def check_let_in(shown: str) -> None:
    check.assertIn("successfully authenticated", shown)
    check.assertIn("account management done", shown)


def check_kept_out(shown: str) -> None:
    check.assertNotIn("successfully authenticated", shown)
    check.assertRegex(shown, r"\(ended with [1-9]")
