"""The pairing window: who gets it, what it offers while cards come and go, and how it is used."""

import time

from machine.checks import check
from machine.hints_daemon import leave_soon
from machine.listing import only_identity, pair, present
from machine.quiet import expect_quiet

TITLE = "dialog: SmartCard Pairing"
ALICE, CAROL = "Alice Archer", "Carol Cooper"


def an_inserted_card_is_offered(lab):
    _offer(lab, "rsa")

    check.assertEqual(_offered(lab), [ALICE])


def an_elliptic_card_is_offered(lab):
    _offer(lab, "ec")

    check.assertEqual(_offered(lab), ["Bob Baker"])


def each_identity_of_a_card_is_offered_in_order(lab):
    _offer(lab, "two-identities")

    check.assertEqual(_offered(lab), ["Frank Fisher", "Frank Fisher (Administrator)"])


def a_second_card_adds_its_group_and_takes_it_away_again(lab):
    _offer(lab, "rsa")

    lab.insert("second", 2)
    lab.wait_until("both are offered", lambda: len(_offered(lab)) == 3)
    check.assertEqual(_offered(lab)[1], "", "a separator")
    check.assertEqual(sorted(_offered(lab)), ["", ALICE, CAROL])

    lab.remove(1)
    lab.wait_until("the second is left", lambda: _offered(lab) == [CAROL])


def the_last_card_takes_the_window_with_it(lab):
    _offer(lab, "rsa")

    lab.remove()

    _wait_for_end(lab)
    _check_said(lab, "all tokens were removed", "vlm bind canceled")


def a_card_that_cannot_unlock_a_keyring_is_not_offered(lab):
    _insert(lab, "no-wrap-key")

    _wait_for_line(lab, "no unpaired identities found")
    _wait_for_end(lab)
    _check_said(
        lab, "No RSA decryption key or ECDH key was found for token: ", "vlm bind interrupted"
    )


def a_card_that_cannot_unlock_a_keyring_adds_nothing(lab):
    _offer(lab, "rsa")

    lab.insert("no-wrap-key", 2)

    _wait_for_line(lab, "No RSA decryption key or ECDH key was found for token: ")
    check.assertEqual(_offered(lab), [ALICE])


def an_expired_card_is_not_offered(lab):
    _insert(lab, "expired")

    _wait_for_line(lab, "no unpaired identities found")
    _wait_for_end(lab)


def a_name_that_would_deceive_is_shown_as_it_is_written(lab):
    _offer(lab, "hostile")

    (name,) = _offered(lab)
    check.assertIn("<b>Eve</b> &amp; ", name)
    check.assertIn("%s {}", name)
    for mark in "\u202e\u202c\u2066\u2069":
        check.assertNotIn(mark, name)


def without_a_card_there_is_no_window(lab):
    lab.user("alice", "vlmbind", "-f")

    _wait_for_line(lab, "no unpaired identities found")
    _wait_for_end(lab)


def a_card_pulled_before_it_could_be_shown_is_not_waited_for_longer_than_half_a_minute(lab):
    _pull_between_listing_and_watching(lab)
    _insert(lab, "rsa")
    only_identity(lab, ALICE)
    lab.user("alice", "vlmbind", "-f")
    _wait_for_line(lab, "all unmatched identities: ")

    _wait_for_line(lab, "token was removed before showing dialog", 40)
    _wait_for_end(lab)
    check.assertIn("vlm bind interrupted", _said(lab))
    check.assertNotIn(TITLE, lab.windows())


def a_guest_is_offered_nothing(lab):
    _be_at_the_console(lab, "guest")
    _insert(lab, "rsa", before="guest")

    _wait_for_line(lab, "current user is guest account")
    _wait_for_end(lab, "guest")
    _check_said(lab, "vlm bind interrupted")


def the_account_that_sets_up_a_machine_is_offered_nothing(lab):
    lab.root("useradd", "--create-home", "--shell", "/bin/bash", "gnome-initial-setup")
    _be_at_the_console(lab, "gnome-initial-setup")
    _insert(lab, "rsa", before="gnome-initial-setup")

    _wait_for_line(lab, "invalid current user: gnome-initial-setup")
    _wait_for_end(lab, "gnome-initial-setup")
    _check_said(lab, "vlm bind interrupted")


def who_is_not_at_the_console_is_offered_nothing(lab):
    lab.root("systemctl", "start", "console@bob")
    lab.root("loginctl", "activate", _session_of(lab, "alice"))
    _insert(lab, "rsa", before="bob")
    lab.user("bob", "vlmbind", "-f")

    _wait_for_line(lab, "User 'bob' is not in active session")
    _wait_for_end(lab, "bob")
    _check_said(lab, "vlm bind interrupted")


def who_is_paired_is_offered_nothing_where_one_card_is_the_rule(lab):
    _pair_alice(lab)
    lab.root("vlmctl", "set", "oneCardPerUser", "true")
    _insert(lab, "second", 2)

    _wait_for_line(lab, "Cannot pair user which is already paired")
    _wait_for_end(lab)
    _check_said(lab, "vlm bind interrupted")


