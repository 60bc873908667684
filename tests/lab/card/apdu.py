"""Commands to a card, as they are framed: short and extended (ISO 7816-4)."""

from dataclasses import dataclass, replace
from enum import IntEnum

SHORT_MAXIMUM = 256
EXTENDED_MAXIMUM = 65536
CHAIN_MAXIMUM = 4096  # bytes of data; far above what any command of a PIV card takes
MORE_FOLLOWS = 0x10  # in CLA: this command's data goes on in the next one


class Status(IntEnum):
    OK = 0x9000
    MORE_DATA = 0x6100  # | bytes left
    WRONG_SECRET = 0x63C0  # | tries left
    WRONG_LENGTH = 0x6700
    NOT_VERIFIED = 0x6982
    BLOCKED = 0x6983
    NOT_NOW = 0x6985
    WRONG_DATA = 0x6A80
    NOT_FOUND = 0x6A82
    WRONG_PARAMETERS = 0x6A86
    NO_SUCH_REFERENCE = 0x6A88
    UNKNOWN_INSTRUCTION = 0x6D00
    UNKNOWN_CLASS = 0x6E00


class CommandRefused(Exception):
    def __init__(self, status: int) -> None:
        super().__init__(f"{status:04x}")
        self.status = status


@dataclass(frozen=True)
class Command:
    cla: int
    ins: int
    parameters: int  # P1 and P2
    data: bytes
    expected: int  # the most bytes that the reader takes in one answer


def parse(frame: bytes) -> Command:
    if len(frame) < 4:
        raise CommandRefused(Status.WRONG_LENGTH)
    data, expected = _parse_body(frame[4:])
    return Command(frame[0], frame[1], int.from_bytes(frame[2:4], "big"), data, expected)


def _parse_body(body: bytes) -> tuple[bytes, int]:
    if len(body) <= 1:
        return b"", _expected(body, SHORT_MAXIMUM)
    if body[0] != 0:
        return _split(body[1:], body[0], 1, SHORT_MAXIMUM)
    if len(body) < 3:
        raise CommandRefused(Status.WRONG_LENGTH)
    if len(body) == 3:
        return b"", _expected(body[1:], EXTENDED_MAXIMUM)
    return _split(body[3:], int.from_bytes(body[1:3], "big"), 2, EXTENDED_MAXIMUM)


def _split(rest: bytes, length: int, size_of_expected: int, maximum: int) -> tuple[bytes, int]:
    if length == 0 or len(rest) not in (length, length + size_of_expected):
        raise CommandRefused(Status.WRONG_LENGTH)
    return rest[:length], _expected(rest[length:], maximum)


def _expected(field: bytes, maximum: int) -> int:
    # Zero stands for the maximum. Without the field, the protocol T=0 dropped it: a short answer.
    if not field:
        return SHORT_MAXIMUM
    return int.from_bytes(field, "big") or maximum


class Chain:
    """Puts a command together again that came in parts."""

    def __init__(self) -> None:
        self._parts: Command | None = None

    def drop(self) -> None:
        self._parts = None

    def add(self, part: Command) -> Command | None:
        """The whole command with its last part, None before."""
        begun, self._parts = self._parts, None
        if begun and (begun.ins, begun.parameters) == (part.ins, part.parameters):
            part = replace(part, data=begun.data + part.data)
        if len(part.data) > CHAIN_MAXIMUM:
            raise CommandRefused(Status.WRONG_LENGTH)
        if part.cla & MORE_FOLLOWS:
            self._parts = part
            return None
        return part
