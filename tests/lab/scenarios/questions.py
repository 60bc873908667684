"""While an administrator is asked whether a user may pair: what else goes on, and what ends it."""

import time

from machine.by_hand import (
    ADMINISTRATOR,
    ASK,
    ask_to_pair,
    begin,
    end,
    pairing,
    pairings,
    statuses,
    statuses_in,
)
from machine.checks import check
from machine.listing import identities, pair, present

SERVICE = "vlmhintsd.service"


def others_are_served_while_a_person_reads(lab):
    hash_, asking = _begin_pairing(lab)

    check.assertIn(hash_, lab.root("vlmbind", "-i").output)
    check.assertEqual(pair(lab, "bob", hash_).status, 0)

    lab.answer("polkit", ADMINISTRATOR)
    check.assertEqual(statuses_in(end(asking)), ["0", "0"])


def a_person_may_read_for_longer_than_a_proof_holds(lab):
    hash_, asking = _begin_pairing(lab)
    # Then the proof's minute is over, and so is the bus library's own patience.
    time.sleep(62)

    lab.answer("polkit", ADMINISTRATOR)

    check.assertEqual(statuses_in(end(asking)), ["0", "0"])
    check.assertEqual(pairings(lab), [("alice", hash_)])


def each_of_two_requests_at_once_is_asked_about(lab):
    present(lab, "two-identities", "Frank Fisher")
    first, second = identities(lab).values()
    lab.answer("polkit", "wait")
    login_first, pair_first = pairing(first)
    login_second, pair_second = pairing(second)
    asking = begin(lab, "--at-once", login_first, login_second, pair_first, pair_second)
    lab.wait_until("both are asked about", lambda: len(lab.asked("polkit")) == 2)
    messages = "".join(question["message"] for question in lab.asked("polkit"))
    check.assertIn(first[:16], messages)
    check.assertIn(second[:16], messages)

    lab.answer("polkit", "dismiss")

    check.assertEqual(statuses_in(end(asking)), ["0", "0", "-2007", "-2007"])
    check.assertEqual(pairings(lab), [])


def who_is_gone_takes_the_question_along(lab):
    _, asking = _begin_pairing(lab)

    lab.root("pkill", "--signal", "KILL", "--full", ASK)

    _wait_until_withdrawn(lab)
    end(asking)
    check.assertEqual(pairings(lab), [])


def a_service_that_is_killed_takes_the_question_along(lab):
    hash_, asking = _begin_pairing(lab)

    lab.root("systemctl", "kill", "--signal=KILL", SERVICE)

    _wait_until_withdrawn(lab)
    output = end(asking)
    check.assertNotEqual(asking.returncode, 0, output)
    check.assertEqual(pairings(lab), [])
    lab.answer("polkit", ADMINISTRATOR)
    check.assertEqual(statuses(ask_to_pair(lab, hash_)), ["0", "0"])


def polkit_that_is_killed_is_a_refusal(lab):
    _, asking = _begin_pairing(lab)

    lab.root("systemctl", "kill", "--signal=KILL", "polkit.service")

    check.assertRegex(end(asking), "\n-2017 Pairing alice with .* polkit could not be asked")
    check.assertEqual(pairings(lab), [])


def _begin_pairing(lab):
    """Up to the question, which waits: the key's hash, and who asked."""
    hash_ = present(lab, "rsa", "Alice Archer")
    lab.answer("polkit", "wait")
    asking = begin(lab, *pairing(hash_))
    lab.wait_until("the administrator is asked", lambda: lab.asked("polkit"))
    return hash_, asking


def _wait_until_withdrawn(lab) -> None:
    lab.wait_until("the question is withdrawn", lambda: {"cancelled": True} in lab.asked("polkit"))
