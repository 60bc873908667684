"""What people do at the machine: run commands, insert cards, answer questions, look at the screen."""

import json
import os
import pty
import shlex
import subprocess
import time
from dataclasses import dataclass

from machine.container import Container, LabError

PATIENCE_SECONDS = 40
ANSWERS = "/run/vlm-lab"


@dataclass(frozen=True)
class Done:
    """A command that ended."""

    command: str
    status: int
    output: str
    errors: str

    def __str__(self) -> str:
        return f"{self.command}\nended with {self.status}\n{self.output}{self.errors}"


class Desktop:
    def __init__(self, container: Container) -> None:
        self.container = container

    def root(self, *command: str, typed: str = "") -> Done:
        return self._done(self.command_for(None, list(command)), command, typed)

    def user(self, name: str, *command: str, typed: str = "") -> Done:
        """On the desktop of a user who is logged in; else as one who came in from afar."""
        return self._done(self.command_for(name, list(command)), command, typed)

    def on_terminal(self, name: str | None, command: list[str], typing: dict[str, str]) -> Done:
        """On a terminal where somebody types: when the first text is shown, what belongs to it, then
        when the next is."""
        whole = self.command_for(name, command, terminal=True)
        ours, theirs = pty.openpty()
        process = subprocess.Popen(whole, stdin=theirs, stdout=theirs, stderr=theirs)
        os.close(theirs)
        shown = ""
        waiting = list(typing.items())
        while more := _read_terminal(ours):
            shown += more
            if waiting and waiting[0][0] in shown:
                os.write(ours, waiting.pop(0)[1].encode())
        os.close(ours)
        status = process.wait(3 * PATIENCE_SECONDS)
        return Done(" ".join(command), status, shown.replace("\r\n", "\n"), "")

    def command_for(
        self, user: str | None, command: list[str], terminal: bool = False
    ) -> list[str]:
        if user and not self._has_desktop(user):
            afar = ["ssh", "-q", "-tt" if terminal else "-T", f"{user}@localhost"]
            return self.container.command([*afar, "--", shlex.join(command)])
        # A service has the mounts, the groups and the clean environment of the machine.
        start = ["systemd-run", "--quiet", "--wait", "--collect", "--pty" if terminal else "--pipe"]
        whose = ["--user", f"--machine={user}@"] if user else ["--setenv=HOME=/root"]
        return self.container.command([*start, *whose, "--", *command])

    def insert(self, card: str, reader: int = 1) -> None:
        self._inside("card-ctl", "insert", card, str(reader))

    def remove(self, reader: int = 1) -> None:
        self._inside("card-ctl", "remove", str(reader))

    def card_ctl(self, *words: str) -> str:
        return self._inside("card-ctl", *words)

    def answer(self, who: str, words: str) -> None:
        """What polkit's agent or the pinentry shall do when asked; image/files has the words."""
        self._inside("sh", "-c", f"printf '%s' \"$1\" >{ANSWERS}/{who}", "answer", words)

    def asked(self, who: str) -> list[dict]:
        """The questions so far."""
        lines = self._inside("cat", f"{ANSWERS}/{who}.asked").splitlines()
        return [json.loads(line) for line in lines]

    def journal(self, *options: str) -> str:
        return self._inside("journalctl", "--no-pager", "--output=cat", *options)

    def screenshot(self) -> bytes:
        """A PNG of the console's screen."""
        take = 'exec 2>&1; scrot --overwrite "$XDG_RUNTIME_DIR/shot.png"'
        user = self._user_at_console()
        taken = self.user(user, "sh", "-c", take)
        if taken.status != 0:
            raise LabError(f"no screenshot: {taken.output}")
        image = f"/run/user/$(id -u {user})/shot.png"
        return self.container.run(
            ["sh", "-c", f"cat {image}; rm {image}"], capture_output=True
        ).stdout

    def windows(self, *words: str) -> str:
        """What assistive programs see at the console; the program's own text has the words."""
        program = "/usr/lib/vlm-lab/desktop/windows"
        return self.user(self._user_at_console(), program, *words).output

    def press_keys(self, *keys: str) -> None:
        """On the keyboard at the console, one after the other; xdotool's names."""
        self.user(self._user_at_console(), "xdotool", "key", "--delay", "50", *keys)

    def wait_until(self, what: str, reached, seconds: float = PATIENCE_SECONDS):
        """The first answer of reached() that counts as true."""
        end = time.monotonic() + seconds
        while not (answer := reached()):
            if time.monotonic() > end:
                raise AssertionError(f"waited {seconds} s in vain for this: {what}")
            time.sleep(0.05)
        return answer

    def _user_at_console(self) -> str:
        active = self._inside(
            "loginctl", "show-seat", "seat0", "--property=ActiveSession", "--value"
        )
        if not active.strip():
            raise LabError("nobody is at the console")
        show = ["loginctl", "show-session", active.strip(), "--property=Name", "--value"]
        return self._inside(*show).strip()

    def _has_desktop(self, user: str) -> bool:
        sessions = self._inside("loginctl", "list-sessions", "--no-legend").splitlines()
        return any(line.split()[2:4] == [user, "seat0"] for line in sessions)

    def _inside(self, *command: str) -> str:
        """For what the lab itself needs done."""
        done = self.container.run(list(command), capture_output=True, text=True)
        if done.returncode != 0:
            raise LabError(f"{' '.join(command)}: {(done.stderr or done.stdout).strip()}")
        return done.stdout

    def _done(self, whole: list[str], command: tuple[str, ...], typed: str) -> Done:
        done = subprocess.run(
            whole, input=typed, capture_output=True, text=True, timeout=3 * PATIENCE_SECONDS
        )
        return Done(" ".join(command), done.returncode, done.stdout, done.stderr)


def _read_terminal(descriptor: int) -> str:
    """What was shown since; nothing at the end, which Linux tells by an error."""
    try:
        return os.read(descriptor, 65536).decode(errors="replace")
    except OSError:
        return ""
