"""What a card remembers while it is out of the reader: PIN, PUK and their tries."""

import json
from dataclasses import asdict, dataclass
from pathlib import Path

MAXIMUM_TRIES = 3


@dataclass
class SecretNumber:
    value: str
    tries: int = MAXIMUM_TRIES

    def is_blocked(self) -> bool:
        return self.tries == 0

    def matches(self, padded: bytes) -> bool:
        return padded == self.value.encode().ljust(8, b"\xff")


class CardState:
    """A new card has the PIN and the PUK that every card of the lab begins with."""

    def __init__(self, path: Path) -> None:
        self._path = path
        self.pin = SecretNumber("123456")
        self.puk = SecretNumber("12345678")
        if path.exists():
            saved = json.loads(path.read_text())
            self.pin = SecretNumber(**saved["pin"])
            self.puk = SecretNumber(**saved["puk"])

    def save(self) -> None:
        """Called before the card answers: pulling it must not give a try back."""
        # Replaced whole, so that a program that ends here leaves the old file and not half a one.
        new = self._path.with_name(self._path.name + ".new")
        new.write_text(json.dumps({"pin": asdict(self.pin), "puk": asdict(self.puk)}))
        new.replace(self._path)
