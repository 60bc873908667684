"""The pairing window: who gets it, what it offers while cards come and go, and how it is used."""

import time

from machine.checks import check
from machine.hints_daemon import leave_soon
from machine.listing import only_identity, pair, present
from machine.pairing_window import (
    ITS_LINES,
    TITLE,
    check_said,
    insert,
    offer,
    offered,
    said,
    wait_for_end,
    wait_for_focus,
    wait_for_line,
)
from machine.quiet import expect_quiet
from machine.sessions import come_back

ALICE, CAROL = "Alice Archer", "Carol Cooper"


def an_inserted_card_is_offered(lab):
    offer(lab, "rsa")

    check.assertEqual(offered(lab), [ALICE])


def an_elliptic_card_is_offered(lab):
    offer(lab, "ec")

    check.assertEqual(offered(lab), ["Bob Baker"])


def each_identity_of_a_card_is_offered_in_order(lab):
    offer(lab, "two-identities")

    check.assertEqual(offered(lab), ["Frank Fisher", "Frank Fisher (Administrator)"])


def a_second_card_adds_its_group_and_takes_it_away_again(lab):
    offer(lab, "rsa")

    lab.insert("second", 2)
    lab.wait_until("both are offered", lambda: len(offered(lab)) == 3)
    check.assertEqual(offered(lab)[1], "", "a separator")
    check.assertEqual(sorted(offered(lab)), ["", ALICE, CAROL])

    lab.remove(1)
    lab.wait_until("the second is left", lambda: offered(lab) == [CAROL])


def the_last_card_takes_the_window_with_it(lab):
    offer(lab, "rsa")

    lab.remove()

    wait_for_end(lab)
    check_said(lab, "all tokens were removed", "vlm bind canceled")


def a_card_that_cannot_unlock_a_keyring_is_not_offered(lab):
    insert(lab, "no-wrap-key")

    wait_for_line(lab, "no unpaired identities found")
    wait_for_end(lab)
    check_said(
        lab, "No RSA decryption key or ECDH key was found for token: ", "vlm bind interrupted"
    )


def a_card_that_cannot_unlock_a_keyring_adds_nothing(lab):
    offer(lab, "rsa")

    lab.insert("no-wrap-key", 2)

    wait_for_line(lab, "No RSA decryption key or ECDH key was found for token: ")
    check.assertEqual(offered(lab), [ALICE])


def an_expired_card_is_not_offered(lab):
    insert(lab, "expired")

    wait_for_line(lab, "no unpaired identities found")
    wait_for_end(lab)


def a_name_that_would_deceive_is_shown_as_it_is_written(lab):
    offer(lab, "hostile")

    (name,) = offered(lab)
    check.assertIn("<b>Eve</b> &amp; ", name)
    check.assertIn("%s {}", name)
    for mark in "\u202e\u202c\u2066\u2069":
        check.assertNotIn(mark, name)


def without_a_card_there_is_no_window(lab):
    lab.user("alice", "vlmbind", "-f")

    wait_for_line(lab, "no unpaired identities found")
    wait_for_end(lab)


def a_card_pulled_before_it_could_be_shown_is_not_waited_for_longer_than_half_a_minute(lab):
    _pull_between_listing_and_watching(lab)
    insert(lab, "rsa")
    only_identity(lab, ALICE)
    lab.user("alice", "vlmbind", "-f")
    wait_for_line(lab, "all unmatched identities: ")

    wait_for_line(lab, "token was removed before showing dialog", 40)
    wait_for_end(lab)
    check.assertIn("vlm bind interrupted", said(lab))
    check.assertNotIn(TITLE, lab.windows())


def a_guest_is_offered_nothing(lab):
    _be_at_the_console(lab, "guest")
    insert(lab, "rsa", before="guest")

    wait_for_line(lab, "current user is guest account")
    wait_for_end(lab, "guest")
    check_said(lab, "vlm bind interrupted")


def the_account_that_sets_up_a_machine_is_offered_nothing(lab):
    lab.root("useradd", "--create-home", "--shell", "/bin/bash", "gnome-initial-setup")
    _be_at_the_console(lab, "gnome-initial-setup")
    insert(lab, "rsa", before="gnome-initial-setup")

    wait_for_line(lab, "invalid current user: gnome-initial-setup")
    wait_for_end(lab, "gnome-initial-setup")
    check_said(lab, "vlm bind interrupted")


def who_is_not_at_the_console_is_offered_nothing(lab):
    lab.root("systemctl", "start", "console@bob")
    come_back(lab, "alice")
    insert(lab, "rsa", before="bob")
    lab.user("bob", "vlmbind", "-f")

    wait_for_line(lab, "User 'bob' is not in active session")
    wait_for_end(lab, "bob")
    check_said(lab, "vlm bind interrupted")


