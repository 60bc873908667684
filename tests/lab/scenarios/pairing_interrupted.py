"""Something goes away while somebody is asked on the road to a pairing: the question goes off the
screen, nothing is paired by halves, and the next card is paired."""

from machine.by_hand import pairings
from machine.checks import check
from machine.hints_daemon import SERVICE
from machine.pairing_person import (
    FAILED,
    agree,
    check_nothing_is_paired,
    check_the_next_card_pairs,
    click_pair,
    dismiss_alert,
    finish_pairing,
)
from machine.pairing_window import TITLE, check_said, offer, offered, wait_for_alert, wait_for_end


def a_card_pulled_while_the_administrator_is_asked_ends_it(lab):
    _ask_administrator(lab)

    lab.remove()

    wait_for_end(lab)
    _wait_until_administrator_is_left_alone(lab)
    check_said(lab, "all tokens were removed", "vlm bind canceled")
    _check_the_window_is_gone(lab)


def a_card_pulled_while_the_pin_is_asked_ends_it(lab):
    _ask_for_pin(lab)

    lab.remove()

    wait_for_end(lab)
    _wait_until_holder_is_left_alone(lab)
    check_said(lab, "all tokens were removed", "vlm bind canceled")
    _check_the_window_is_gone(lab)


def the_chosen_of_two_cards_pulled_while_the_pin_is_asked_is_told(lab):
    _ask_for_pin(lab)
    lab.insert("second", 2)
    lab.wait_until("both are offered", lambda: len(offered(lab)) == 3)

    lab.remove(1)
    lab.wait_until("the second is left", lambda: offered(lab) == ["Carol Cooper"])
    agree(lab)

    shown = dismiss_alert(lab)
    check.assertIn(FAILED, shown)
    check.assertIn("the card was pulled out. Insert it and try again.", shown)
    lab.remove(2)
    _check_the_window_is_gone(lab)


def an_agent_killed_while_the_administrator_is_asked_takes_the_question_along(lab):
    _ask_administrator(lab)

    _kill_agent(lab)

    _wait_until_administrator_is_left_alone(lab)
    lab.remove()
    _check_the_window_is_gone(lab)


def an_agent_killed_while_the_pin_is_asked_takes_the_question_along(lab):
    _ask_for_pin(lab)

    _kill_agent(lab)

    _wait_until_holder_is_left_alone(lab)
    lab.remove()
    _check_the_window_is_gone(lab)


def a_daemon_killed_while_the_administrator_is_asked_is_not_missed(lab):
    _ask_administrator(lab)

    _kill_daemon(lab)
    agree(lab)

    finish_pairing(lab)
    check.assertEqual([account for account, _ in pairings(lab)], ["alice"])


def a_daemon_killed_while_the_pin_is_asked_takes_the_question_along(lab):
    _ask_for_pin(lab)

    _kill_daemon(lab)

    _wait_until_holder_is_left_alone(lab)
    check.assertIn(FAILED, wait_for_alert(lab))
    dismiss_alert(lab)
    lab.remove()
    _check_the_window_is_gone(lab)


def a_log_out_does_not_wait_for_the_window(lab):
    offer(lab, "rsa")

    _log_out(lab)


def a_log_out_does_not_wait_for_a_pin(lab):
    _ask_for_pin(lab)

    _log_out(lab)

    check_nothing_is_paired(lab)


def _log_out(lab) -> None:
    """As a desktop does it that keeps its screen until its programs have ended."""
    stop = ["systemctl", "--user", "stop", "graphical-session.target"]
    ended = lab.user("alice", "timeout", "20", *stop)
    check.assertEqual(ended.status, 0, ended)
    _wait_until_holder_is_left_alone(lab)
    check.assertNotEqual(lab.root("pgrep", "--exact", "vlmbind").status, 0)


def _ask_administrator(lab) -> None:
    """The question is on the screen, and stays."""
    lab.answer("polkit", "wait")
    click_pair(lab)
    lab.wait_until("the administrator is asked", lambda: lab.asked("polkit"))


def _ask_for_pin(lab) -> None:
    agree(lab)
    lab.answer("pinentry", "wait")
    click_pair(lab)
    lab.wait_until("the PIN is asked for", lambda: lab.asked("pinentry"))


def _kill_agent(lab) -> None:
    lab.user("alice", "systemctl", "--user", "kill", "--signal=KILL", "vlmbind.service")


def _kill_daemon(lab) -> None:
    lab.root("systemctl", "kill", "--signal=KILL", SERVICE)


def _wait_until_administrator_is_left_alone(lab) -> None:
    lab.wait_until("the question is withdrawn", lambda: {"cancelled": True} in lab.asked("polkit"))


def _wait_until_holder_is_left_alone(lab) -> None:
    lab.wait_until("no pinentry runs", lambda: lab.root("pgrep", "--exact", "pinentry").status == 1)


def _check_the_window_is_gone(lab) -> None:
    lab.wait_until("the window is gone", lambda: TITLE not in lab.windows())
    check_nothing_is_paired(lab)
    check_the_next_card_pairs(lab)
