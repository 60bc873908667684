"""What cards there are to be: the descriptions in cards.json, checked."""

import json
from dataclasses import dataclass
from pathlib import Path
from typing import Any

import piv_objects
from card_folder import CARD_NAME
from certificate_authority import Holder

KEY_KINDS = ("rsa-2048", "p-256")


class DescriptionError(Exception):
    """Says what is wrong in which card's description."""


@dataclass(frozen=True)
class KeyDescription:
    slot: int
    kind: str
    holder: Holder


@dataclass(frozen=True)
class CardDescription:
    name: str
    keys: list[KeyDescription]
    expired: bool
    delay_seconds: float
    breaks_at_signature: bool


def read(path: Path) -> list[CardDescription]:
    try:
        cards = json.loads(path.read_text())
    except (OSError, ValueError) as error:
        raise DescriptionError(f"cannot read {path}: {error}") from error
    if not isinstance(cards, dict) or not cards:
        raise DescriptionError(f"{path} describes no cards")
    return [_card(name, description) for name, description in cards.items()]


def _card(name: str, description: Any) -> CardDescription:
    if not CARD_NAME.fullmatch(name):
        raise DescriptionError(f"{name!r} is no name for a card: a-z, 0-9 and - make one")
    fields = _Fields(name, description)
    holder = _holder(fields)
    others = {
        slot: _holder(_Fields(f"{name}, {slot}", other))
        for slot, other in fields.take("other_holders", dict, {}).items()
    }
    keys = fields.take("keys", dict)
    if not keys:
        raise DescriptionError(f"{name}: there are no keys")
    if not others.keys() <= keys.keys():
        raise DescriptionError(f"{name}: there is a holder without a key")
    card = CardDescription(
        name=name,
        keys=[_key(name, slot, kind, others.get(slot, holder)) for slot, kind in keys.items()],
        expired=fields.take("expired", bool, False),
        delay_seconds=fields.take("delay_seconds", (int, float), 0),
        breaks_at_signature=fields.take("breaks_at_signature", bool, False),
    )
    if not 0 <= card.delay_seconds <= 60:
        raise DescriptionError(f"{name}: delay_seconds is not between 0 and 60")
    fields.require_all_taken()
    return card


def _holder(fields: "_Fields") -> Holder:
    return Holder(fields.take("holder", str), fields.take("email", str))


def _key(card: str, slot: str, kind: Any, holder: Holder) -> KeyDescription:
    if slot not in {f"{known:x}" for known in piv_objects.CERTIFICATES}:
        raise DescriptionError(f"{card}: a card has no key {slot!r}")
    if kind not in KEY_KINDS:
        raise DescriptionError(f"{card}: key {slot} is {kind!r}, not one of {', '.join(KEY_KINDS)}")
    return KeyDescription(int(slot, 16), kind, holder)


class _Fields:
    """The fields of one JSON object, each taken once."""

    def __init__(self, where: str, fields: Any) -> None:
        if not isinstance(fields, dict):
            raise DescriptionError(f"{where}: this is no JSON object")
        self._where = where
        self._fields = dict(fields)

    def take(self, name: str, kind: type | tuple[type, ...], default: Any = None) -> Any:
        value = self._fields.pop(name, default)
        if value is None:
            raise DescriptionError(f"{self._where}: {name} is missing")
        # In Python truth is a number too.
        if not isinstance(value, kind) or (isinstance(value, bool) and kind is not bool):
            raise DescriptionError(f"{self._where}: {name} cannot be {value!r}")
        return value

    def require_all_taken(self) -> None:
        if self._fields:
            unknown = ", ".join(sorted(self._fields))
            raise DescriptionError(f"{self._where}: nobody knows {unknown}")
