"""The desktop's agent is told of each card that is inserted, once, and nothing else wakes anybody."""

from machine.checks import check
from machine.hints_daemon import SERVICE, leave_soon
from machine.listing import identities, only_identity
from machine.quiet import expect_quiet
from machine.sessions import come_back

DELIVERED = "/run/vlm-lab/delivered"
NOTIFICATION = "org.vlm.token.new-token"


def each_card_is_told_once(lab):
    _receive(lab)

    lab.insert("rsa", 1)
    _wait_for(lab, 1)
    lab.insert("second", 2)

    _wait_for(lab, 2)


def a_card_that_comes_back_is_told_again(lab):
    _receive(lab)
    lab.insert("rsa")
    _wait_for(lab, 1)
    lab.remove()

    lab.insert("rsa")

    _wait_for(lab, 2)


def a_card_that_is_in_when_the_user_logs_in_is_told(lab):
    _receive(lab, "bob")
    lab.insert("rsa")

    lab.root("systemctl", "start", "console@bob")

    _wait_for(lab, 1, "bob")


def a_card_that_is_slow_is_told_when_it_is_read(lab):
    _receive(lab)

    lab.insert("slow")

    _wait_for(lab, 1, seconds=60)


def a_restart_of_the_daemon_brings_no_card(lab):
    _receive(lab)
    lab.insert("rsa", 1)
    _wait_for(lab, 1)

    lab.root("systemctl", "restart", SERVICE)
    lab.insert("second", 2)

    _wait_for(lab, 2)


def a_restart_of_pcscd_brings_no_card(lab):
    _receive(lab)
    lab.insert("rsa", 1)
    _wait_for(lab, 1)

    # A virtual card leaves with pcscd; a real one would still be in.
    lab.root("systemctl", "restart", "pcscd.service")
    lab.insert("rsa", 1)
    only_identity(lab, "Alice Archer")
    lab.insert("second", 2)

    _wait_for(lab, 2)


def who_is_not_at_the_console_is_told_when_he_is_back(lab):
    _receive(lab, "alice")
    _receive(lab, "bob")
    lab.root("systemctl", "start", "console@bob")

    lab.insert("rsa", 1)
    _wait_for(lab, 1, "bob")
    lab.insert("second", 2)
    _wait_for(lab, 2, "bob")
    check.assertEqual(_told(lab, "alice"), [])
    lab.remove(2)
    lab.wait_until("it is gone", lambda: len(identities(lab)) == 1)
    come_back(lab, "alice")

    _wait_for(lab, 1, "alice")
    lab.insert("ec", 2)
    _wait_for(lab, 2, "alice")
    check.assertEqual(len(_told(lab, "bob")), 2)


def pcscd_may_come_late(lab):
    _receive(lab)
    lab.root("systemctl", "stop", "pcscd.socket", "pcscd.service")
    leave_soon(lab)

    expect_quiet(lab, "vlmhintsd")
    lab.root("systemctl", "start", "pcscd.socket")
    lab.root("systemctl", "restart", "virtual-readers")
    lab.insert("rsa")

    _wait_for(lab, 1)


def nothing_wakes_anybody_while_no_card_is_in(lab):
    leave_soon(lab)

    expect_quiet(lab, "vlmhintsd")


def nothing_wakes_anybody_while_a_card_is_in(lab):
    _receive(lab)
    leave_soon(lab)
    lab.insert("rsa")
    _wait_for(lab, 1)

    expect_quiet(lab, "vlmhintsd")


def _receive(lab, user: str = "alice") -> None:
    """Puts a receiver that writes down what it gets into the agent's place."""
    lines = (
        r"[Service]\nExecStart=\n"
        rf"ExecStart=/usr/libexec/vlm-lab/notification_receiver {DELIVERED}-%%u answering\n"
    )
    folder = "/run/systemd/user/vlmbind.service.d"
    lab.root("sh", "-c", f"mkdir -p {folder} && printf '{lines}' >{folder}/receiver.conf")
    lab.root("install", "-o", user, "/dev/null", f"{DELIVERED}-{user}")
    if user == "alice":
        lab.user(user, "systemctl", "--user", "daemon-reload")


def _told(lab, user: str = "alice") -> list[str]:
    lines = lab.root("cat", f"{DELIVERED}-{user}").output.splitlines()
    return [line for line in lines if line != "ready"]


def _wait_for(lab, times: int, user: str = "alice", seconds: float = 20) -> None:
    expected = [NOTIFICATION] * times
    lab.wait_until(f"{user} is told {times} times", lambda: _told(lab, user) == expected, seconds)
