"""What an account without rights tries by calling the daemon itself; all of it is refused."""

from machine.attack import (
    NOT_PERMITTED,
    exchange,
    hash_words,
    nothing_changes,
    result,
    user_id,
)
from machine.by_hand import (
    ADMINISTRATOR,
    ASK,
    ask,
    begin,
    end,
    pairing,
    pairings,
    statuses,
    statuses_in,
)
from machine.checks import check
from machine.listing import identities, pair, present

PAIR, UNPAIR, PAIRINGS, IS_PAIRED = "2", "3", "4", "6"
NO_PIN, NOT_PROVED = "-2006", "-2011"


def nobody_pairs_by_a_call_from_afar(lab):
    hash_ = _alice_is_paired(lab)

    with nothing_changes(lab):
        for account, expected in (
            ("bob", NOT_PROVED),
            ("alice", NOT_PERMITTED),
            ("root", NOT_PERMITTED),
            (user_id(lab, "alice"), NOT_PERMITTED),
            ("alice\n", NOT_PERMITTED),
        ):
            done = exchange(lab, "bob", "op", "t", PAIR, "str1", "s", account, *hash_words(hash_))
            check.assertEqual(result(done), expected, account)
    check.assertEqual(lab.asked("polkit"), [])


def nobody_unpairs_or_looks_at_another(lab):
    hash_ = _alice_is_paired(lab)

    with nothing_changes(lab):
        for request in (
            ("op", "t", UNPAIR, *hash_words(hash_)),
            ("op", "t", PAIRINGS, "num1", "x", "0"),
            ("op", "t", IS_PAIRED),
        ):
            done = exchange(lab, "bob", *request, "str1", "s", "alice")
            check.assertEqual(result(done), NOT_PERMITTED, request)
    listed = exchange(lab, "bob", "op", "t", "1", "uid", "x", "-1")
    name = " ".join(str(each) for each in b"alice")
    check.assertNotIn(name, listed.output)
    check.assertIn(" ".join(str(each) for each in b"another account"), listed.output)


def a_user_id_in_the_message_counts_for_nothing(lab):
    hash_ = _alice_is_paired(lab)

    with nothing_changes(lab):
        for uid in ("0", user_id(lab, "alice")):
            claimed = ("uid", "x", uid)
            for operation in ("1", "7"):
                done = exchange(lab, "bob", "op", "t", operation, *claimed)
                check.assertEqual(result(done), NOT_PERMITTED)
            login = exchange(
                lab, "bob", "op", "t", "0", "str1", "s", "token", *claimed, *hash_words(hash_)
            )
            check.assertEqual(result(login), NOT_PERMITTED)
            # These look at no such key.
            for operation in (PAIR, UNPAIR):
                request = ("op", "t", operation, "str1", "s", "alice", *hash_words(hash_))
                done = exchange(lab, "bob", *request, *claimed)
                check.assertEqual(result(done), NOT_PERMITTED)


def a_card_without_its_pin_pairs_nobody(lab):
    hash_ = present(lab, "rsa", "Alice Archer")

    with nothing_changes(lab):
        # Who is from afar, and on no terminal, cannot be asked.
        done = lab.user("bob", ASK, f"login {hash_} -", f"pair bob {hash_}")
        check.assertEqual(statuses_in(done.output), [NO_PIN, NOT_PROVED], done)
        # A proof is its maker's.
        check.assertEqual(statuses(ask(lab, f"login {hash_} 123456")), ["0"])
        done = lab.user("bob", ASK, f"pair bob {hash_}", f"pair alice {hash_}")
        check.assertEqual(statuses_in(done.output), [NOT_PROVED, NOT_PERMITTED])


