"""Who is not root pairs and unpairs the own account, when an administrator allows it.

The requests are made by hand, as any program could: the daemon goes by what polkit says of the
caller, and not by what the caller did before.
"""

import subprocess

from machine.checks import check
from machine.listing import identities, pair, present

ASK = "/usr/lib/vlm-lab/ask-hints"
SERVICE = "vlmhintsd.service"
ADMINISTRATOR = "password pw-carol"


def a_user_pairs_himself_when_an_administrator_allows_it(lab):
    hash_ = _inserted(lab)
    lab.answer("polkit", ADMINISTRATOR)

    check.assertEqual(_answers(_pair(lab, hash_)), ["0", "0"])

    (question,) = lab.asked("polkit")
    check.assertEqual(question["action"], "org.vlm.vlmbind.admin")
    check.assertEqual(question["users"], ["carol"])
    check.assertEqual(
        question["message"],
        f'Authentication is required to pair the card "Alice Archer" (key {hash_[:16]}...) with the '
        "account alice",
    )
    check.assertEqual(_pairings(lab), [("alice", hash_)])


def dismissed_it_changes_nothing(lab):
    hash_ = _inserted(lab)
    lab.answer("polkit", "dismiss")

    login, refused = _answers(_pair(lab, hash_), sentences=True)

    check.assertEqual(login, "0")
    check.assertRegex(refused, "^-2007 Pairing alice with .* was dismissed")
    check.assertEqual(_pairings(lab), [])


def a_wrong_password_changes_nothing(lab):
    hash_ = _inserted(lab)
    lab.answer("polkit", "fail")

    _, refused = _answers(_pair(lab, hash_), sentences=True)

    check.assertRegex(refused, "^-2001 Pairing alice with .* the password was wrong")
    check.assertEqual(_pairings(lab), [])


def without_anything_that_asks_it_says_so(lab):
    hash_ = _inserted(lab)
    lab.user("alice", "systemctl", "--user", "stop", "lab-polkit-agent.service")

    _, refused = _answers(_pair(lab, hash_), sentences=True)

    check.assertRegex(refused, "^-2017 .* no program of this desktop asks")


def a_user_unpairs_himself_when_an_administrator_allows_it(lab):
    hash_ = present(lab, "rsa", "Alice Archer")
    check.assertEqual(pair(lab, "alice", hash_).status, 0)

    lab.answer("polkit", "dismiss")
    refused = lab.user("alice", "vlmbind", "-r", "-u", "alice", "-h", hash_)
    check.assertEqual(refused.status, 255, refused)
    check.assertIn(f"Cannot unpair user (public key hash: {hash_}).", refused.output)
    check.assertIn("dismissed", refused.output)
    check.assertEqual(_pairings(lab), [("alice", hash_)])

    lab.answer("polkit", ADMINISTRATOR)
    unpaired = lab.user("alice", "vlmbind", "-r", "-v", "-u", "alice", "-h", hash_)
    check.assertEqual(unpaired.status, 0, unpaired)
    check.assertEqual(_pairings(lab), [])
    check.assertIn("to unpair the card", lab.asked("polkit")[-1]["message"])


def nobody_is_asked_for_another_account(lab):
    hash_ = _inserted(lab)
    lab.answer("polkit", ADMINISTRATOR)
    pair(lab, "bob", hash_)

    for change in (f"pair bob {hash_}", f"pair root {hash_}", f"unpair bob {hash_}"):
        (refused,) = _answers(_ask(lab, change), sentences=True)
        check.assertRegex(refused, "^-2001 .* only root may do this for another account")
    check.assertEqual(lab.asked("polkit"), [])
    check.assertEqual(_pairings(lab), [("bob", hash_)])


def nobody_is_asked_without_a_proof(lab):
    hash_ = _inserted(lab)
    lab.answer("polkit", ADMINISTRATOR)

    check.assertEqual(_answers(_ask(lab, f"pair alice {hash_}")), ["-2011"])
    check.assertEqual(_answers(_ask(lab, f"login {hash_} 123456 1001")), ["-2001"])
    check.assertEqual(_answers(_ask(lab, f"login {hash_} 000000")), ["-2008"])
    check.assertEqual(_answers(_ask(lab, f"pair alice {hash_}")), ["-2011"])
    check.assertEqual(lab.asked("polkit"), [])


