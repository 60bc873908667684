"""The main job from the shell, with a real card: list, pair, list, unpair."""

from machine.checks import check
from machine.listing import identities, only_identity, pair, present, unpair


def root_lists_pairs_lists_and_unpairs(lab):
    hash_ = present(lab, "rsa", "Alice Archer")

    paired = pair(lab, "alice", hash_)
    check.assertEqual(paired.status, 0, paired)
    check.assertIn(f"User was successfully paired (public key hash: {hash_})", paired.output)
    check.assertEqual(
        lab.root("vlmbind", "-i").output,
        "SmartCard: Alice Archer\n"
        "Paired identities which are used for authentication:\n"
        f"{hash_}\talice - Alice Archer\n",
    )
    check.assertIn(hash_, lab.root("vlmctl", "pairings").output)

    unpaired = unpair(lab, "alice", hash_)
    check.assertEqual(unpaired.status, 0, unpaired)
    check.assertEqual(
        unpaired.output,
        f"User was successfully unpaired (public key hash: {hash_}).\n",
    )
    check.assertEqual(
        lab.root("vlmbind", "-i").output,
        f"SmartCard: Alice Archer\nUnpaired identities:\n{hash_}\tAlice Archer\n",
    )


def an_elliptic_curve_card_is_paired(lab):
    hash_ = present(lab, "ec", "Bob Baker")

    paired = pair(lab, "bob", hash_)

    check.assertEqual(paired.status, 0, paired)
    check.assertIn(f"{hash_}\tbob - Bob Baker\n", lab.root("vlmbind", "-i").output)


def a_card_that_can_only_sign_is_paired(lab):
    hash_ = present(lab, "no-wrap-key", "Dan Draper")

    paired = pair(lab, "alice", hash_)

    check.assertEqual(paired.status, 0, paired)
    check.assertIn("user password will be required after next SmartCard login", paired.output)


def an_expired_card_is_listed_without_identities(lab):
    lab.insert("expired")

    lab.wait_until("the card is listed", lambda: "SmartCard:" in lab.root("vlmbind", "-i").output)

    check.assertEqual(identities(lab), {})


def a_card_is_paired_through_one_of_its_identities_only(lab):
    lab.insert("two-identities")
    names = {"Frank Fisher", "Frank Fisher (Administrator)"}
    found = lab.wait_until(
        "both are listed", lambda: set(identities(lab)) == names and identities(lab)
    )
    lab.answer("pinentry", "pin 123456")
    check.assertEqual(pair(lab, "alice", found["Frank Fisher"]).status, 0)

    refused = pair(lab, "carol", found["Frank Fisher (Administrator)"])

    check.assertEqual(refused.status, 255, refused)
    check.assertIn("This smart card is already paired with an account.", refused.output)


def an_ordinary_user_may_list_and_not_pair(lab):
    lab.insert("rsa")
    hash_ = only_identity(lab, "Alice Archer")

    listed = lab.user("alice", "vlmbind", "-i")
    check.assertEqual(listed.status, 0, listed)
    check.assertIn(hash_, listed.output)

    refused = lab.user("alice", "vlmbind", "-p", "-u", "alice", "-h", hash_)
    check.assertEqual(refused.status, 255, refused)
    check.assertEqual(refused.output, "This operation requires root privileges.\n")
    check.assertEqual(lab.asked("pinentry"), [])


def an_ordinary_user_does_not_unpair_without_an_administrator(lab):
    hash_ = present(lab, "rsa", "Alice Archer")
    check.assertEqual(pair(lab, "alice", hash_).status, 0)

    for user in ("alice", "bob"):
        refused = lab.user(user, "vlmbind", "-r", "-u", "alice", "-h", hash_)
        check.assertEqual(refused.status, 255, refused)
        check.assertIn(f"Cannot unpair user (public key hash: {hash_}).", refused.output)
    check.assertEqual(len(lab.asked("polkit")), 1)
    check.assertIn("alice", lab.root("vlmctl", "pairings").output)


def the_user_at_the_console_is_asked_for_the_pin(lab):
    hash_ = present(lab, "rsa", "Alice Archer")

    pair(lab, "bob", hash_)

    (question,) = lab.asked("pinentry")
    check.assertIn('the card "Alice Archer"', question["desc"])
    check.assertIn("can be paired with an account", question["desc"])
    check.assertEqual(question["prompt"], "PIN:")


def a_wrong_pin_is_tried_once_and_pairs_nobody(lab):
    lab.insert("rsa")
    hash_ = only_identity(lab, "Alice Archer")
    lab.answer("pinentry", "pin 000000")

    refused = pair(lab, "alice", hash_)

    check.assertEqual(refused.status, 255, refused)
    check.assertIn(f"Cannot pair user (public key hash: {hash_}).", refused.output)
    check.assertIn("pin=2", lab.card_ctl("tries", "rsa"))
    check.assertNotIn(hash_, lab.root("vlmctl", "pairings").output)


def before_the_last_try_the_person_has_to_say_yes(lab):
    lab.card_ctl("set-tries", "rsa", "1")
    lab.insert("rsa")
    hash_ = only_identity(lab, "Alice Archer")
    lab.answer("pinentry", "dismiss")

    check.assertEqual(pair(lab, "alice", hash_).status, 255)
    (warning,) = lab.asked("pinentry")
    check.assertIn("only one try is left", warning["warning"])

    lab.answer("pinentry", "pin 123456")
    check.assertEqual(pair(lab, "alice", hash_).status, 0)
    check.assertEqual(["warning" in each for each in lab.asked("pinentry")], [True, True, False])


def the_last_try_is_known_after_two_wrong_pins(lab):
    lab.insert("rsa")
    hash_ = only_identity(lab, "Alice Archer")
    lab.answer("pinentry", "pin 000000")
    for _ in range(2):
        check.assertEqual(pair(lab, "alice", hash_).status, 255)
    check.assertIn("pin=1", lab.card_ctl("tries", "rsa"))

    lab.answer("pinentry", "dismiss")
    check.assertEqual(pair(lab, "alice", hash_).status, 255)

    check.assertIn("only one try is left", lab.asked("pinentry")[-1]["warning"])
    check.assertIn("pin=1", lab.card_ctl("tries", "rsa"))


def a_person_who_dismisses_the_question_costs_no_try(lab):
    lab.insert("rsa")
    hash_ = only_identity(lab, "Alice Archer")
    lab.answer("pinentry", "dismiss")

    refused = pair(lab, "alice", hash_)

    check.assertEqual(refused.status, 255, refused)
    check.assertIn("pin=3", lab.card_ctl("tries", "rsa"))


def a_blocked_card_says_so_and_asks_nobody(lab):
    lab.card_ctl("set-tries", "rsa", "0")
    hash_ = present(lab, "rsa", "Alice Archer")

    refused = pair(lab, "alice", hash_)

    check.assertEqual(refused.status, 255, refused)
    check.assertIn("locked", refused.output)
    check.assertEqual(lab.asked("pinentry"), [])


def who_has_a_terminal_is_asked_there(lab):
    lab.insert("rsa")
    hash_ = only_identity(lab, "Alice Archer")
    # Away with the one that answers for the desktop: Debian's own asks on the terminal.
    lab.root("mv", "/usr/local/bin/pinentry", "/usr/local/bin/pinentry.away")

    paired = lab.on_terminal(
        None, ["vlmbind", "-p", "-v", "-u", "bob", "-h", hash_], {"PIN:": "123456\r"}
    )

    check.assertEqual(paired.status, 0, paired)
    check.assertIn("User was successfully paired", paired.output)
