"""The pairing window of who is at the console, and what its agent says and comes to."""

from machine.checks import check

TITLE = "dialog: SmartCard Pairing"

# Not _COMM, which the journal looks up: the process of a short line may be gone by then.
ITS_LINES = "SYSLOG_IDENTIFIER=vlmbind"


def insert(lab, card: str, reader: int = 1, before: str = "alice") -> None:
    """Before the eyes of a user at the console, for whom the agent will log everything."""
    lab.user(before, "systemctl", "--user", "set-environment", "VLM_LOG_LEVEL=debug")
    lab.insert(card, reader)


def offer(lab, card: str, reader: int = 1) -> None:
    insert(lab, card, reader)
    wait_for_window(lab)


def wait_for_window(lab) -> None:
    lab.wait_until("the window is there", lambda: TITLE in lab.windows())


def offered(lab) -> list[str]:
    lines = [line.strip() for line in lab.windows().splitlines()]
    return [line.removeprefix("list item:").strip() for line in lines if "list item:" in line]


def wait_for_focus(lab, part: str) -> None:
    lab.wait_until(f"{part} has the focus", lambda: lab.windows("focus").strip() == part)


def wait_for_alert(lab) -> str:
    """What the screen shows with it."""
    return lab.wait_until(
        "an alert is there", lambda: "alert:" in (shown := lab.windows()) and shown
    )


def said(lab) -> str:
    return lab.journal(ITS_LINES)


def check_said(lab, *lines: str) -> None:
    whole = said(lab)
    for line in lines:
        check.assertIn(line, whole)


def wait_for_line(lab, line: str, seconds: float = 20) -> None:
    lab.wait_until(f"{line} is in the log", lambda: line in said(lab), seconds)


def wait_for_end(lab, user: str = "alice") -> None:
    """Well, whatever the bind came to."""

    def ended() -> bool:
        show = ["--property=ActiveState,Result", "vlmbind.service"]
        shown = lab.user(user, "systemctl", "--user", "show", *show).output
        return set(shown.split()) == {"ActiveState=inactive", "Result=success"}

    lab.wait_until("the agent has ended", ended)
    check.assertIn("no bind is running, exiting", said(lab))
