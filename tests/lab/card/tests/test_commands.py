"""Selecting, reading, and what the card says to commands that are none."""

import random

import piv_card
from bench import Talk, certificate, frame
from card_test_case import CardTestCase
from cryptography.hazmat.primitives.serialization import Encoding

import tlv


class Commands(CardTestCase):
    def test_nothing_works_before_the_application_is_selected(self) -> None:
        card = Talk(self.load("ec"))

        self.assertEqual(card.get_data("5fc105")[1], 0x6D00)

    def test_select_tells_the_application(self) -> None:
        data, status = Talk(self.load("ec")).send(
            bytes.fromhex("00a404000ba000000308000010000100") + b"\0"
        )

        self.assertEqual(status, 0x9000)
        self.assertEqual(tlv.decode(tlv.decode(data)[0x61])[0x4F].hex(), "000010000100")

    def test_other_applications_are_not_there(self) -> None:
        card = self.selected("ec")

        for name in ("a000000308", "d2760001240102000000", "a00000030800001000010001"):
            with self.subTest(name=name):
                self.assertEqual(card.status(frame(0xA4, 0x0400, bytes.fromhex(name))), 0x6A82)
        self.assertEqual(card.get_data("7e")[1], 0x9000)

    def test_certificates_are_read_in_pieces(self) -> None:
        card = self.selected("rsa")

        for slot, name in ((0x9A, "5fc105"), (0x9D, "5fc10b")):
            with self.subTest(slot=f"{slot:x}"):
                data, status = card.get_data(name)

                read = tlv.decode(tlv.decode(data)[0x53])[0x70]
                written = certificate("rsa", slot).public_bytes(Encoding.DER)
                self.assertEqual((status, read), (0x9000, written))

    def test_a_long_answer_comes_at_once_where_the_reader_takes_it(self) -> None:
        loaded = self.load("rsa")
        self.talk_selected(loaded)

        answer = loaded.chip.answer(bytes.fromhex("00cb3fff0000055c035fc1050000"))

        self.assertGreater(len(answer), 600)
        self.assertEqual(answer[-2:], b"\x90\0")

    def test_there_is_no_rest_of_an_answer_that_is_over(self) -> None:
        loaded = self.load("rsa")
        card = self.talk_selected(loaded)
        read = bytes.fromhex("00cb3fff055c035fc10500")
        more = frame(0xC0, 0)

        self.assertEqual(card.status(more), 0x6985)
        self.assertEqual(loaded.chip.answer(read)[-2], 0x61)
        self.assertEqual(card.status(frame(0x20, 0x80)), 0x63C3)
        self.assertEqual(card.status(more), 0x6985)

    def test_the_serial_number_differs_from_card_to_card(self) -> None:
        # OpenSC's serial number is the beginning of the GUID.
        numbers = {
            tlv.decode(tlv.decode(self.selected(card).get_data("5fc102")[0])[0x53])[0x34][:8]
            for card in ("ec", "slow", "breaking")
        }

        self.assertEqual(len(numbers), 3)

    def test_what_is_not_on_the_card_is_not_found(self) -> None:
        card = self.selected("rsa")

        for name in ("5fc10a", "5fc1", "", "ffffff"):
            with self.subTest(name=name):
                self.assertEqual(card.get_data(name)[1], 0x6A82)

    def test_malformed_commands_get_a_status(self) -> None:
        card = self.selected("ec")
        rows = {
            "": 0x6700,
            "00": 0x6700,
            "00cb3f": 0x6700,
            "00cb3fff05": 0x6A82,
            "00cb3fff055c03": 0x6700,
            "00cb3fff055c035fc1050000": 0x6700,
            "00cb3fff0000": 0x6700,
            "00cb3fff0000000000": 0x6700,
            "00cb3fff000005005c": 0x6700,
            "00cb3fff025c05": 0x6A80,
            "00cb3fff015c": 0x6A80,
            "00cb3fff025c85": 0x6A80,
            "00cb3ffe055c035fc105": 0x6A86,
            "80cb3fff055c035fc105": 0x6E00,
            "00a40000023f00": 0x6A86,
            "00200000083132333435360000": 0x6A86,
            "0020008500": 0x6A86,
            "00240082103132333435360000313233343536ffff": 0x6A86,
            "002c0081103132333435360000313233343536ffff": 0x6A86,
            "0084000008": 0x6D00,
            "ffffffff": 0x6E00,
        }

        for command, status in rows.items():
            with self.subTest(command=command):
                self.assertEqual(f"{card.status(bytes.fromhex(command)):04x}", f"{status:04x}")

    def test_noise_gets_a_status_too(self) -> None:
        noise = random.Random(1)
        loaded = self.load("ec")
        self.talk_verified(loaded)
        instructions = [0x20, 0x24, 0x2C, 0x87, 0xA4, 0xC0, 0xCB]

        for _ in range(5000):
            body = noise.randbytes(noise.randrange(40))
            head = bytes([noise.choice([0, 0, 0x10]), noise.choice(instructions)])
            parameters = noise.choice([b"\x3f\xff", b"\0\x80", b"\x11\x9a", b"\x04\0", b"\x11\x9d"])
            counted = bytes([len(body)]) + body
            answer = loaded.chip.answer(head + parameters + noise.choice([body, counted]))
            self.assertGreaterEqual(len(answer), 2)

    def test_the_atr_adds_up(self) -> None:
        total = 0
        for byte in piv_card.ATR[1:]:
            total ^= byte

        self.assertEqual(total, 0)
