"""Who is not root pairs and unpairs the own account, when an administrator allows it.

The requests are made by hand, as any program could: the daemon goes by what polkit says of the
caller, and not by what the caller did before.
"""

import subprocess

from machine.by_hand import (
    ADMINISTRATOR,
    ASK,
    ask,
    ask_to_pair,
    pairing,
    pairings,
    statuses,
)
from machine.checks import check
from machine.listing import identities, pair, present
from machine.sessions import set_locked


def a_user_pairs_himself_when_an_administrator_allows_it(lab):
    hash_ = _ready(lab)

    check.assertEqual(statuses(ask_to_pair(lab, hash_)), ["0", "0"])

    (question,) = lab.asked("polkit")
    check.assertEqual(question["action"], "org.vlm.vlmbind.admin")
    check.assertEqual(question["users"], ["carol"])
    check.assertEqual(
        question["message"],
        f'Authentication is required to pair the card "Alice Archer" (key {hash_[:16]}...) with the '
        "account alice",
    )
    check.assertEqual(pairings(lab), [("alice", hash_)])


def a_user_unpairs_himself_when_an_administrator_allows_it(lab):
    hash_ = _ready(lab)
    check.assertEqual(pair(lab, "alice", hash_).status, 0)

    lab.answer("polkit", "dismiss")
    refused = lab.user("alice", "vlmbind", "-r", "-u", "alice", "-h", hash_)
    check.assertEqual(refused.status, 255, refused)
    check.assertIn(f"Cannot unpair user (public key hash: {hash_}).", refused.output)
    check.assertIn("dismissed", refused.output)
    check.assertEqual(pairings(lab), [("alice", hash_)])

    lab.answer("polkit", ADMINISTRATOR)
    unpaired = lab.user("alice", "vlmbind", "-r", "-v", "-u", "alice", "-h", hash_)
    check.assertEqual(unpaired.status, 0, unpaired)
    check.assertEqual(pairings(lab), [])
    check.assertIn("to unpair the card", lab.asked("polkit")[-1]["message"])


def dismissed_it_changes_nothing(lab):
    hash_ = _ready(lab)
    lab.answer("polkit", "dismiss")

    done = ask_to_pair(lab, hash_)

    check.assertEqual(statuses(done), ["0", "-2007"])
    check.assertRegex(done.output, "Pairing alice with .* was dismissed")
    check.assertEqual(pairings(lab), [])


def a_wrong_password_changes_nothing(lab):
    hash_ = _ready(lab)
    lab.answer("polkit", "fail")

    done = ask_to_pair(lab, hash_)

    check.assertEqual(statuses(done), ["0", "-2001"])
    check.assertRegex(done.output, "Pairing alice with .* the password was wrong")
    check.assertEqual(pairings(lab), [])


def nobody_is_asked_for_another_account(lab):
    hash_ = _ready(lab)
    pair(lab, "bob", hash_)

    for change in (f"pair bob {hash_}", f"pair root {hash_}", f"unpair bob {hash_}"):
        refused = ask(lab, change)
        check.assertEqual(statuses(refused), ["-2001"])
        check.assertIn("only root may do this for another account", refused.output)
    check.assertEqual(lab.asked("polkit"), [])
    check.assertEqual(pairings(lab), [("bob", hash_)])


def nobody_is_asked_without_a_proof(lab):
    hash_ = _ready(lab)

    check.assertEqual(statuses(ask(lab, f"pair alice {hash_}")), ["-2011"])
    check.assertEqual(statuses(ask(lab, f"login {hash_} 123456 1001")), ["-2001"])
    check.assertEqual(statuses(ask(lab, f"login {hash_} 000000")), ["-2008"])
    check.assertEqual(statuses(ask(lab, f"pair alice {hash_}")), ["-2011"])
    check.assertEqual(lab.asked("polkit"), [])


def nobody_is_asked_on_a_locked_screen(lab):
    hash_ = _ready(lab)
    set_locked(lab, True)

    done = ask_to_pair(lab, hash_)
    check.assertEqual(statuses(done), ["0", "-2016"])
    check.assertIn("the screen is locked", done.output)
    check.assertEqual(lab.asked("polkit"), [])

    set_locked(lab, False)
    check.assertEqual(statuses(ask(lab, f"pair alice {hash_}")), ["0"])


def nobody_is_asked_in_the_background(lab):
    hash_ = _ready(lab)
    as_alice = lab.command_for("alice", [ASK, *pairing(hash_)])
    lab.root("systemctl", "start", "console@bob")

    done = subprocess.run(as_alice, capture_output=True, text=True)

    check.assertRegex(done.stdout, "\n-2016 .* another session is in the foreground")
    check.assertEqual(lab.asked("polkit"), [])


def nobody_is_asked_from_afar(lab):
    hash_ = _ready(lab)

    done = lab.user("bob", ASK, *pairing(hash_, "bob"))

    check.assertRegex(done.output, "\n-2016 .* not from afar")
    check.assertEqual(lab.asked("polkit"), [])


def nobody_is_asked_outside_of_any_session(lab):
    hash_ = _ready(lab)
    service = ["systemd-run", "--quiet", "--wait", "--pipe", "--collect", "--property=User=alice"]

    done = lab.root(*service, ASK, *pairing(hash_))

    check.assertRegex(done.output, "\n-2016 .* in no session of its user")
    check.assertEqual(lab.asked("polkit"), [])


def a_program_is_asked_in_its_own_session_only(lab):
    hash_ = _ready(lab)
    session = ["--property=User=bob", "--property=PAMName=login"]
    for name, value in (("SEAT", "seat0"), ("SESSION_TYPE", "x11"), ("SESSION_CLASS", "user")):
        session.append(f"--setenv=XDG_{name}={value}")
    service = ["systemd-run", "--quiet", "--wait", "--pipe", "--collect", *session]

    done = lab.root(*service, ASK, *pairing(hash_, "bob"))

    # It is in the foreground, and the desktop that asks is another.
    check.assertRegex(done.output, "\n-2017 .* no program of this desktop asks")
    check.assertEqual(lab.asked("polkit"), [])


def who_was_asked_by_the_program_itself_is_not_asked_again(lab):
    hash_ = _ready(lab)

    done = ask(lab, "right", *pairing(hash_))

    check.assertEqual(statuses(done), ["granted", "0", "0"])
    check.assertEqual(len(lab.asked("polkit")), 1)


def a_right_that_was_given_is_not_another_process_s(lab):
    hash_ = _ready(lab)
    check.assertEqual(statuses(ask_to_pair(lab, hash_)), ["0", "0"])

    lab.answer("polkit", "dismiss")

    check.assertEqual(statuses(ask(lab, f"unpair alice {hash_}")), ["-2007"])
    check.assertEqual(len(lab.asked("polkit")), 2)


def a_right_that_was_given_is_not_for_another_change(lab):
    _ready(lab, "two-identities", "Frank Fisher")
    first, second = identities(lab).values()

    done = ask(lab, *pairing(first), *pairing(second), f"unpair alice {first}")

    check.assertEqual(statuses(done), ["0", "0", "0", "-2001", "-2001"])
    check.assertIn("allowed this program one other change", done.output)
    check.assertEqual(pairings(lab), [("alice", first)])
    check.assertEqual(len(lab.asked("polkit")), 1)


def _ready(lab, card: str = "rsa", name: str = "Alice Archer") -> str:
    """Inserts a card, with an administrator there who will allow what is asked."""
    lab.answer("polkit", ADMINISTRATOR)
    return present(lab, card, name)
