"""What the virtual readers can be told: one command on a line, answered by one line.

The answer begins with "ok", or with "error" and says why. READER is 1 where none is given.
"""

import asyncio
import os
from collections.abc import Awaitable, Callable
from pathlib import Path

from card_state import MAXIMUM_TRIES
from readers import Readers, Refusal

SOCKET = Path("/run/virtual-readers.sock")

_LONGEST_LINE = 1000  # bytes


class Control:
    """Commands run as they come, also when one on another connection still waits for vpcd."""

    def __init__(self, readers: Readers) -> None:
        self._readers = readers
        self._commands: dict[str, tuple[Callable[..., Awaitable[str]], str]] = {
            "insert": (self._insert, "CARD [READER]"),
            "remove": (self._remove, "[READER]"),
            "break-next": (self._break_next, "[READER]"),
            "status": (self._status, ""),
            "tries": (self._tries, "CARD"),
            "set-tries": (self._set_tries, "CARD N"),
        }

    async def listen(self, path: Path) -> asyncio.AbstractServer:
        """Answers on a socket that only this process's user may open."""
        mask = os.umask(0o177)
        try:
            return await asyncio.start_unix_server(self._talk, path, limit=_LONGEST_LINE)
        finally:
            os.umask(mask)

    async def answer(self, line: str) -> str:
        try:
            return f"ok {await self._run(line.split())}".rstrip()
        except Refusal as refusal:
            return f"error {refusal}"

    async def _talk(self, incoming: asyncio.StreamReader, outgoing: asyncio.StreamWriter) -> None:
        try:
            while line := await incoming.readline():
                answer = await self.answer(line.decode(errors="backslashreplace"))
                outgoing.write(answer.encode() + b"\n")
                await outgoing.drain()
        except ValueError:
            outgoing.write(b"error usage: this line is too long\n")
        except ConnectionError:
            pass
        finally:
            outgoing.close()

    async def _run(self, words: list[str]) -> str:
        name, *arguments = words or [""]
        if name not in self._commands:
            raise Refusal(f"usage: {name!r} is none of {', '.join(self._commands)}")
        command, parameters = self._commands[name]
        most = len(parameters.split())
        if not most - parameters.count("[") <= len(arguments) <= most:
            raise Refusal(f"usage: {name} {parameters}".rstrip())
        return await command(*arguments)

    async def _insert(self, card: str, reader: str = "1") -> str:
        await self._readers.insert(self._readers.card(card), self._readers.reader(reader))
        return ""

    async def _remove(self, reader: str = "1") -> str:
        await self._readers.reader(reader).remove()
        return ""

    async def _break_next(self, reader: str = "1") -> str:
        self._readers.reader(reader).break_next()
        return ""

    async def _status(self) -> str:
        """For example "1=rsa 2=-": no card is named "-"."""
        readers = self._readers.readers
        return " ".join(f"{r.number}={r.card.name if r.card else '-'}" for r in readers)

    async def _tries(self, card: str) -> str:
        state = self._readers.card(card).state
        return f"pin={state.pin.tries} puk={state.puk.tries}"

    async def _set_tries(self, card: str, tries: str) -> str:
        state = self._readers.card(card).state
        if tries not in map(str, range(MAXIMUM_TRIES + 1)):
            raise Refusal(f"a PIN cannot have {tries!r} tries left, only 0 to {MAXIMUM_TRIES}")
        state.pin.tries = int(tries)
        state.save()
        return ""
