"""Logging in with card and PIN, through the machine's own PAM stacks."""

import statistics

from machine.checks import check
from machine.login_person import (
    NAME_PROMPT,
    PASSWORD_PROMPT,
    PIN_PROMPT,
    Terminal,
    check_kept_out,
    check_let_in,
    greet,
    greeted_with,
    pair,
    pair_by_hand,
    turn_off,
    turn_on,
)

ALICE, BOB, CAROL = "Alice Archer", "Bob Baker", "Carol Cooper"
SERVICE = "vlmhintsd.service"


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


def a_wrong_pin_costs_one_try_and_lets_nobody_in(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    before = _tries(lab, "rsa")

    shown = greeted_with(lab, "alice", pin="000000")

    check_kept_out(shown)
    check.assertIn("the card refused the PIN", shown)
    check.assertNotRegex(shown, "[Pp]assword")
    check.assertEqual(_tries(lab, "rsa"), before - 1)
    check_let_in(greeted_with(lab, "alice", pin="123456"))
    check.assertEqual(_tries(lab, "rsa"), before)


def the_last_try_is_told_and_then_the_pin_is_locked(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    lab.remove()
    lab.card_ctl("set-tries", "rsa", "1")
    lab.insert("rsa")
    lab.wait_until("it is listed", lambda: ALICE in lab.root("vlmbind", "-i").output)

    shown = greeted_with(lab, "alice", pin="000000")
    check_kept_out(shown)
    check.assertIn("Only one try is left", shown)
    check.assertIn("locked", shown)

    again = greet(lab, "alice").end()
    check_kept_out(again)
    check.assertIn("the card's PIN is locked", again)
    check.assertNotIn("PIN of the card", again)


def a_card_that_is_pulled_before_its_pin_lets_nobody_in(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    greeter = greet(lab, "alice")
    greeter.wait_for(PIN_PROMPT)

    lab.remove()
    lab.wait_until("it is gone", lambda: ALICE not in lab.root("vlmbind", "-i").output)
    greeter.type("123456")

    shown = greeter.end()
    check_kept_out(shown)
    check.assertIn("pulled out", shown)


def a_card_that_is_pulled_while_it_signs_lets_nobody_in(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    lab.card_ctl("break-next")

    check_kept_out(greeted_with(lab, "alice", pin="123456"))


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


def the_card_of_another_lets_nobody_in(lab):
    turn_on(lab)
    pair(lab, "bob", BOB, "ec")

    shown = greeted_with(lab, "alice", password="123456")

    check_kept_out(shown)
    check.assertNotIn("PIN", shown)


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
    terminal.close()


def two_accounts_share_a_card(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    pair_by_hand(lab, "bob", "rsa")

    check_let_in(greeted_with(lab, "alice", pin="123456"))
    check_let_in(greeted_with(lab, "bob", pin="123456"))
    terminal = Terminal(lab, "login")
    terminal.wait_for(NAME_PROMPT)
    terminal.close()


def the_password_is_asked_for_while_the_service_is_down(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    lab.root("systemctl", "mask", "--now", "--runtime", SERVICE)

    check_let_in(greeted_with(lab, "alice", password="pw-alice"))
    lab.root("vlmctl", "set", "enforceSmartCard", "1")
    shown = greet(lab, "alice").end()
    check_kept_out(shown)
    check.assertIn("does not answer", shown)
    check_let_in(greeted_with(lab, "root", "/dev/tty1", password="pw-root"))


def the_password_is_asked_for_while_the_service_hangs(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    lab.root("systemctl", "kill", "--signal=STOP", SERVICE)

    check_let_in(greeted_with(lab, "alice", password="pw-alice"))
    lab.root("vlmctl", "set", "enforceSmartCard", "1")
    check_kept_out(greet(lab, "alice").end())
    lab.root("systemctl", "kill", "--signal=CONT", SERVICE)
    check_let_in(greeted_with(lab, "alice", pin="123456"))


def where_cards_are_required_nobody_gets_in_without_one(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    lab.root("vlmctl", "set", "enforceSmartCard", "1")

    check_let_in(greeted_with(lab, "alice", pin="123456"))
    check_kept_out(greeted_with(lab, "alice", pin=""))
    lab.remove()
    lab.wait_until("it is gone", lambda: ALICE not in lab.root("vlmbind", "-i").output)
    for user in ("alice", "bob", "nobody-here"):
        shown = greet(lab, user).end()
        check_kept_out(shown)
        check.assertIn("only a card", shown)
        check.assertNotRegex(shown, "[Pp]assword")


def where_others_are_allowed_only_paired_accounts_need_a_card(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    lab.remove()
    lab.root("vlmctl", "set", "enforceSmartCard", "1")
    lab.root("vlmctl", "set", "allowUnmappedUsers", "1")

    check_kept_out(greet(lab, "alice").end())
    check_let_in(greeted_with(lab, "bob", password="pw-bob"))


def root_gets_in_at_the_console_whatever_is_required(lab):
    turn_on(lab)
    lab.root("vlmctl", "set", "enforceSmartCard", "1")

    check_let_in(greeted_with(lab, "root", "/dev/tty1", password="pw-root"))
    check_kept_out(greeted_with(lab, "root", "/dev/tty1", password="wrong"))
    check_kept_out(greet(lab, "root", "/dev/pts/0").end())
    check_kept_out(greet(lab, "root", ":0").end())
    check_kept_out(greet(lab, "alice", "/dev/tty1").end())


def a_card_is_passed_over_where_none_is_allowed(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    lab.root("vlmctl", "set", "allowSmartCard", "0")

    shown = greeted_with(lab, "alice", password="pw-alice")

    check_let_in(shown)
    check.assertNotIn("PIN", shown)


def an_expired_card_lets_nobody_in(lab):
    turn_on(lab)
    pair_by_hand(lab, "alice", "expired")

    shown = greet(lab, "alice").end()

    check_kept_out(shown)
    check.assertIn("expired", shown)
    check.assertNotIn("PIN of the card", shown)


def who_is_unpaired_meanwhile_may_not_use_the_account(lab):
    turn_on(lab)
    hash_ = pair(lab, "alice", ALICE, "rsa")
    greeter = greet(lab, "alice")
    greeter.wait_for(PIN_PROMPT)

    lab.root("/usr/lib/vlm-lab/ask-hints", f"unpair alice {hash_}")
    greeter.type("123456")

    check_kept_out(greeter.end())


def nobody_learns_whose_account_there_is(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    lab.root("tee", "/etc/pam.d/only-vlm", typed="auth required pam_vlm.so\n")
    programme = """
import subprocess, sys, time
for _ in range(40):
    for user in sys.argv[1:]:
        began = time.monotonic()
        done = subprocess.run(["pamtester", "only-vlm", user, "authenticate"],
                              capture_output=True, text=True)
        print(user, time.monotonic() - began, (done.stdout + done.stderr).strip(), sep="\\t")
"""
    done = lab.root("python3", "-c", programme, "bob", "nobody-here")

    rows = [line.split("\t") for line in done.output.splitlines()]
    times, answers = {"bob": [], "nobody-here": []}, set()
    for user, seconds, answer in rows:
        times[user].append(float(seconds))
        answers.add(answer)
    check.assertEqual(len(answers), 1, answers)
    known, unknown = (statistics.quantiles(times[user]) for user in ("bob", "nobody-here"))
    noise = max(known[2] - known[0], unknown[2] - unknown[0])
    check.assertLess(abs(known[1] - unknown[1]), noise, times)


def _shells(lab, user: str) -> list[str]:
    """Of a login on a terminal."""
    shells = lab.root("ps", "-A", "-o", "user=,args=").output.splitlines()
    return [line for line in shells if line.split()[:2] == [user, "-bash"]]


def _tries(lab, card: str) -> int:
    return int(lab.card_ctl("tries", card).split()[0].removeprefix("pin="))
