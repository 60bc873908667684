"""The person who pairs the inserted card in the window, and what must hold when that has ended."""

from machine.by_hand import ADMINISTRATOR, pairings
from machine.checks import check
from machine.listing import only_identity
from machine.pairing_window import (
    check_said,
    offer,
    wait_for_alert,
    wait_for_end,
    wait_for_window,
)

PIN = "pin 123456"
OWN_PASSWORD = "own"
FAILED = "The smart card was not paired."
KEYRING_STAYS_SHUT = "The smart card is paired, but it will not unlock your login keyring."


def agree(lab) -> None:
    """To whatever is asked: the administrator, and the holder of the card and of a keyring."""
    lab.answer("polkit", ADMINISTRATOR)
    lab.answer("pinentry", PIN)
    lab.answer("keyring", OWN_PASSWORD)


def click_pair(lab, card: str = "rsa") -> None:
    offer(lab, card)
    lab.windows("press", "Pair")


def dismiss_alert(lab, user: str = "alice") -> str:
    """To the end of the agent; what the alert said."""
    shown = wait_for_alert(lab)
    lab.windows("press", "OK")
    wait_for_end(lab, user)
    return shown


def finish_pairing(lab, user: str = "alice") -> None:
    """After Pair, when nothing goes wrong."""
    wait_for_end(lab, user)
    check_said(lab, "storeUnlockKey = 0")


def check_nothing_is_paired(lab) -> None:
    check.assertEqual(pairings(lab), [])


def check_the_next_card_pairs(lab, card: str = "rsa", name: str = "Alice Archer") -> None:
    """Nothing hangs, whatever came before: no card is in, and the next is paired as the first."""
    agree(lab)
    lab.insert(card)
    hash_ = only_identity(lab, name)
    wait_for_window(lab)
    lab.windows("press", "Pair")
    finish_pairing(lab)
    check.assertEqual(pairings(lab), [("alice", hash_)])
