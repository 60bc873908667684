"""Programs that watch tokens are told what the readers see, whatever happens in between."""

from machine.checks import check
from machine.token_watcher import told, wait_for, watch


def a_card_that_comes_and_goes_is_told(lab):
    watch(lab)

    lab.insert("rsa")
    wait_for(lab, ["+"])
    lab.remove()
    wait_for(lab, ["+", "-"])
    lab.insert("rsa")

    wait_for(lab, ["+", "-", "+"])


def a_card_that_is_in_already_is_told_first(lab):
    lab.insert("rsa")

    watch(lab)

    wait_for(lab, ["+"])


def cards_in_two_readers_are_told_apart(lab):
    watch(lab)
    lab.insert("rsa", 1)
    wait_for(lab, ["+"])
    lab.insert("second", 2)
    wait_for(lab, ["+", "+"])

    lab.remove(1)

    wait_for(lab, ["+", "+", "-"])
    first, second, gone = told(lab)
    check.assertEqual(gone[2:], first[2:])
    check.assertNotEqual(gone[2:], second[2:])


def a_card_that_is_slow_is_told_when_it_is_read(lab):
    watch(lab)

    lab.insert("slow")

    wait_for(lab, ["+"], 60)


def pcscd_may_be_killed(lab):
    watch(lab)
    lab.insert("rsa")
    wait_for(lab, ["+"])

    lab.root("systemctl", "kill", "--signal=KILL", "pcscd.service")
    wait_for(lab, ["+", "-"])
    lab.root("systemctl", "restart", "virtual-readers")
    lab.insert("rsa")

    wait_for(lab, ["+", "-", "+"])


def the_users_instance_may_be_restarted(lab):
    watch(lab)
    lab.insert("rsa")
    wait_for(lab, ["+"])

    lab.user("alice", "systemctl", "--user", "restart", "vlmhintsd.service")
    lab.insert("second", 2)

    # What was there before is not told anew.
    wait_for(lab, ["+", "+"])


def a_card_pulled_while_the_users_instance_is_away_is_told_later(lab):
    watch(lab)
    lab.insert("rsa")
    wait_for(lab, ["+"])
    lab.user("alice", "systemctl", "--user", "mask", "--runtime", "vlmhintsd.service")
    lab.user("alice", "systemctl", "--user", "stop", "vlmhintsd.service")
    lab.remove()

    lab.user("alice", "systemctl", "--user", "unmask", "--runtime", "vlmhintsd.service")

    wait_for(lab, ["+", "-"])


def the_daemon_may_be_stopped(lab):
    watch(lab)
    lab.insert("rsa")
    wait_for(lab, ["+"])
    lab.root("systemctl", "stop", "vlmhintsd.service")

    lab.remove()

    wait_for(lab, ["+", "-"])
