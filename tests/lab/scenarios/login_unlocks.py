"""The login keyring after a login with a card."""

import re

from machine.checks import check
from machine.listing import present
from machine.listing import pair as pair_and_store
from machine.login_keyring import is_locked, lock
from machine.login_person import (
    PIN_PROMPT,
    Greeter,
    Terminal,
    check_let_in,
    greeted_with,
    pair,
    turn_on,
)

CURRENT_PROMPT = re.compile("Current password: $")
NEW_PROMPT = re.compile("New password: $")
AGAIN_PROMPT = re.compile("Retype new password: $")
ALICE, BOB = "Alice Archer", "Bob Baker"


def the_login_keyring_opens_for_an_rsa_card(lab):
    _check_keyring_opens(lab, "rsa", ALICE)


def the_login_keyring_opens_for_an_elliptic_curve_card(lab):
    _check_keyring_opens(lab, "ec", BOB)


def a_password_that_was_changed_opens_the_keyring_with_the_card(lab):
    _store_secret(lab)
    _pair_with_unlock_key(lab, "rsa", ALICE)

    changed = Terminal(lab, "runuser", "-u", "alice", "--", "env", _runtime_folder(lab), "passwd")
    changed.answer(CURRENT_PROMPT, "pw-alice")
    changed.answer(NEW_PROMPT, "Tr0ub4dor-and-3")
    changed.answer(AGAIN_PROMPT, "Tr0ub4dor-and-3")
    check.assertIn("updated successfully", changed.end())

    _check_card_opens(lab)


def a_keyring_without_an_unlock_key_asks_for_its_password(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")

    shown = greeted_with(lab, "alice", pin="123456")

    check_let_in(shown)
    check.assertIn("the login keyring", shown)


def _check_keyring_opens(lab, card: str, name: str) -> None:
    _store_secret(lab)
    _pair_with_unlock_key(lab, card, name)
    _check_card_opens(lab)


def _store_secret(lab) -> None:
    store = ["secret-tool", "store", "--label=Harbour", "place", "harbour"]
    done = lab.user("alice", *store, typed="blue lighthouse")
    check.assertEqual(done.status, 0, done)


def _pair_with_unlock_key(lab, card: str, name: str) -> None:
    turn_on(lab)
    hash_ = present(lab, card, name)
    lab.answer("keyring", "password pw-alice")
    paired = pair_and_store(lab, "alice", hash_)
    check.assertNotIn("password will be required", paired.output)


def _check_card_opens(lab) -> None:
    lock(lab)

    greeter = Greeter(lab, "alice", environment=_runtime_folder(lab))
    greeter.answer(PIN_PROMPT, "123456")
    check_let_in(greeter.end())

    check.assertFalse(is_locked(lab))
    secret = lab.user("alice", "secret-tool", "lookup", "place", "harbour")
    check.assertEqual(secret.output, "blue lighthouse", secret)


def _runtime_folder(lab) -> str:
    """Where the keyring's own module finds the keyring, as in every program of the session."""
    return f"XDG_RUNTIME_DIR=/run/user/{lab.root('id', '-u', 'alice').output.strip()}"
