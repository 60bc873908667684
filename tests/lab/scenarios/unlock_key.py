"""What was wrapped for a card is opened by it, through OpenSC, in the login that it signs in."""

from machine.checks import check
from machine.listing import only_identity

OAEP, ECDH = "1", "3"


def opened(lab, pin="123456"):
    """What each card opens: name, scheme, text."""
    worker = "/usr/libexec/vlm/vlm-token-worker"
    lines = lab.root("vlm-open-by-card", worker, pin).output.splitlines()
    return [tuple(line.split("\t")) for line in lines]


def an_rsa_card_opens_what_was_wrapped_for_it(lab):
    lab.insert("rsa")
    only_identity(lab, "Alice Archer")

    check.assertEqual(opened(lab), [("Alice Archer", OAEP, "correct horse")])


def an_ec_card_opens_what_was_wrapped_for_it(lab):
    lab.insert("ec")
    only_identity(lab, "Bob Baker")

    check.assertEqual(opened(lab), [("Bob Baker", ECDH, "correct horse")])


def each_of_two_cards_opens_its_own(lab):
    lab.insert("rsa", 1)
    lab.insert("second", 2)
    only_identity(lab, "Alice Archer")
    only_identity(lab, "Carol Cooper")

    check.assertEqual(
        sorted(opened(lab)),
        [("Alice Archer", OAEP, "correct horse"), ("Carol Cooper", OAEP, "correct horse")],
    )


def a_card_without_a_key_for_it_opens_nothing(lab):
    lab.insert("no-wrap-key")
    only_identity(lab, "Dan Draper")

    ((_, _, text),) = opened(lab)
    check.assertEqual(text, "no wrap key")


def a_wrong_pin_opens_nothing(lab):
    lab.insert("rsa")
    only_identity(lab, "Alice Archer")

    ((_, _, text),) = opened(lab, "654321")
    check.assertTrue(text.startswith("not signed: "), text)