def who_is_paired_is_offered_nothing_where_one_card_is_the_rule(lab):
    _pair_alice(lab)
    lab.root("vlmctl", "set", "oneCardPerUser", "true")
    insert(lab, "second", 2)

    wait_for_line(lab, "Cannot pair user which is already paired")
    wait_for_end(lab)
    check_said(lab, "vlm bind interrupted")


def who_is_paired_is_offered_a_second_card_otherwise(lab):
    _pair_alice(lab)

    offer(lab, "second", reader=2)

    check.assertEqual(offered(lab), [CAROL])


def a_card_that_is_paired_already_is_not_offered(lab):
    _pair_alice(lab)
    lab.remove()

    insert(lab, "rsa")

    wait_for_line(lab, "no unpaired identities found")
    wait_for_end(lab)


def it_is_above_the_others_in_the_middle_and_has_the_focus(lab):
    offer(lab, "rsa")

    shell = "xdotool getactivewindow getwindowname getwindowgeometry --shell"
    seen = lab.user("alice", "sh", "-c", shell).output
    check.assertIn("SmartCard Pairing", seen)
    place = dict(line.split("=") for line in seen.splitlines() if "=" in line)
    check.assertAlmostEqual(int(place["X"]) + int(place["WIDTH"]) / 2, 1280 / 2, delta=20)
    check.assertAlmostEqual(int(place["Y"]) + int(place["HEIGHT"]) / 2, 800 / 2, delta=40)
    stays = lab.user("alice", "sh", "-c", "xprop -id $(xdotool getactivewindow) _NET_WM_STATE")
    check.assertIn("_NET_WM_STATE_ABOVE", stays.output)


def nothing_wakes_anybody_while_it_waits_for_a_person(lab):
    # Software cards announce nothing, and are looked for while somebody watches.
    lab.root("rm", "/usr/share/p11-kit/modules/softhsm2.module")
    leave_soon(lab)
    offer(lab, "rsa")
    time.sleep(30)  # Then it looks once whether it has shown its window.

    expect_quiet(lab, "vlmhintsd", "vlmbind")


def every_part_has_a_role_and_a_name(lab):
    offer(lab, "two-identities")

    shown = lab.windows()
    for part in (
        TITLE,
        "label: Pair this smart card with your account?",
        "combo box: Frank Fisher",
        "push button: Pair",
        "push button: Cancel",
        "push button: Do not show again",
    ):
        check.assertIn(part, shown)


def assistive_programs_give_the_focus_and_press_buttons(lab):
    offer(lab, "two-identities")

    lab.windows("grab", "combo box")
    lab.press_keys("Down")
    lab.wait_until("it is chosen", lambda: "box: Frank Fisher (Admin" in lab.windows())
    lab.windows("press", "Cancel")

    wait_for_end(lab)
    check.assertIn("result: 2", lab.journal(ITS_LINES, "ACTIVITY=clicked 'Cancel'"))
    check_said(lab, "vlm bind canceled")


def the_keyboard_reaches_and_works_everything(lab):
    offer(lab, "two-identities")
    wait_for_focus(lab, "combo box: Frank Fisher")

    lab.press_keys("Down")
    wait_for_focus(lab, "combo box: Frank Fisher (Administrator)")
    for part in ("Pair", "Cancel", "Do not show again"):
        lab.press_keys("Tab")
        wait_for_focus(lab, f"push button: {part}")
    lab.press_keys("Tab")
    wait_for_focus(lab, "combo box: Frank Fisher (Administrator)")
    lab.press_keys("alt+c")

    wait_for_end(lab)


def escape_cancels(lab):
    offer(lab, "rsa")

    lab.press_keys("Escape")

    wait_for_end(lab)
    check_said(lab, "vlm bind canceled")


def closing_the_window_cancels(lab):
    offer(lab, "rsa")

    lab.press_keys("alt+F4")

    wait_for_end(lab)
    check_said(lab, "vlm bind canceled")


def _pair_alice(lab) -> None:
    """From a shell, without a window meanwhile."""
    lab.user("alice", "vlmbind", "-s", "disable")
    done = pair(lab, "alice", present(lab, "rsa", ALICE))
    check.assertEqual(done.status, 0, done)
    lab.user("alice", "vlmbind", "-s", "enable")


def _be_at_the_console(lab, user: str) -> None:
    lab.root("systemctl", "stop", "console@alice")
    lab.root("systemctl", "start", f"console@{user}")


def _pull_between_listing_and_watching(lab) -> None:
    """An instance that answers as the real one does, and then sees no token any more."""
    lab.user("alice", "systemctl", "--user", "mask", "--runtime", "--now", "vlmhintsd.service")
    options = ["--collect", "--unit=sees-no-token", "--service-type=dbus"]
    options.append("--property=BusName=org.vlm.token.hints.agent")
    lab.user("alice", "systemd-run", "--user", "--quiet", *options, "vlm-sees-no-token")
