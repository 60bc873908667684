"""A card at rest: a folder with its keys, certificates, behaviour and memory."""

import json
import re
from dataclasses import dataclass
from pathlib import Path
from uuid import UUID

from cryptography import x509
from cryptography.hazmat.primitives import serialization
from cryptography.hazmat.primitives.asymmetric import ec, rsa

import piv_objects
from card_state import CardState
from piv_card import PivCard
from private_keys import PrivateKey

CARD_NAME = re.compile(r"[a-z0-9]+(-[a-z0-9]+)*")

_PEM = serialization.Encoding.PEM


@dataclass(frozen=True)
class Behaviour:
    delay_seconds: float = 0  # before each answer
    breaks_at_signature: bool = False  # dies in the middle of it, in each reader, each time


@dataclass(frozen=True)
class VirtualCard:
    name: str
    chip: PivCard
    state: CardState
    behaviour: Behaviour


def save(
    folder: Path,
    guid: UUID,
    identities: dict[int, tuple[PrivateKey, x509.Certificate]],
    behaviour: Behaviour,
) -> None:
    folder.mkdir()
    for slot, (key, certificate) in identities.items():
        _key_file(folder, slot).touch(mode=0o600)
        _key_file(folder, slot).write_bytes(_key_text(key))
        certificate_file(folder, slot).write_bytes(certificate.public_bytes(_PEM))
    description = {
        "guid": str(guid),
        "delay_seconds": behaviour.delay_seconds,
        "breaks_at_signature": behaviour.breaks_at_signature,
    }
    _description_file(folder).write_text(json.dumps(description, indent=4) + "\n")


def load(folder: Path) -> VirtualCard:
    description = json.loads(_description_file(folder).read_text())
    guid = UUID(description.pop("guid"))
    slots = [slot for slot in piv_objects.CERTIFICATES if _key_file(folder, slot).exists()]
    keys = {slot: _load_key(_key_file(folder, slot)) for slot in slots}
    certificates = {
        slot: x509.load_pem_x509_certificate(certificate_file(folder, slot).read_bytes())
        for slot in slots
    }
    der = {slot: c.public_bytes(serialization.Encoding.DER) for slot, c in certificates.items()}
    state = CardState(folder / "state.json")
    chip = PivCard(keys, piv_objects.make(guid, der), state)
    return VirtualCard(folder.name, chip, state, Behaviour(**description))


def is_card(folder: Path) -> bool:
    return _description_file(folder).is_file()


def certificate_file(folder: Path, slot: int) -> Path:
    return folder / f"{slot:x}.cert.pem"


def _key_file(folder: Path, slot: int) -> Path:
    return folder / f"{slot:x}.key.pem"


def _description_file(folder: Path) -> Path:
    return folder / "card.json"


def _key_text(key: PrivateKey) -> bytes:
    no_password = serialization.NoEncryption()
    return key.private_bytes(_PEM, serialization.PrivateFormat.PKCS8, no_password)


def _load_key(path: Path) -> PrivateKey:
    key = serialization.load_pem_private_key(path.read_bytes(), password=None)
    if isinstance(key, (rsa.RSAPrivateKey, ec.EllipticCurvePrivateKey)):
        return key
    raise ValueError(f"{path} holds a key of an unknown kind")
