"""PIN and PUK: who may try how often, and what the card remembers of it."""

from bench import (
    OTHER_PIN,
    OTHER_PUK,
    PIN,
    PUK,
    WRONG_PIN,
    WRONG_PUK,
    Talk,
    frame,
)
from card_test_case import CardTestCase

ASK = frame(0x20, 0x80)
FORGET = frame(0x20, 0xFF80)


def change_pin(old: bytes, new: bytes) -> bytes:
    return frame(0x24, 0x80, old + new)


def change_puk(old: bytes, new: bytes) -> bytes:
    return frame(0x24, 0x81, old + new)


def unblock(puk: bytes, new: bytes) -> bytes:
    return frame(0x2C, 0x80, puk + new)


class Pin(CardTestCase):
    def block(self, card: Talk) -> None:
        for _ in range(3):
            card.verify(WRONG_PIN)
        self.assertEqual(card.status(ASK), 0x6983)

    def test_wrong_pins_count_down_until_the_right_one_is_refused(self) -> None:
        card = self.selected("ec")

        answers = [card.verify(WRONG_PIN) for _ in range(4)]

        self.assertEqual(answers, [0x63C2, 0x63C1, 0x63C0, 0x6983])
        self.assertEqual(card.verify(PIN), 0x6983)

    def test_the_right_pin_gives_all_tries_back(self) -> None:
        card = self.selected("ec")

        card.verify(WRONG_PIN)
        card.verify(PIN)

        self.assertEqual(card.verify(WRONG_PIN), 0x63C2)

    def test_a_pin_of_another_length_costs_no_try(self) -> None:
        card = self.selected("ec")

        self.assertEqual(card.verify(PIN[:6]), 0x6A80)
        self.assertEqual(card.status(ASK), 0x63C3)

    def test_the_card_says_whether_it_wants_the_pin(self) -> None:
        card = self.selected("ec")

        self.assertEqual(card.status(ASK), 0x63C3)
        card.verify(PIN)
        self.assertEqual(card.status(ASK), 0x9000)
        self.assertEqual(card.status(FORGET), 0x9000)
        self.assertEqual(card.status(ASK), 0x63C3)

    def test_selecting_again_takes_nothing_away(self) -> None:
        card = self.verified("ec")

        card.send(bytes.fromhex("00a404000ba00000030800001000010000"))

        self.assertEqual(card.status(ASK), 0x9000)

    def test_the_puk_unblocks_the_pin_with_a_new_one(self) -> None:
        card = self.selected("ec")
        self.block(card)

        self.assertEqual(card.status(unblock(PUK, OTHER_PIN)), 0x9000)

        self.assertEqual(card.status(ASK), 0x63C3)
        self.assertEqual(card.verify(PIN), 0x63C2)
        self.assertEqual(card.verify(OTHER_PIN), 0x9000)

    def test_wrong_puks_count_down_until_the_right_one_is_refused(self) -> None:
        card = self.selected("ec")
        self.block(card)

        answers = [card.status(unblock(WRONG_PUK, PIN)) for _ in range(4)]

        self.assertEqual(answers, [0x63C2, 0x63C1, 0x63C0, 0x6983])
        self.assertEqual(card.status(unblock(PUK, PIN)), 0x6983)
        self.assertEqual(card.status(ASK), 0x6983)

    def test_the_right_puk_gives_its_tries_back(self) -> None:
        card = self.selected("ec")

        card.status(unblock(WRONG_PUK, PIN))
        card.status(unblock(PUK, PIN))

        self.assertEqual(card.status(unblock(WRONG_PUK, PIN)), 0x63C2)

    def test_the_pin_is_changed_by_who_knows_it(self) -> None:
        card = self.selected("ec")

        self.assertEqual(card.status(change_pin(WRONG_PIN, OTHER_PIN)), 0x63C2)
        self.assertEqual(card.status(change_pin(PIN, OTHER_PIN)), 0x9000)

        self.assertEqual(card.status(ASK), 0x9000)
        self.assertEqual(card.verify(PIN), 0x63C2)
        self.assertEqual(card.verify(OTHER_PIN), 0x9000)

    def test_the_puk_is_changed_by_who_knows_it(self) -> None:
        card = self.selected("ec")

        self.assertEqual(card.status(change_puk(WRONG_PUK, OTHER_PUK)), 0x63C2)
        self.assertEqual(card.status(change_puk(PUK, OTHER_PUK)), 0x9000)

        self.assertEqual(card.status(unblock(PUK, PIN)), 0x63C2)
        self.assertEqual(card.status(unblock(OTHER_PUK, PIN)), 0x9000)
        self.assertEqual(card.status(ASK), 0x63C3)

    def test_a_new_pin_that_is_none_costs_no_try(self) -> None:
        card = self.selected("ec")

        for wrong in (b"", b"12345\xff\xff\xff", b"abcdefgh", b"1234567", b"123456789"):
            with self.subTest(new=wrong):
                self.assertEqual(card.status(change_pin(PIN, wrong)), 0x6A80)
                self.assertEqual(card.status(unblock(PUK, wrong)), 0x6A80)
        self.assertEqual(card.status(ASK), 0x63C3)

    def test_a_card_remembers_its_tries_and_numbers(self) -> None:
        card = self.selected("ec")
        card.status(change_pin(PIN, OTHER_PIN))
        card.status(unblock(WRONG_PUK, PIN))
        card.verify(WRONG_PIN)

        again = self.selected("ec")

        self.assertEqual(again.status(ASK), 0x63C2)
        self.assertEqual(again.verify(OTHER_PIN), 0x9000)
        self.assertEqual(again.status(unblock(WRONG_PUK, PIN)), 0x63C1)

    def test_a_card_remembers_that_it_was_unblocked(self) -> None:
        card = self.selected("ec")
        self.block(card)
        card.status(unblock(PUK, OTHER_PIN))

        self.assertEqual(self.selected("ec").verify(OTHER_PIN), 0x9000)

    def test_nothing_half_written_is_left_beside_the_memory(self) -> None:
        self.selected("ec").verify(WRONG_PIN)

        names = [path.name for path in (self.cards / "ec").glob("state*")]

        self.assertEqual(names, ["state.json"])
