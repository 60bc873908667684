"""The control socket: tries of a card's PIN, and what it says to wrong input."""

import asyncio
import contextlib
import stat

import bench
from readers_test_case import ReadersTestCase


class Tries(ReadersTestCase):
    async def test_they_are_told_and_set_while_the_card_is_in(self) -> None:
        card = await self.insert("ec")
        await card.ask(bench.SELECT)
        await card.ask(bench.frame(0x20, 0x80, bench.WRONG_PIN))
        self.assertEqual(await self.tell("tries ec"), "ok pin=2 puk=3")

        self.assertEqual(await self.tell("set-tries ec 0"), "ok")

        self.assertEqual(await card.ask(bench.frame(0x20, 0x80, bench.PIN)), b"\x69\x83")
        self.assertEqual(await self.tell("tries ec"), "ok pin=0 puk=3")

    async def test_they_stay_when_the_program_begins_again(self) -> None:
        await self.tell("set-tries ec 1")

        await self.start()

        self.assertEqual(await self.tell("tries ec"), "ok pin=1 puk=3")


class WrongInput(ReadersTestCase):
    async def test_it_is_refused_with_a_reason(self) -> None:
        (self.cards / "ec" / "card.json").write_text("{")
        outside = f"../{self.cards.name}/slow"
        rows = {
            "": "usage: '' is none of insert, remove,",
            "eject": "usage: 'eject' is none of insert, remove,",
            "insert": "usage: insert CARD [READER]",
            "insert slow 1 2": "usage: insert CARD [READER]",
            "status 1": "usage: status",
            "set-tries slow": "usage: set-tries CARD N",
            "insert green": "there is no card 'green' in ",
            f"insert {outside}": f"there is no card '{outside}' in ",
            "insert \x1b[2J": "there is no card '\\x1b[2J' in ",
            "insert ec": "the card in ",
            "insert slow 3": "there is no reader '3', only 1 and 2",
            "insert slow -1": "there is no reader '-1', only 1 and 2",
            "remove": "reader 1 is empty",
            "remove x": "there is no reader 'x', only 1 and 2",
            "tries green": "there is no card 'green' in ",
            "set-tries slow 4": "a PIN cannot have '4' tries left, only 0 to 3",
            "set-tries slow -1": "a PIN cannot have '-1' tries left, only 0 to 3",
            "set-tries slow many": "a PIN cannot have 'many' tries left, only 0 to 3",
        }

        for line, reason in rows.items():
            with self.subTest(line):
                answer = await self.tell(line)
                self.assertTrue(answer.startswith(f"error {reason}"), answer)

    async def test_noise_is_refused_and_the_next_is_answered(self) -> None:
        self.assertTrue((await self.tell_bytes(b"\xff\xfe\0\n")).startswith(b"error usage: "))
        self.assertEqual(
            await self.tell_bytes(b"x" * 5000 + b"\n"), b"error usage: this line is too long"
        )
        self.assertEqual(await self.tell("status"), "ok 1=- 2=-")

    async def test_several_commands_go_over_one_connection(self) -> None:
        incoming, outgoing = await asyncio.open_unix_connection(self.socket)
        with contextlib.closing(outgoing):
            outgoing.write(b"tries slow\nstatus\n")

            self.assertEqual(await incoming.readline(), b"ok pin=3 puk=3\n")
            self.assertEqual(await incoming.readline(), b"ok 1=- 2=-\n")

    async def test_noise_from_vpcd_is_answered(self) -> None:
        card = await self.insert("ec")

        for message in (b"", b"\7", b"\0\xa4", bytes(65535)):
            self.assertEqual(len(await card.ask(message)), 2)

    async def test_only_its_owner_opens_the_socket(self) -> None:
        self.assertEqual(stat.S_IMODE(self.socket.stat().st_mode), 0o600)

    async def test_no_pin_is_in_the_log(self) -> None:
        card = await self.insert("ec")
        await self.verify(card)
        await self.pull(card)

        self.assertIn("ec is pulled from reader 1", self.log.getvalue())
        self.assertNotIn("123456", self.log.getvalue())
