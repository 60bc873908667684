"""The road of one inserted card, from the reader to the finished pairing."""

from machine.by_hand import pairings
from machine.checks import check
from machine.hints_daemon import leave_soon, runs
from machine.listing import identities, only_identity
from machine.pairing_person import (
    KEYRING_STAYS_SHUT,
    agree,
    check_nothing_is_paired,
    check_the_next_card_pairs,
    click_pair,
    finish_pairing,
)
from machine.pairing_window import (
    TITLE,
    check_said,
    insert,
    offer,
    offered,
    said,
    wait_for_alert,
    wait_for_end,
    wait_for_focus,
    wait_for_line,
    wait_for_window,
)
from machine.sessions import come_back

ALICE, CAROL = "Alice Archer", "Carol Cooper"
MANAGED_OFF = """<?xml version="1.0" encoding="UTF-8"?>
<plist version="1.0"><dict><key>UserPairing</key><false/></dict></plist>
"""


def a_card_is_paired_with_nothing_started_by_hand(lab):
    leave_soon(lab)
    agree(lab)
    offer(lab, "rsa")
    hash_ = only_identity(lab, ALICE)

    lab.windows("press", "Pair")
    finish_pairing(lab)

    listed = lab.root("vlmbind", "-i").output
    check.assertIn("Paired identities which are used for authentication:", listed)
    check.assertIn(f"{hash_}\talice - {ALICE}\n", listed)
    check.assertEqual(len(lab.asked("polkit")), 1)
    check.assertEqual(len(lab.asked("pinentry")), 1)
    check.assertEqual(len(lab.asked("keyring")), 1)
    check_said(lab, "finishWithResult: result: 0", "vlm bind succeeded")
    lab.wait_until("the daemon has left", lambda: not runs(lab))
    check.assertEqual(_running(lab), ["alice vlmhintsd"])


def the_pairing_stands_before_its_alert_is_dismissed(lab):
    agree(lab)
    lab.answer("keyring", "dismiss")
    click_pair(lab)

    shown = wait_for_alert(lab)

    check.assertIn(KEYRING_STAYS_SHUT, shown)
    check.assertIn("enter your password when you are asked to unlock the keyring", shown)
    check.assertEqual(len(pairings(lab)), 1)
    check.assertNotIn("finishWithResult", said(lab))


def a_card_pulled_under_the_alert_takes_it_along_and_stays_paired(lab):
    agree(lab)
    lab.answer("keyring", "dismiss")
    click_pair(lab)
    wait_for_alert(lab)

    lab.remove()

    wait_for_end(lab)
    check.assertNotIn(TITLE, lab.windows())
    check.assertEqual(len(pairings(lab)), 1)
    lab.insert("second")
    wait_for_window(lab)
    check.assertEqual(offered(lab), [CAROL])


def a_card_that_is_in_when_the_user_logs_in_is_paired(lab):
    lab.root("systemctl", "stop", "console@alice")
    lab.insert("rsa")
    agree(lab)

    lab.root("systemctl", "start", "console@bob")
    wait_for_window(lab)
    lab.windows("press", "Pair")
    finish_pairing(lab, "bob")

    check.assertEqual([account for account, _ in pairings(lab)], ["bob"])


def the_second_of_two_cards_is_chosen_by_keyboard(lab):
    agree(lab)
    offer(lab, "rsa", 1)
    lab.insert("second", 2)
    lab.wait_until("both are offered", lambda: len(offered(lab)) == 3)
    lab.wait_until("both are listed", lambda: len(identities(lab)) == 2)
    # Groups stand in the order of their tokens' names.
    last = offered(lab)[-1]

    lab.windows("grab", "combo box")
    lab.press_keys("End")
    wait_for_focus(lab, f"combo box: {last}")
    hash_ = identities(lab)[last]
    lab.press_keys("alt+p")
    finish_pairing(lab)

    check.assertEqual(pairings(lab), [("alice", hash_)])


def a_notification_while_the_window_is_open_opens_no_other(lab):
    agree(lab)
    offer(lab, "rsa")

    lab.user("alice", "vlmbind", "-f")
    wait_for_line(lab, "vlm bind is already running")
    lab.insert("second", 2)
    lab.wait_until("it is told", lambda: said(lab).count("vlm bind is already running") == 2)

    check.assertEqual(lab.windows().count(TITLE), 1)
    lab.windows("press", "Pair")
    finish_pairing(lab)
    check.assertEqual(len(pairings(lab)), 1)


def a_window_waits_for_its_user_while_another_is_at_the_console(lab):
    lab.user("bob", "vlmbind", "-s", "disable")
    agree(lab)
    offer(lab, "rsa")

    lab.root("systemctl", "start", "console@bob")
    wait_for_line(lab, "vlm bind is not allowed, exiting")
    check.assertNotIn(TITLE, lab.windows())
    come_back(lab, "alice")

    check.assertEqual(offered(lab), [ALICE])
    lab.windows("press", "Pair")
    finish_pairing(lab)
    check.assertEqual([account for account, _ in pairings(lab)], ["alice"])


def cancel_pairs_nothing(lab):
    offer(lab, "rsa")

    lab.windows("press", "Cancel")

    wait_for_end(lab)
    check_said(lab, "finishWithResult: result: 2", "vlm bind canceled")
    check.assertEqual(lab.asked("polkit"), [])
    check_nothing_is_paired(lab)
    lab.remove()
    check_the_next_card_pairs(lab)


def who_wants_no_window_gets_one_only_by_asking_for_it(lab):
    agree(lab)
    offer(lab, "rsa")

    lab.windows("press", "Do not show again")
    wait_for_end(lab)
    check_said(lab, "finishWithResult: result: 2", "vlm bind canceled")
    lab.remove()
    lab.insert("rsa")
    wait_for_line(lab, "vlm bind is not allowed, exiting")
    check.assertNotIn(TITLE, lab.windows())

    lab.user("alice", "vlmbind", "-f")
    wait_for_window(lab)
    lab.windows("press", "Pair")
    finish_pairing(lab)
    check.assertEqual(len(pairings(lab)), 1)


def where_management_has_pairing_off_nothing_is_shown(lab):
    folder = "/etc/vlm/managed"
    lab.root("mkdir", "-p", folder)
    lab.root("tee", f"{folder}/org.vlm.smartcard.plist", typed=MANAGED_OFF)

    insert(lab, "rsa")
    wait_for_line(lab, "vlm bind is not enabled, exiting")
    # The tool itself would not even post this.
    deliver = ["org.vlm.vlmbind", "/org/vlm/vlmbind", "org.vlm.Notifications", "Deliver"]
    lab.user("alice", "busctl", "--user", "call", *deliver, "s", "org.vlm.vlmbind.force-bind-ui")
    lab.wait_until("it is heard", lambda: said(lab).count("vlm bind is not enabled, exiting") == 2)

    check.assertNotIn(TITLE, lab.windows())
    check.assertIn(ALICE, identities(lab))


def _running(lab) -> list[str]:
    """Who runs what of ours."""
    lines = lab.root("ps", "-A", "-o", "user=,comm=").output.splitlines()
    words = [line.split() for line in lines]
    return [" ".join(each) for each in words if each[1].startswith(("vlm", "pinentry"))]
