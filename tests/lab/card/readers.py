"""The two virtual readers, and what is in them."""

import asyncio
import sys
from collections.abc import Sequence
from dataclasses import dataclass
from pathlib import Path

import card_folder
from card_folder import VirtualCard
from vpcd import CardDied, Insertion

PORTS = (35963, 35964)  # where vpcd listens, reader 1 first

_RETRY_SECONDS = 0.05


class Refusal(Exception):
    """Why something that was asked for cannot be; a text for people."""


@dataclass(frozen=True)
class Times:
    """In seconds."""

    # How long vpcd may take to listen, for it may have just begun; to take a card; to let it go.
    patience: float = 5.0
    # pcscd looks into a reader every 0.4 s. Had a card come back sooner after it failed a command,
    # it would never have been gone for pcscd, and nobody would hear of the removal.
    empty_at_least: float = 0.6


class Reader:
    """Its card is served by a task of its own, so that no card waits for another."""

    def __init__(self, number: int, port: int, times: Times) -> None:
        self.number = number
        self.card: VirtualCard | None = None
        self._port = port
        self._times = times
        self._insertion: Insertion | None = None
        self._service: asyncio.Task[None] | None = None
        self._emptied = float("-inf")  # on the loop's clock

    async def insert(self, card: VirtualCard) -> None:
        """Returns when vpcd has the card."""
        if self.card:
            raise Refusal(f"reader {self.number} already holds the card {self.card.name}")
        self.card = card
        accepted = asyncio.get_running_loop().create_future()
        self._service = asyncio.create_task(self._serve(card, accepted))
        await accepted

    async def remove(self) -> None:
        """Returns when vpcd knows that the card is gone."""
        if not self._service:
            raise Refusal(f"reader {self.number} is empty")
        self._service.cancel()
        await asyncio.wait([self._service])

    def break_next(self) -> None:
        if not self._insertion:
            raise Refusal(f"reader {self.number} is empty")
        self._insertion.breaks_at_signature = True

    async def _serve(self, card: VirtualCard, accepted: "asyncio.Future[None]") -> None:
        failure = Refusal(f"{card.name} left reader {self.number} before vpcd took it")
        try:
            await self._leave_empty_for_long_enough()
            card.chip.reset()
            self._insertion = Insertion(card, *await self._connect())
            await self._insertion.serve(accepted, self._times.patience)
            _log(f"pcscd lets go of {card.name} in reader {self.number}")
        except asyncio.CancelledError:
            _log(f"{card.name} is pulled from reader {self.number}")
        except CardDied:
            _log(f"{card.name} dies in reader {self.number}")
        except TimeoutError:
            failure = Refusal(f"vpcd does not take the card {card.name} on port {self._port}")
        except Refusal as refusal:
            failure = refusal
        finally:
            self.card = self._insertion = self._service = None
            self._emptied = asyncio.get_running_loop().time()
            if not accepted.done():
                accepted.set_exception(failure)

    async def _leave_empty_for_long_enough(self) -> None:
        since = asyncio.get_running_loop().time() - self._emptied
        await asyncio.sleep(max(0.0, self._times.empty_at_least - since))

    async def _connect(self) -> tuple[asyncio.StreamReader, asyncio.StreamWriter]:
        loop = asyncio.get_running_loop()
        give_up = loop.time() + self._times.patience
        while True:
            try:
                return await asyncio.open_connection("127.0.0.1", self._port)
            except OSError as error:
                if loop.time() > give_up:
                    text = f"no vpcd listens on port {self._port}, is pcscd running? ({error})"
                    raise Refusal(text) from error
            await asyncio.sleep(_RETRY_SECONDS)


class Readers:
    """All readers, and the folder of the cards that can be put into them."""

    def __init__(self, folder: Path, ports: Sequence[int] = PORTS, times: Times = Times()) -> None:
        self.readers = [Reader(number, port, times) for number, port in enumerate(ports, start=1)]
        self._folder = folder
        self._cards: dict[str, VirtualCard] = {}

    def reader(self, number: str) -> Reader:
        for reader in self.readers:
            if str(reader.number) == number:
                return reader
        numbers = " and ".join(str(reader.number) for reader in self.readers)
        raise Refusal(f"there is no reader {number!r}, only {numbers}")

    def card(self, name: str) -> VirtualCard:
        """The one object of this card, which knows its tries."""
        folder = self._folder / name
        if not card_folder.CARD_NAME.fullmatch(name) or not card_folder.is_card(folder):
            raise Refusal(f"there is no card {name!r} in {self._folder}")
        if name not in self._cards:
            try:
                self._cards[name] = card_folder.load(folder)
            except (OSError, ValueError, TypeError, KeyError) as error:
                raise Refusal(f"the card in {folder} is damaged: {error!r}") from error
        return self._cards[name]

    async def insert(self, card: VirtualCard, reader: Reader) -> None:
        for other in self.readers:
            if other is not reader and other.card is card:
                raise Refusal(f"the card {card.name} is in reader {other.number} already")
        await reader.insert(card)

    async def close(self) -> None:
        for reader in self.readers:
            if reader.card:
                await reader.remove()


def _log(text: str) -> None:
    print(text, file=sys.stderr, flush=True)