def nobody_is_asked_on_a_locked_screen(lab):
    hash_ = _inserted(lab)
    lab.answer("polkit", ADMINISTRATOR)
    session = lab.root("loginctl", "show-seat", "seat0", "--property=ActiveSession", "--value")
    _set_locked(lab, session.output.strip(), True)

    _, refused = _answers(_pair(lab, hash_), sentences=True)
    check.assertRegex(refused, "^-2016 .* the screen is locked")
    check.assertEqual(lab.asked("polkit"), [])

    _set_locked(lab, session.output.strip(), False)
    check.assertEqual(_answers(_ask(lab, f"pair alice {hash_}")), ["0"])


def nobody_is_asked_in_the_background(lab):
    hash_ = _inserted(lab)
    lab.answer("polkit", ADMINISTRATOR)
    as_alice = lab.command_for("alice", [ASK, f"login {hash_} 123456", f"pair alice {hash_}"])
    lab.root("systemctl", "start", "console@bob")

    done = subprocess.run(as_alice, capture_output=True, text=True)

    check.assertRegex(done.stdout, "\n-2016 .* another session is in the foreground")
    check.assertEqual(lab.asked("polkit"), [])


def nobody_is_asked_from_afar(lab):
    hash_ = _inserted(lab)
    lab.answer("polkit", ADMINISTRATOR)

    done = lab.user("bob", ASK, f"login {hash_} 123456", f"pair bob {hash_}")

    check.assertRegex(done.output, "\n-2016 .* not from afar")
    check.assertEqual(lab.asked("polkit"), [])


def nobody_is_asked_outside_of_any_session(lab):
    hash_ = _inserted(lab)
    lab.answer("polkit", ADMINISTRATOR)
    service = ["systemd-run", "--quiet", "--wait", "--pipe", "--collect", "--property=User=alice"]

    done = lab.root(*service, ASK, f"login {hash_} 123456", f"pair alice {hash_}")

    check.assertRegex(done.output, "\n-2016 .* in no session of its user")
    check.assertEqual(lab.asked("polkit"), [])


def a_program_is_asked_in_its_own_session_only(lab):
    hash_ = _inserted(lab)
    lab.answer("polkit", ADMINISTRATOR)
    session = ["--property=User=bob", "--property=PAMName=login"]
    for name, value in (("SEAT", "seat0"), ("SESSION_TYPE", "x11"), ("SESSION_CLASS", "user")):
        session.append(f"--setenv=XDG_{name}={value}")

    done = lab.root(
        "systemd-run", "--quiet", "--wait", "--pipe", "--collect", *session, ASK,
        f"login {hash_} 123456", f"pair bob {hash_}",
    )  # fmt: skip

    # It is in the foreground, and the desktop that asks is another.
    check.assertRegex(done.output, "\n-2017 .* no program of this desktop asks")
    check.assertEqual(lab.asked("polkit"), [])


def a_right_that_was_given_is_not_another_process_s(lab):
    hash_ = _inserted(lab)
    lab.answer("polkit", ADMINISTRATOR)
    check.assertEqual(_answers(_pair(lab, hash_)), ["0", "0"])

    lab.answer("polkit", "dismiss")

    check.assertEqual(_answers(_ask(lab, f"unpair alice {hash_}")), ["-2007"])
    check.assertEqual(len(lab.asked("polkit")), 2)


def a_right_that_was_given_is_not_for_another_key(lab):
    first, second = _two_keys(lab)
    lab.answer("polkit", ADMINISTRATOR)

    done = _ask(
        lab,
        f"login {first} 123456",
        f"pair alice {first}",
        f"login {second} 123456",
        f"pair alice {second}",
        f"unpair alice {first}",
    )

    check.assertEqual(_answers(done), ["0", "0", "0", "-2001", "-2001"])
    check.assertIn("allowed this program one other change", done.output)
    check.assertEqual(_pairings(lab), [("alice", first)])
    check.assertEqual(len(lab.asked("polkit")), 1)


def each_of_two_requests_at_once_is_asked_about(lab):
    first, second = _two_keys(lab)
    lab.answer("polkit", "wait")
    asking = _begin(
        lab,
        "--at-once",
        f"login {first} 123456",
        f"login {second} 123456",
        f"pair alice {first}",
        f"pair alice {second}",
    )
    lab.wait_until("both are asked about", lambda: len(lab.asked("polkit")) == 2)
    messages = "".join(question["message"] for question in lab.asked("polkit"))
    check.assertIn(first[:16], messages)
    check.assertIn(second[:16], messages)

    lab.answer("polkit", "dismiss")

    output, _ = asking.communicate(timeout=30)
    check.assertEqual(_words(output), ["0", "0", "-2007", "-2007"])
    check.assertEqual(_pairings(lab), [])