def a_request_beside_one_that_waits_is_not_carried_along(lab):
    """The first waits for the administrator; others try to get in behind it."""
    first, second = _two_identities(lab)
    lab.answer("polkit", "wait")
    with nothing_changes(lab):
        login, pair_first = pairing(first)
        # From the same connection, where the proof is held already.
        asking = begin(lab, "--at-once", login, pair_first, pair_first, f"pair alice {second}")
        lab.wait_until("the administrator is asked", lambda: lab.asked("polkit"))
        # From another one, for the same key, another key, another account.
        late = ask(lab, pair_first, f"pair alice {second}", f"pair bob {first}")
        check.assertEqual(statuses(late), [NOT_PROVED, NOT_PROVED, NOT_PERMITTED])
        from_afar = lab.user("bob", ASK, f"pair bob {first}", f"pair alice {first}")
        check.assertEqual(statuses_in(from_afar.output), [NOT_PROVED, NOT_PERMITTED])

        lab.answer("polkit", "dismiss")

        check.assertEqual(statuses_in(end(asking)), ["0", NOT_PROVED, NOT_PROVED, "-2007"])
    (question, *_) = lab.asked("polkit")
    check.assertEqual(len([each for each in lab.asked("polkit") if "message" in each]), 1)
    check.assertIn(first[:16], question["message"])


def what_is_allowed_while_another_waits_is_what_was_asked(lab):
    """Two processes with a proof of their own: the one whose question is answered is paired."""
    first, second = _two_identities(lab)
    lab.answer("polkit", "wait")
    one = begin(lab, *pairing(first))
    lab.wait_until("the first is asked about", lambda: len(lab.asked("polkit")) == 1)
    other = begin(lab, *pairing(second))
    lab.wait_until("the second is asked about", lambda: len(lab.asked("polkit")) == 2)
    # The second leaves; its question goes, and the first is answered.
    lab.root("pkill", "--signal", "KILL", "--full", f"pair alice {second}")
    lab.wait_until("it is withdrawn", lambda: {"cancelled": True} in lab.asked("polkit"))

    lab.answer("polkit", ADMINISTRATOR)

    check.assertEqual(statuses_in(end(one)), ["0", "0"])
    end(other)
    check.assertEqual(pairings(lab), [("alice", first)])


def a_right_for_oneself_is_none_for_another(lab):
    lab.answer("polkit", ADMINISTRATOR)
    first, second = _two_identities(lab)
    check.assertEqual(pair(lab, "bob", second).status, 0)

    with nothing_changes(lab):
        done = ask(
            lab,
            "right",
            f"login {first} 123456",
            f"pair bob {first}",
            f"pair root {first}",
            f"unpair bob {second}",
        )
        granted = ["granted", "0", NOT_PERMITTED, NOT_PERMITTED, NOT_PERMITTED]
        check.assertEqual(statuses(done), granted)
    check.assertEqual(len(lab.asked("polkit")), 1)


def a_right_is_not_for_a_later_card(lab):
    lab.answer("polkit", ADMINISTRATOR)
    hash_ = present(lab, "rsa", "Alice Archer")
    later = present(lab, "second", "Carol Cooper", 2)

    done = ask(lab, *pairing(hash_), *pairing(later))

    check.assertEqual(statuses(done), ["0", "0", "0", NOT_PERMITTED])
    check.assertEqual(pairings(lab), [("alice", hash_)])


def no_program_words_the_question_itself(lab):
    """What the administrator reads is the daemon's: polkit takes no details from others."""
    lab.answer("polkit", ADMINISTRATOR)
    # systemd takes one half of the dollars.
    ask_polkit = (
        "pkcheck --action-id org.vlm.vlmbind.admin --process $$$$ --allow-user-interaction"
        " --detail polkit.message 'Pair the card with the account bob' --detail account bob"
    )

    with nothing_changes(lab):
        refused = lab.user("alice", "sh", "-c", ask_polkit)

    check.assertNotEqual(refused.status, 0, refused)
    check.assertIn("NotAuthorized", refused.errors)
    check.assertEqual(lab.asked("polkit"), [])


def _two_identities(lab) -> list[str]:
    present(lab, "two-identities", "Frank Fisher")
    return list(identities(lab).values())


def _alice_is_paired(lab) -> str:
    hash_ = present(lab, "rsa", "Alice Archer")
    check.assertEqual(pair(lab, "alice", hash_).status, 0)
    return hash_
