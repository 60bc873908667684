"""The reader driver's end of a connection, by hand: the test says when it does what."""

import asyncio

SEND_ATR = b"\4"


class FakeVpcd:
    def __init__(self) -> None:
        self._cards: asyncio.Queue[tuple[asyncio.StreamReader, asyncio.StreamWriter]]
        self._cards = asyncio.Queue()
        self._server: asyncio.AbstractServer | None = None

    async def listen(self, port: int = 0) -> int:
        """The port, which is a free one where none is wanted."""
        self._server = await asyncio.start_server(self._connected, "127.0.0.1", port)
        port = self._server.sockets[0].getsockname()[1]
        assert isinstance(port, int)
        return port

    async def _connected(
        self, incoming: asyncio.StreamReader, outgoing: asyncio.StreamWriter
    ) -> None:
        await self._cards.put((incoming, outgoing))

    async def card(self) -> "CardInReader":
        """The next card that comes, once it has told its ATR."""
        card = await self.connection()
        await card.ask(SEND_ATR)
        return card

    async def connection(self) -> "CardInReader":
        """The next card that comes, when it is there but not noticed yet."""
        return CardInReader(*await self._cards.get())

    def close(self) -> None:
        if self._server:
            self._server.close()
        while not self._cards.empty():
            self._cards.get_nowait()[1].close()


class CardInReader:
    def __init__(self, incoming: asyncio.StreamReader, outgoing: asyncio.StreamWriter) -> None:
        self._incoming = incoming
        self._outgoing = outgoing

    async def ask(self, message: bytes) -> bytes:
        self.send(message)
        return await self.answer()

    def send(self, message: bytes) -> None:
        self._outgoing.write(len(message).to_bytes(2, "big") + message)

    async def answer(self) -> bytes:
        length = int.from_bytes(await self._incoming.readexactly(2), "big")
        return await self._incoming.readexactly(length)

    async def end(self) -> None:
        """Returns when the card has hung up."""
        while await self._incoming.read(1000):
            pass

    async def gone(self) -> None:
        """Hangs up as vpcd does: after the card."""
        await self.end()
        self.close()

    def close(self) -> None:
        self._outgoing.close()
