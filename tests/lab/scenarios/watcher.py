"""Programs that watch tokens are told what the readers see, whatever happens in between."""

from machine.checks import check

TOLD = "/run/vlm-lab/tokens"


def a_card_that_comes_and_goes_is_told(lab):
    _watch(lab)

    lab.insert("rsa")
    _wait_for(lab, ["+"])
    lab.remove()
    _wait_for(lab, ["+", "-"])
    lab.insert("rsa")

    _wait_for(lab, ["+", "-", "+"])


def a_card_that_is_in_already_is_told_first(lab):
    lab.insert("rsa")

    _watch(lab)

    _wait_for(lab, ["+"])


def cards_in_two_readers_are_told_apart(lab):
    _watch(lab)
    lab.insert("rsa", 1)
    _wait_for(lab, ["+"])
    lab.insert("second", 2)
    _wait_for(lab, ["+", "+"])

    lab.remove(1)

    _wait_for(lab, ["+", "+", "-"])
    first, second, gone = _told(lab)
    check.assertEqual(gone[2:], first[2:])
    check.assertNotEqual(gone[2:], second[2:])


def a_card_that_is_slow_is_told_when_it_is_read(lab):
    _watch(lab)

    lab.insert("slow")

    _wait_for(lab, ["+"], 60)


def pcscd_may_be_killed(lab):
    _watch(lab)
    lab.insert("rsa")
    _wait_for(lab, ["+"])

    lab.root("systemctl", "kill", "--signal=KILL", "pcscd.service")
    _wait_for(lab, ["+", "-"])
    lab.root("systemctl", "restart", "virtual-readers")
    lab.insert("rsa")

    _wait_for(lab, ["+", "-", "+"])


def the_users_instance_may_be_restarted(lab):
    _watch(lab)
    lab.insert("rsa")
    _wait_for(lab, ["+"])

    lab.user("alice", "systemctl", "--user", "restart", "vlmhintsd.service")
    lab.insert("second", 2)

    # What was there before is not told anew.
    _wait_for(lab, ["+", "+"])


def a_card_pulled_while_the_users_instance_is_away_is_told_later(lab):
    _watch(lab)
    lab.insert("rsa")
    _wait_for(lab, ["+"])
    lab.user("alice", "systemctl", "--user", "mask", "--runtime", "vlmhintsd.service")
    lab.user("alice", "systemctl", "--user", "stop", "vlmhintsd.service")
    lab.remove()

    lab.user("alice", "systemctl", "--user", "unmask", "--runtime", "vlmhintsd.service")

    _wait_for(lab, ["+", "-"])


def the_daemon_may_be_stopped(lab):
    _watch(lab)
    lab.insert("rsa")
    _wait_for(lab, ["+"])
    lab.root("systemctl", "stop", "vlmhintsd.service")

    lab.remove()

    _wait_for(lab, ["+", "-"])


def _watch(lab) -> None:
    # Without software tokens, which are looked at now and then, nothing but events tells.
    lab.root("rm", "/usr/share/p11-kit/modules/softhsm2.module")
    lab.root("install", "-o", "alice", "/dev/null", TOLD)
    # fmt: off
    started = lab.user(
        "alice", "systemd-run", "--user", "--quiet", "--unit=watch", "--collect",
        f"--property=StandardOutput=append:{TOLD}",
        "sh", "-c", "sleep infinity | vlm-watch-tokens",
    )
    # fmt: on
    check.assertEqual(started.status, 0, started)


def _told(lab) -> list[str]:
    return lab.root("cat", TOLD).output.splitlines()


def _wait_for(lab, signs: list[str], seconds: float = 20) -> None:
    lab.wait_until(f"{signs} is told", lambda: [line[0] for line in _told(lab)] == signs, seconds)
