"""Tests with both readers and their control socket, and a driver that is the test's own."""

import asyncio
import contextlib
import io
import tempfile
import unittest
from pathlib import Path

import bench
from control import Control
from fake_vpcd import CardInReader, FakeVpcd
from readers import Readers, Times


class ReadersTestCase(unittest.IsolatedAsyncioTestCase):
    async def asyncSetUp(self) -> None:
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.cards = Path(folder.name)
        for name in ("ec", "slow", "breaking"):
            bench.copy_card(name, self.cards)
        self.socket = Path(folder.name) / "control.sock"
        self.log = io.StringIO()
        self.enterContext(contextlib.redirect_stderr(self.log))
        self.vpcds = [self.enterContext(contextlib.closing(FakeVpcd())) for _ in range(2)]
        self.ports = [await vpcd.listen() for vpcd in self.vpcds]
        await self.start()

    async def start(self, patience: float = 30, empty_at_least: float = 0) -> None:
        """Begins to serve, in the place of a program that did so before."""
        readers = Readers(self.cards, self.ports, Times(patience, empty_at_least))
        server = await Control(readers).listen(self.socket)
        self.addAsyncCleanup(readers.close)
        self.addCleanup(server.close)

    async def tell(self, line: str) -> str:
        return (await self.tell_bytes(line.encode() + b"\n")).decode()

    async def tell_bytes(self, line: bytes) -> bytes:
        incoming, outgoing = await asyncio.open_unix_connection(self.socket)
        with contextlib.closing(outgoing):
            outgoing.write(line)
            return (await incoming.readline()).removesuffix(b"\n")

    async def insert(self, card: str, reader: int = 1) -> CardInReader:
        answer = asyncio.create_task(self.tell(f"insert {card} {reader}"))
        in_reader = await self.vpcds[reader - 1].card()
        self.assertEqual(await answer, "ok")
        self.addCleanup(in_reader.close)
        return in_reader

    async def pull(self, card: CardInReader, reader: int = 1) -> None:
        answer = asyncio.create_task(self.tell(f"remove {reader}"))
        await card.gone()
        self.assertEqual(await answer, "ok")

    async def verify(self, card: CardInReader, pin: bytes = bench.PIN) -> None:
        await card.ask(bench.SELECT)
        self.assertEqual(await card.ask(bench.frame(0x20, 0x80, pin)), b"\x90\0")

    async def until(self, status: str) -> None:
        while await self.tell("status") != f"ok {status}":
            pass
