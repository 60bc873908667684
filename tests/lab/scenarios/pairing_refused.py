"""Somebody who is asked on the road to a pairing says no, or something wrong: what the person is
told, and that the next try goes well."""

from machine.checks import check
from machine.pairing_person import (
    FAILED,
    agree,
    check_nothing_is_paired,
    check_the_next_card_pairs,
    click_pair,
    dismiss_alert,
)
from machine.pairing_window import check_said, wait_for_end
from machine.sessions import set_locked


def an_administrator_who_dismisses_the_question_ends_it(lab):
    agree(lab)
    lab.answer("polkit", "dismiss")

    click_pair(lab)

    wait_for_end(lab)
    check_said(lab, "authorization canceled", "finishWithResult: result: 2", "vlm bind canceled")
    check.assertEqual(lab.asked("pinentry"), [])
    _check_refused_and_go_on(lab)


def an_administrator_s_wrong_password_is_a_failure(lab):
    agree(lab)
    lab.answer("polkit", "fail 3")

    click_pair(lab)

    shown = dismiss_alert(lab)
    check.assertIn(FAILED, shown)
    check.assertIn("Authorization failed (status -60005)", shown)
    check_said(lab, "authorization failed: -60005", "vlm bind failed")
    check.assertEqual(lab.asked("pinentry"), [])
    _check_refused_and_go_on(lab)


def a_wrong_pin_costs_one_try_and_is_told(lab):
    agree(lab)
    lab.answer("pinentry", "pin 000000")

    click_pair(lab)

    shown = dismiss_alert(lab)
    check.assertIn(FAILED, shown)
    check.assertIn("the card refused the PIN", shown)
    check_said(lab, "finishWithResult: result: 1", "vlm bind failed")
    check.assertEqual(lab.card_ctl("tries", "rsa").split()[0], "pin=2")
    check.assertEqual(len(lab.asked("pinentry")), 1)
    _check_refused_and_go_on(lab)
    check.assertEqual(lab.card_ctl("tries", "rsa").split()[0], "pin=3")


def a_pin_that_is_locked_is_not_asked_for(lab):
    agree(lab)
    lab.card_ctl("set-tries", "rsa", "0")

    click_pair(lab)

    shown = dismiss_alert(lab)
    check.assertIn(FAILED, shown)
    check.assertIn("PIN is locked", shown)
    check.assertEqual(lab.asked("pinentry"), [])
    check_nothing_is_paired(lab)
    lab.remove()
    check_the_next_card_pairs(lab, "second", "Carol Cooper")


def a_holder_who_dismisses_the_pin_prompt_is_told(lab):
    agree(lab)
    lab.answer("pinentry", "dismiss")

    click_pair(lab)

    check.assertIn("the PIN prompt was cancelled", dismiss_alert(lab))
    _check_refused_and_go_on(lab)


def on_a_locked_screen_nothing_is_paired(lab):
    agree(lab)
    lab.answer("polkit", "wait")
    click_pair(lab)
    lab.wait_until("the administrator is asked", lambda: lab.asked("polkit"))

    set_locked(lab, True)
    agree(lab)

    shown = dismiss_alert(lab)
    check.assertIn(FAILED, shown)
    check.assertIn("the screen is locked. Unlock it and try again.", shown)
    set_locked(lab, False)
    _check_refused_and_go_on(lab)


def _check_refused_and_go_on(lab) -> None:
    check_nothing_is_paired(lab)
    lab.remove()
    check_the_next_card_pairs(lab)
