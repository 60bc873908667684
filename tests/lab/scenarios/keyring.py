"""The unlock key: whom storing it asks, what is in the database then, and what a person is told when
there is none."""

import subprocess

from machine.by_hand import pairings
from machine.checks import check
from machine.listing import pair, present, unpair
from machine.login_keyring import (
    is_locked,
    lock,
    start_a_plain_one,
    take_away,
    unlock_keys,
)
from machine.pairing_person import (
    KEYRING_STAYS_SHUT,
    agree,
    click_pair,
    dismiss_alert,
    finish_pairing,
)
from machine.pairing_window import check_said

ALICE = "Alice Archer"
DAEMON = "--unit=vlmhintsd.service"


def the_window_asks_once_for_the_password_and_stores_the_key(lab):
    agree(lab)
    click_pair(lab)
    finish_pairing(lab)

    (question,) = lab.asked("keyring")
    check.assertIn("Enter the password of your login keyring, once", question["desc"])
    check.assertIn(f'the card "{ALICE}"', question["desc"])
    check.assertIn("when alice logs in", question["desc"])
    check.assertEqual(unlock_keys(lab), pairings(lab))
    check.assertEqual(len(unlock_keys(lab)), 1)
    check.assertIn("stored the unlock key of alice", lab.journal(DAEMON))
    check.assertNotIn("pw-alice", lab.journal())


def an_elliptic_curve_card_stores_one_too(lab):
    agree(lab)
    click_pair(lab, "ec")
    finish_pairing(lab)

    check.assertEqual(len(unlock_keys(lab)), 1)


def a_keyring_that_is_shut_is_opened_by_the_password(lab):
    lock(lab)
    agree(lab)
    click_pair(lab)
    finish_pairing(lab)

    check.assertFalse(is_locked(lab))


def a_keyring_that_is_open_takes_no_wrong_password(lab):
    check.assertFalse(is_locked(lab))
    agree(lab)
    lab.answer("keyring", "password wrong")

    click_pair(lab)

    check.assertIn(KEYRING_STAYS_SHUT, dismiss_alert(lab))


def a_wrong_password_is_asked_for_three_times_and_the_pairing_stands(lab):
    agree(lab)
    lab.answer("keyring", "password wrong")

    click_pair(lab)
    check.assertIn(KEYRING_STAYS_SHUT, dismiss_alert(lab))

    errors = [question.get("error", "") for question in lab.asked("keyring")]
    refused = "This password does not open your login keyring."
    check.assertEqual(errors, ["", refused, refused])
    check.assertEqual([account for account, _ in pairings(lab)], ["alice"])
    check.assertEqual(unlock_keys(lab), [])
    check_said(lab, "storeUnlockKey = -2022", "finishWithResult: result: 0")


def a_question_that_is_cancelled_leaves_the_pairing(lab):
    agree(lab)
    lab.answer("keyring", "dismiss")

    click_pair(lab)
    check.assertIn(KEYRING_STAYS_SHUT, dismiss_alert(lab))

    check.assertEqual(len(lab.asked("keyring")), 1)
    check.assertEqual([account for account, _ in pairings(lab)], ["alice"])
    check.assertEqual(unlock_keys(lab), [])
    check_said(lab, "storeUnlockKey = -2007")


def without_a_keyring_nobody_is_asked_and_none_is_made(lab):
    take_away(lab)
    agree(lab)

    click_pair(lab)
    check.assertIn(KEYRING_STAYS_SHUT, dismiss_alert(lab))

    check.assertEqual(lab.asked("keyring"), [])
    check.assertEqual([account for account, _ in pairings(lab)], ["alice"])
    check_said(lab, "storeUnlockKey = -2021")
    running = lab.root("pgrep", "--uid", "alice", "--full", "gnome-keyring-daemon")
    check.assertEqual(running.status, 1, "nothing was started")


def root_pairs_from_the_shell_and_the_user_is_asked_on_her_desktop(lab):
    hash_ = present(lab, "rsa", ALICE)
    agree(lab)

    paired = pair(lab, "alice", hash_)

    check.assertEqual(paired.status, 0, paired)
    check.assertEqual(paired.output, f"User was successfully paired (public key hash: {hash_}).\n")
    (question,) = lab.asked("keyring")
    check.assertIn("when alice logs in", question["desc"])
    check.assertEqual(unlock_keys(lab), [("alice", hash_)])


