"""A folder of cards, made once for all tests, and the reader's side of a talk with a card."""

import atexit
import json
import shutil
import tempfile
from functools import cache
from pathlib import Path
from typing import Any

from cryptography import x509

import card_folder
import make_cards
import tlv
from card_folder import VirtualCard

PIN, WRONG_PIN, OTHER_PIN = b"123456\xff\xff", b"000000\xff\xff", b"654321\xff\xff"
PUK, WRONG_PUK, OTHER_PUK = b"12345678", b"00000000", b"87654321"

SELECT = bytes.fromhex("00a4040009a00000030800001000")

_DESCRIPTIONS: dict[str, dict[str, Any]] = {
    "rsa": {"keys": {"9a": "rsa-2048", "9d": "rsa-2048"}},
    "ec": {"keys": {"9a": "p-256", "9c": "p-256", "9d": "p-256", "9e": "p-256"}},
    "slow": {"keys": {"9a": "p-256"}, "delay_seconds": 60},
    "breaking": {"keys": {"9a": "p-256"}, "breaks_at_signature": True},
    "expired": {"keys": {"9a": "p-256"}, "expired": True},
}


@cache
def made_once() -> Path:
    """All cards, for tests that only look at them."""
    folder = Path(tempfile.mkdtemp(prefix="virtual-cards-"))
    atexit.register(shutil.rmtree, folder)
    holder = {"holder": "Alice Archer", "email": "alice@lab.example"}
    descriptions = folder / "descriptions.json"
    descriptions.write_text(json.dumps({n: holder | d for n, d in _DESCRIPTIONS.items()}))
    if make_cards.main([str(folder / "cards"), str(descriptions)]) != 0:
        raise RuntimeError("no cards to test with")
    return folder / "cards"


def copy_card(name: str, folder: Path) -> Path:
    """A new card for one test, which may wear it out."""
    if not (folder / name).exists():
        shutil.copytree(made_once() / name, folder / name)
    return folder / name


def certificate(card: str, slot: int) -> x509.Certificate:
    path = card_folder.certificate_file(made_once() / card, slot)
    return x509.load_pem_x509_certificate(path.read_bytes())


def frame(ins: int, parameters: int, data: bytes = b"", expected: int = 0, cla: int = 0) -> bytes:
    """A short command where the data fits into one, and an extended one where it does not."""
    head = bytes([cla, ins]) + parameters.to_bytes(2, "big")
    if len(data) > 255:
        return head + b"\0" + len(data).to_bytes(2, "big") + data + expected.to_bytes(2, "big")
    return head + (bytes([len(data)]) + data if data else b"") + bytes([expected])


def sign_frame(algorithm: int, slot: int, value: bytes, tag: int = 0x81) -> bytes:
    return frame(0x87, algorithm << 8 | slot, sign_request(value, tag))


def sign_request(value: bytes, tag: int = 0x81) -> bytes:
    return tlv.encode(0x7C, tlv.encode(0x82, b"") + tlv.encode(tag, value))


class Talk:
    """Sends commands to a card, as a reader does that wants all of an answer."""

    def __init__(self, card: VirtualCard) -> None:
        self._chip = card.chip

    def send(self, command: bytes) -> tuple[bytes, int]:
        """The whole answer and its last status word."""
        answer = self._chip.answer(command)
        data = answer[:-2]
        while answer[-2] == 0x61:
            answer = self._chip.answer(frame(0xC0, 0, expected=answer[-1]))
            data += answer[:-2]
        return data, int.from_bytes(answer[-2:], "big")

    def status(self, command: bytes) -> int:
        return self.send(command)[1]

    def verify(self, pin: bytes) -> int:
        return self.status(frame(0x20, 0x80, pin))

    def get_data(self, name: str) -> tuple[bytes, int]:
        return self.send(frame(0xCB, 0x3FFF, tlv.encode(0x5C, bytes.fromhex(name))))

    def compute(self, algorithm: int, slot: int, value: bytes, tag: int = 0x81) -> bytes:
        """The result of a use of a key that the card does not refuse."""
        data, status = self.send(sign_frame(algorithm, slot, value, tag))
        if status != 0x9000:
            raise AssertionError(f"the card refuses: {status:04x}")
        return tlv.decode(tlv.decode(data)[0x7C])[0x82]
