"""The road of one inserted card, from the reader to the finished pairing."""

from machine.checks import check
from machine.listing import only_identity


def a_card_is_paired_with_nothing_started_by_hand(lab):
    lab.answer("polkit", "password pw-carol")
    lab.answer("pinentry", "pin 123456")
    lab.insert("rsa")
    lab.wait_until("the window is there", lambda: "SmartCard Pairing" in lab.windows())
    hash_ = only_identity(lab, "Alice Archer")

    lab.windows("press", "Pair")

    lab.wait_until("it says what came of it", lambda: "alert" in lab.windows())
    lab.windows("press", "OK")
    lab.wait_until("the window is gone", lambda: "SmartCard Pairing" not in lab.windows())
    check.assertIn(f"{hash_}\talice - Alice Archer\n", lab.root("vlmbind", "-i").output)