def the_machine_s_own_pinentry_asks_again_after_a_wrong_password(lab):
    hash_ = present(lab, "rsa", ALICE)
    # Away with the one that answers by itself.
    lab.root("mv", "/usr/local/bin/pinentry", "/usr/local/bin/pinentry.away")
    command = lab.command_for(None, ["vlmbind", "-p", "-v", "-u", "alice", "-h", hash_])
    asking = subprocess.Popen(command, stdout=subprocess.PIPE, text=True)

    _type_into(lab, "Smart card", "123456")
    _type_into(lab, "Login keyring", "wrong")
    refused = "This password does not open your login keyring."
    lab.wait_until("it is asked again", lambda: refused in lab.windows())
    _type_into(lab, "Login keyring", "pw-alice")

    output, _ = asking.communicate(timeout=30)
    check.assertEqual(output, f"User was successfully paired (public key hash: {hash_}).\n")
    check.assertEqual(unlock_keys(lab), [("alice", hash_)])


def the_shell_says_why_no_key_was_stored(lab):
    hash_ = present(lab, "rsa", ALICE)
    lab.answer("keyring", "password wrong")

    paired = pair(lab, "alice", hash_)

    check.assertEqual(paired.status, 0, paired)
    check.assertIn("does not open the login keyring", paired.output)
    check.assertEqual(pairings(lab), [("alice", hash_)])


def who_is_not_at_the_console_is_paired_without_a_question(lab):
    hash_ = present(lab, "rsa", ALICE)
    agree(lab)

    paired = pair(lab, "bob", hash_)

    check.assertEqual(paired.status, 0, paired)
    check.assertIn("only for the user who is logged in at this computer", paired.output)
    check.assertEqual(lab.asked("keyring"), [])
    check.assertEqual(pairings(lab), [("bob", hash_)])


def a_card_without_a_wrap_key_says_so(lab):
    hash_ = present(lab, "no-wrap-key", "Dan Draper")
    agree(lab)

    paired = pair(lab, "alice", hash_)

    check.assertEqual(paired.status, 0, paired)
    check.assertIn("has no key that can protect the password", paired.output)
    check.assertEqual(lab.asked("keyring"), [])


def unpairing_erases_the_key(lab):
    hash_ = present(lab, "rsa", ALICE)
    agree(lab)
    check.assertEqual(pair(lab, "alice", hash_).status, 0)
    check.assertEqual(unlock_keys(lab), [("alice", hash_)])

    unpaired = unpair(lab, "alice", hash_)

    check.assertEqual(unpaired.status, 0, unpaired)
    check.assertEqual(unlock_keys(lab), [])


def a_password_that_nothing_can_check_is_typed_twice(lab):
    start_a_plain_one(lab)
    hash_ = present(lab, "rsa", ALICE)
    agree(lab)

    paired = pair(lab, "alice", hash_)

    check.assertEqual(paired.status, 0, paired)
    (question,) = lab.asked("keyring")
    check.assertEqual(question["repeat"], "Again:")
    check.assertIn("It cannot be checked here", question["desc"])
    check.assertEqual(unlock_keys(lab), [("alice", hash_)])
    check.assertIn("checks no password for programs", lab.journal())


def a_card_that_is_pulled_while_the_password_is_asked_for_stays_paired(lab):
    agree(lab)
    lab.answer("keyring", "wait")
    click_pair(lab)
    lab.wait_until("the password is asked for", lambda: lab.asked("keyring"))

    lab.remove()

    lab.wait_until(
        "the question is withdrawn",
        lambda: lab.root("pgrep", "--exact", "pinentry").status == 1,
    )
    check.assertEqual([account for account, _ in pairings(lab)], ["alice"])
    check.assertEqual(unlock_keys(lab), [])


def the_keyring_is_unlocked_by_a_password_through_the_service(lab):
    lock(lab)
    uid = lab.root("id", "-u", "alice").output.strip()

    wrong = _unlock(lab, uid, "wrong")
    check.assertIn('"res" x -2022', wrong.output, wrong)
    check.assertTrue(is_locked(lab))

    right = _unlock(lab, uid, "pw-alice")
    check.assertEqual(right.output, 'a{sv} 1 "res" x 0\n', right)
    check.assertFalse(is_locked(lab))


def _type_into(lab, title: str, text: str) -> None:
    lab.wait_until(f"{title} is there", lambda: f"dialog: {title}" in lab.windows())
    window = ["search", "--sync", "--onlyvisible", "--name", f"^{title}$", "windowfocus", "--sync"]
    lab.user("alice", "xdotool", *window)
    lab.user("alice", "xdotool", "type", text)
    lab.user("alice", "xdotool", "key", "Return")


def _unlock(lab, uid: str, password: str):
    service = ["org.vlm.token.hints.daemon", "/org/vlm/token/hints", "org.vlm.token.hints"]
    request = ["a{sv}", "3", "op", "t", "5", "uid", "x", uid, "str1", "s", password]
    return lab.root("busctl", "call", *service, "Exchange", *request)