def others_are_served_while_a_person_reads(lab):
    hash_ = _inserted(lab)
    lab.answer("polkit", "wait")
    asking = _begin_pairing(lab, hash_)

    check.assertIn(hash_, lab.root("vlmbind", "-i").output)
    check.assertEqual(pair(lab, "bob", hash_).status, 0)

    lab.answer("polkit", ADMINISTRATOR)
    output, _ = asking.communicate(timeout=30)
    check.assertEqual(_words(output), ["0", "0"])


def who_is_gone_takes_the_question_along(lab):
    hash_ = _inserted(lab)
    lab.answer("polkit", "wait")
    asking = _begin_pairing(lab, hash_)

    lab.root("pkill", "--signal", "KILL", "--full", ASK)

    _wait_until_withdrawn(lab)
    asking.communicate(timeout=30)
    lab.answer("polkit", ADMINISTRATOR)
    check.assertEqual(_pairings(lab), [])


def a_service_that_is_killed_takes_the_question_along(lab):
    hash_ = _inserted(lab)
    lab.answer("polkit", "wait")
    asking = _begin_pairing(lab, hash_)

    lab.root("systemctl", "kill", "--signal=KILL", SERVICE)

    _wait_until_withdrawn(lab)
    output, _ = asking.communicate(timeout=30)
    check.assertNotEqual(asking.returncode, 0, output)
    check.assertEqual(_pairings(lab), [])
    lab.answer("polkit", ADMINISTRATOR)
    check.assertEqual(_answers(_pair(lab, hash_)), ["0", "0"])


def polkit_that_is_killed_is_a_refusal(lab):
    hash_ = _inserted(lab)
    lab.answer("polkit", "wait")
    asking = _begin_pairing(lab, hash_)

    lab.root("systemctl", "kill", "--signal=KILL", "polkit.service")

    output, _ = asking.communicate(timeout=30)
    check.assertRegex(output, "\n-2017 Pairing alice with .* polkit could not be asked")
    check.assertEqual(_pairings(lab), [])


def _inserted(lab) -> str:
    return present(lab, "rsa", "Alice Archer")


def _two_keys(lab) -> tuple[str, str]:
    lab.insert("two-identities")
    found = lab.wait_until("both are listed", lambda: len(identities(lab)) == 2 and identities(lab))
    first, second = found.values()
    return first, second


def _ask(lab, *requests: str):
    return lab.user("alice", ASK, *requests)


def _pair(lab, hash_: str):
    return _ask(lab, f"login {hash_} 123456", f"pair alice {hash_}")


def _begin(lab, *requests: str) -> subprocess.Popen:
    command = lab.command_for("alice", [ASK, *requests])
    return subprocess.Popen(command, stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True)


def _begin_pairing(lab, hash_: str) -> subprocess.Popen:
    asking = _begin(lab, f"login {hash_} 123456", f"pair alice {hash_}")
    lab.wait_until("the administrator is asked", lambda: lab.asked("polkit"))
    return asking


def _wait_until_withdrawn(lab) -> None:
    lab.wait_until("the question is withdrawn", lambda: {"cancelled": True} in lab.asked("polkit"))


def _answers(done, sentences: bool = False) -> list[str]:
    check.assertEqual(done.status, 0, done)
    return (
        [line.rstrip() for line in done.output.splitlines()] if sentences else _words(done.output)
    )


def _words(output: str) -> list[str]:
    return [line.split()[0] for line in output.splitlines()]


def _pairings(lab) -> list[tuple[str, str]]:
    """Accounts and the hashes that they are paired with."""
    lines = [line.split() for line in lab.root("vlmctl", "pairings").output.splitlines()]
    return sorted((words[0], word) for words in lines for word in words if len(word) == 64)


def _set_locked(lab, session: str, locked: bool) -> None:
    path = f"/org/freedesktop/login1/session/_3{session[0]}{session[1:]}"
    member = ["org.freedesktop.login1.Session", "SetLockedHint", "b", str(locked).lower()]
    done = lab.root("busctl", "call", "org.freedesktop.login1", path, *member)
    check.assertEqual(done.status, 0, done)
