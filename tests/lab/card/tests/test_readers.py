"""Cards that go into the readers, answer there, and leave in every way."""

import asyncio

import bench
import piv_card
from fake_vpcd import SEND_ATR
from readers_test_case import ReadersTestCase

SIGN = bench.sign_frame(0x11, 0x9A, bytes(32))


class Inserting(ReadersTestCase):
    async def test_a_card_answers_in_its_reader(self) -> None:
        card = await self.insert("ec")

        self.assertEqual(await self.tell("status"), "ok 1=ec 2=-")
        self.assertEqual(await card.ask(SEND_ATR), piv_card.ATR)
        await self.verify(card)
        self.assertEqual((await card.ask(SIGN))[-2:], b"\x90\0")

    async def test_power_is_not_answered_and_makes_the_card_forget_the_pin(self) -> None:
        for power in (b"\0", b"\1", b"\2"):
            with self.subTest(power=power):
                card = await self.insert("ec")
                await self.verify(card)

                card.send(power)
                await card.ask(bench.SELECT)

                self.assertEqual(await card.ask(SIGN), b"\x69\x82")
                await self.pull(card)

    async def test_a_card_that_was_pulled_comes_back_without_pin(self) -> None:
        card = await self.insert("ec")
        await self.verify(card)

        await self.pull(card)
        self.assertEqual(await self.tell("status"), "ok 1=- 2=-")
        card = await self.insert("ec")

        await card.ask(bench.SELECT)
        self.assertEqual(await card.ask(SIGN), b"\x69\x82")

    async def test_insert_is_answered_when_vpcd_has_the_card(self) -> None:
        answer = asyncio.create_task(self.tell("insert ec"))
        card = await self.vpcds[0].connection()
        self.addCleanup(card.close)

        self.assertEqual(await self.tell("status"), "ok 1=ec 2=-")
        self.assertFalse(answer.done())
        await card.ask(SEND_ATR)

        self.assertEqual(await answer, "ok")

    async def test_insert_waits_for_a_vpcd_that_begins_late(self) -> None:
        self.vpcds[0].close()
        answer = asyncio.create_task(self.tell("insert ec"))
        await self.until("1=ec 2=-")

        await self.vpcds[0].listen(self.ports[0])
        card = await self.vpcds[0].card()
        self.addCleanup(card.close)

        self.assertEqual(await answer, "ok")

    async def test_insert_is_refused_where_no_vpcd_listens(self) -> None:
        self.vpcds[0].close()
        await self.start(patience=0.05)

        answer = await self.tell("insert ec")

        self.assertIn(f"error no vpcd listens on port {self.ports[0]}, is pcscd", answer)
        self.assertEqual(await self.tell("status"), "ok 1=- 2=-")

    async def test_insert_is_refused_where_vpcd_hangs(self) -> None:
        await self.start(patience=0.05)

        answer = await self.tell("insert ec")

        self.assertEqual(answer, f"error vpcd does not take the card ec on port {self.ports[0]}")
        self.assertEqual(await self.tell("status"), "ok 1=- 2=-")

    async def test_remove_is_answered_where_vpcd_hangs(self) -> None:
        await self.start(patience=0.5)
        await self.insert("ec")

        self.assertEqual(await self.tell("remove"), "ok")

    async def test_remove_is_answered_when_vpcd_has_noticed(self) -> None:
        card = await self.insert("ec")

        answer = asyncio.create_task(self.tell("remove"))
        await card.end()
        self.assertEqual(await self.tell("status"), "ok 1=ec 2=-")
        self.assertFalse(answer.done())
        card.close()

        self.assertEqual(await answer, "ok")

    async def test_a_reader_stays_empty_until_everybody_saw_it(self) -> None:
        await self.start(empty_at_least=0.2)
        await self.pull(await self.insert("ec"))
        clock = asyncio.get_running_loop().time
        emptied = clock()

        await self.insert("ec")

        # What the test itself takes from the removal to its own clock is not much.
        self.assertGreater(clock() - emptied, 0.1)

    async def test_an_occupied_reader_and_a_card_in_use_are_refused(self) -> None:
        await self.insert("ec")

        self.assertEqual(await self.tell("insert slow"), "error reader 1 already holds the card ec")
        self.assertEqual(await self.tell("insert ec"), "error reader 1 already holds the card ec")
        self.assertEqual(await self.tell("insert ec 2"), "error the card ec is in reader 1 already")

    async def test_a_reader_is_empty_when_vpcd_hangs_up(self) -> None:
        card = await self.insert("ec")

        card.close()

        await self.until("1=- 2=-")
        await self.insert("ec")

    async def test_an_insertion_that_waits_is_ended_by_a_removal(self) -> None:
        waiting = asyncio.create_task(self.tell("insert ec"))
        card = await self.vpcds[0].connection()

        await self.pull(card)

        self.assertEqual(await waiting, "error ec left reader 1 before vpcd took it")


class TwoCards(ReadersTestCase):
    async def test_a_slow_card_holds_up_nobody(self) -> None:
        slow = await self.insert("slow", 1)
        quick = await self.insert("ec", 2)

        slow.send(bench.SELECT)
        answer = asyncio.create_task(slow.answer())
        await self.verify(quick)

        self.assertFalse(answer.done())
        self.assertEqual(await self.tell("status"), "ok 1=slow 2=ec")
        pulled = asyncio.create_task(self.tell("remove"))
        with self.assertRaises(asyncio.IncompleteReadError):
            await answer
        slow.close()
        self.assertEqual(await pulled, "ok")
        self.assertEqual(await self.tell("status"), "ok 1=- 2=ec")


class Breaking(ReadersTestCase):
    async def test_a_breaking_card_dies_in_each_signature(self) -> None:
        for _ in range(2):
            card = await self.insert("breaking")
            await self.verify(card)

            card.send(SIGN)

            with self.assertRaises(asyncio.IncompleteReadError):
                await card.answer()
            card.close()
            await self.until("1=- 2=-")

    async def test_break_next_is_for_one_insertion(self) -> None:
        card = await self.insert("ec", 2)
        self.assertEqual(await self.tell("break-next 2"), "ok")
        await self.verify(card)

        card.send(SIGN)
        await card.gone()
        await self.until("1=- 2=-")
        card = await self.insert("ec", 2)
        await self.verify(card)

        self.assertEqual((await card.ask(SIGN))[-2:], b"\x90\0")

    async def test_an_empty_reader_cannot_break(self) -> None:
        self.assertEqual(await self.tell("break-next"), "error reader 1 is empty")
