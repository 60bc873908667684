"""Logging in with card and PIN, through the machine's own PAM stacks."""

from machine.checks import check
from machine.login_person import (
    NAME_PROMPT,
    PIN_PROMPT,
    Terminal,
    check_kept_out,
    check_let_in,
    greeted_with,
    pair,
    pair_inserted,
    turn_off,
    turn_on,
)

ALICE, BOB, CAROL = "Alice Archer", "Bob Baker", "Carol Cooper"


def a_card_and_its_pin_log_in_on_a_terminal(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")

    terminal = Terminal(lab, "login")
    terminal.answer(NAME_PROMPT, "alice")
    terminal.answer(PIN_PROMPT, "123456")
    shell = lab.wait_until("a shell is there", lambda: _shells(lab, "alice"))
    check.assertTrue(shell)
    terminal.type("echo I am $(id -un) in $XDG_SESSION_ID; exit")

    check.assertRegex(terminal.end(), r"I am alice in \w+")


def the_session_that_a_card_has_opened_is_known(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")

    terminal = Terminal(lab, "login")
    terminal.answer(NAME_PROMPT, "alice")
    terminal.answer(PIN_PROMPT, "123456")
    lab.wait_until("a shell is there", lambda: _shells(lab, "alice"))
    terminal.type("cat /run/vlm/sessions/$XDG_SESSION_ID; exit")

    check.assertIn("pkcs11:", terminal.end())


def an_elliptic_curve_card_logs_in(lab):
    turn_on(lab)
    pair(lab, "bob", BOB, "ec")

    check_let_in(greeted_with(lab, "bob", pin="123456"))


def a_card_logs_in_by_a_display_managers_service(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")

    shown = greeted_with(lab, "alice", pin="123456")

    check_let_in(shown)
    check.assertIn(f'PIN of the card "{ALICE}": ', shown)


def nothing_changes_where_it_is_off(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    turn_off(lab)

    shown = greeted_with(lab, "alice", password="pw-alice")

    check_let_in(shown)
    check.assertNotIn("PIN", shown)
    stacks = lab.root("sh", "-c", "cat /etc/pam.d/common-*").output
    check.assertNotIn("pam_vlm", stacks)


def the_password_is_asked_for_without_a_card(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    lab.remove()

    check_let_in(greeted_with(lab, "alice", password="pw-alice"))
    check_kept_out(greeted_with(lab, "alice", password="wrong"))


def an_empty_pin_goes_on_with_the_password(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")

    check_let_in(greeted_with(lab, "alice", pin="", password="pw-alice"))


def a_card_that_is_pulled_after_the_login_leaves_it_good(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    terminal = Terminal(lab, "login")
    terminal.answer(NAME_PROMPT, "alice")
    terminal.answer(PIN_PROMPT, "123456")
    lab.wait_until("a shell is there", lambda: _shells(lab, "alice"))

    lab.remove()
    terminal.type("echo I am still $(id -un); exit")

    check.assertIn("I am still alice", terminal.end())


def a_card_that_is_not_paired_leaves_the_password(lab):
    turn_on(lab)
    lab.insert("second")
    lab.wait_until("it is listed", lambda: CAROL in lab.root("vlmbind", "-i").output)

    check_let_in(greeted_with(lab, "alice", password="pw-alice"))


def each_of_two_cards_logs_in_its_own(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa", 1)
    pair(lab, "bob", BOB, "ec", 2)

    check.assertIn(ALICE, greeted_with(lab, "alice", pin="123456"))
    shown = greeted_with(lab, "bob", pin="123456")
    check.assertIn(BOB, shown)
    check_let_in(shown)
    terminal = Terminal(lab, "login")
    terminal.answer(NAME_PROMPT, "bob")
    check.assertIn(BOB, terminal.wait_for(PIN_PROMPT))
    terminal.give_up()


def two_accounts_share_a_card(lab):
    turn_on(lab)
    pair_inserted(lab, "bob", pair(lab, "alice", ALICE, "rsa"))

    check_let_in(greeted_with(lab, "alice", pin="123456"))
    check_let_in(greeted_with(lab, "bob", pin="123456"))
    terminal = Terminal(lab, "login")
    terminal.wait_for(NAME_PROMPT)
    terminal.give_up()


def _shells(lab, user: str) -> list[str]:
    """Of a login on a terminal."""
    shells = lab.root("ps", "-A", "-o", "user=,args=").output.splitlines()
    return [line for line in shells if line.split()[:2] == [user, "-bash"]]
