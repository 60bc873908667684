"""Whom a card does not let in, and what is told then."""

import statistics

from machine.checks import check
from machine.login_person import (
    PIN_PROMPT,
    Greeter,
    check_kept_out,
    check_let_in,
    greeted_with,
    pair,
    pair_unoffered,
    turn_on,
)

ALICE, BOB = "Alice Archer", "Bob Baker"


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

    again = Greeter(lab, "alice").end()
    check_kept_out(again)
    check.assertIn("the card's PIN is locked", again)
    check.assertNotIn("PIN of the card", again)


def a_card_that_is_pulled_before_its_pin_lets_nobody_in(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    greeter = Greeter(lab, "alice")
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


def the_card_of_another_lets_nobody_in(lab):
    turn_on(lab)
    pair(lab, "bob", BOB, "ec")

    shown = greeted_with(lab, "alice", password="123456")

    check_kept_out(shown)
    check.assertNotIn("PIN", shown)


def an_expired_card_lets_nobody_in(lab):
    turn_on(lab)
    pair_unoffered(lab, "alice", "expired")

    shown = Greeter(lab, "alice").end()

    check_kept_out(shown)
    check.assertIn("expired", shown)
    check.assertNotIn("PIN of the card", shown)


def who_is_unpaired_meanwhile_may_not_use_the_account(lab):
    turn_on(lab)
    hash_ = pair(lab, "alice", ALICE, "rsa")
    greeter = Greeter(lab, "alice")
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


def _tries(lab, card: str) -> int:
    return int(lab.card_ctl("tries", card).split()[0].removeprefix("pin="))
