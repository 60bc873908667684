"""A card's side of the connection to vpcd, the reader driver for cards that are programs.

Every message is its length in two bytes, then its content. A message of one byte is about the
card's power, and only the request for the ATR is answered; any other is a command to the card.
"""

import asyncio
import socket

import piv_card
from card_folder import VirtualCard

_POWER_OFF, _POWER_ON, _RESET, _SEND_ATR = b"\0", b"\1", b"\2", b"\4"


class CardDied(Exception):
    """The card leaves in the middle of a command."""


class Insertion:
    """One card in one reader, from the connection to vpcd until either side closes it."""

    def __init__(
        self, card: VirtualCard, incoming: asyncio.StreamReader, outgoing: asyncio.StreamWriter
    ) -> None:
        self.breaks_at_signature = card.behaviour.breaks_at_signature
        self._card = card
        self._incoming = incoming
        self._outgoing = outgoing
        self._socket: socket.socket = outgoing.get_extra_info("socket")

    async def serve(self, accepted: "asyncio.Future[None]", patience: float) -> None:
        """Ends when vpcd hangs up, with CardDied, cancelled, or with TimeoutError when vpcd has
        not taken the card after so many seconds of patience; accepted is set when it has. In the
        end vpcd knows that the card is gone, unless that takes it as long again."""
        try:
            # The connection alone stands before vpcd knows of it. Its first message tells.
            async with asyncio.timeout(patience):
                message = await self._receive()
            accepted.set_result(None)
            while True:
                await self._handle(message)
                message = await self._receive()
        except (asyncio.IncompleteReadError, ConnectionError):
            pass
        finally:
            await self._hang_up(patience)

    async def _hang_up(self, patience: float) -> None:
        # vpcd looks at its card now and then; when it hangs up as well, it has noticed.
        try:
            self._outgoing.write_eof()
            async with asyncio.timeout(patience):
                while await self._incoming.read(1000):
                    pass
        except (OSError, TimeoutError):
            pass
        finally:
            self._outgoing.close()

    async def _receive(self) -> bytes:
        length = int.from_bytes(await self._read(2), "big")
        return await self._read(length)

    async def _read(self, length: int) -> bytes:
        data = await self._incoming.readexactly(length)
        # vpcd writes the length and the content apart, and the kernel sends the second when the
        # first is acknowledged: 40 ms for each command, if that is left to the kernel's leisure.
        self._socket.setsockopt(socket.IPPROTO_TCP, socket.TCP_QUICKACK, 1)
        return data

    async def _handle(self, message: bytes) -> None:
        if message in (_POWER_OFF, _POWER_ON, _RESET):
            self._card.chip.reset()
        elif message == _SEND_ATR:
            await self._send(piv_card.ATR)
        else:
            await self._send(await self._answer(message))

    async def _answer(self, command: bytes) -> bytes:
        await asyncio.sleep(self._card.behaviour.delay_seconds)
        if self.breaks_at_signature and command[1:2] == bytes([piv_card.GENERAL_AUTHENTICATE]):
            raise CardDied
        return self._card.chip.answer(command)

    async def _send(self, content: bytes) -> None:
        self._outgoing.write(len(content).to_bytes(2, "big") + content)
        await self._outgoing.drain()