def who_is_paired_is_offered_a_second_card_otherwise(lab):
    _pair_alice(lab)

    _offer(lab, "second", reader=2)

    check.assertEqual(_offered(lab), [CAROL])


def a_card_that_is_paired_already_is_not_offered(lab):
    _pair_alice(lab)
    lab.remove()

    _insert(lab, "rsa")

    _wait_for_line(lab, "no unpaired identities found")
    _wait_for_end(lab)


def it_is_above_the_others_in_the_middle_and_has_the_focus(lab):
    _offer(lab, "rsa")

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
    _offer(lab, "rsa")
    time.sleep(30)  # Then it looks once whether it has shown its window.

    expect_quiet(lab, "vlmhintsd", "vlmbind")


def every_part_has_a_role_and_a_name(lab):
    _offer(lab, "two-identities")

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
    _offer(lab, "two-identities")

    lab.windows("grab", "combo box")
    lab.press_keys("Down")
    lab.wait_until("it is chosen", lambda: "box: Frank Fisher (Admin" in lab.windows())
    lab.windows("press", "Cancel")

    _wait_for_end(lab)
    check.assertIn("result: 2", lab.journal("_COMM=vlmbind", "ACTIVITY=clicked 'Cancel'"))
    _check_said(lab, "vlm bind canceled")


def the_keyboard_reaches_and_works_everything(lab):
    _offer(lab, "two-identities")
    _wait_for_focus(lab, "combo box: Frank Fisher")

    lab.press_keys("Down")
    _wait_for_focus(lab, "combo box: Frank Fisher (Administrator)")
    for part in ("Pair", "Cancel", "Do not show again"):
        lab.press_keys("Tab")
        _wait_for_focus(lab, f"push button: {part}")
    lab.press_keys("Tab")
    _wait_for_focus(lab, "combo box: Frank Fisher (Administrator)")
    lab.press_keys("alt+c")

    _wait_for_end(lab)


def escape_cancels(lab):
    _offer(lab, "rsa")

    lab.press_keys("Escape")

    _wait_for_end(lab)
    _check_said(lab, "vlm bind canceled")


def closing_the_window_cancels(lab):
    _offer(lab, "rsa")

    lab.press_keys("alt+F4")

    _wait_for_end(lab)
    _check_said(lab, "vlm bind canceled")


def _insert(lab, card: str, reader: int = 1, before: str = "alice") -> None:
    """Before the eyes of a user at the console, for whom the agent will log everything."""
    lab.user(before, "systemctl", "--user", "set-environment", "VLM_LOG_LEVEL=debug")
    lab.insert(card, reader)


def _offer(lab, card: str, reader: int = 1) -> None:
    _insert(lab, card, reader)
    lab.wait_until("the window is there", lambda: TITLE in lab.windows())


def _pair_alice(lab) -> None:
    """From a shell, without a window meanwhile."""
    lab.user("alice", "vlmbind", "-s", "disable")
    done = pair(lab, "alice", present(lab, "rsa", ALICE))
    check.assertEqual(done.status, 0, done)
    lab.user("alice", "vlmbind", "-s", "enable")


def _offered(lab) -> list[str]:
    lines = [line.strip() for line in lab.windows().splitlines()]
    return [line.removeprefix("list item:").strip() for line in lines if "list item:" in line]


def _wait_for_focus(lab, part: str) -> None:
    lab.wait_until(f"{part} has the focus", lambda: lab.windows("focus").strip() == part)


def _said(lab) -> str:
    return lab.journal("_COMM=vlmbind")


def _check_said(lab, *lines: str) -> None:
    said = _said(lab)
    for line in lines:
        check.assertIn(line, said)


def _wait_for_line(lab, line: str, seconds: float = 20) -> None:
    lab.wait_until(f"{line} is in the log", lambda: line in _said(lab), seconds)


def _wait_for_end(lab, user: str = "alice") -> None:
    """Well, whatever the bind came to."""

    def ended() -> bool:
        show = ["--property=ActiveState,Result", "vlmbind.service"]
        shown = lab.user(user, "systemctl", "--user", "show", *show).output
        return set(shown.split()) == {"ActiveState=inactive", "Result=success"}

    lab.wait_until("the agent has ended", ended)
    check.assertIn("no bind is running, exiting", _said(lab))


def _be_at_the_console(lab, user: str) -> None:
    lab.root("systemctl", "stop", "console@alice")
    lab.root("systemctl", "start", f"console@{user}")


def _session_of(lab, user: str) -> str:
    sessions = lab.root("loginctl", "--no-legend").output.splitlines()
    (session,) = [line.split()[0] for line in sessions if line.split()[2:4] == [user, "seat0"]]
    return session


def _pull_between_listing_and_watching(lab) -> None:
    """An instance that answers as the real one does, and then sees no token any more."""
    lab.user("alice", "systemctl", "--user", "mask", "--runtime", "--now", "vlmhintsd.service")
    options = ["--collect", "--unit=sees-no-token", "--service-type=dbus"]
    options.append("--property=BusName=org.vlm.token.hints.agent")
    lab.user("alice", "systemd-run", "--user", "--quiet", *options, "vlm-sees-no-token")
