#!/usr/bin/python3
"""Makes the lab's cards, each in a folder of its own, and the authority that certifies them.

A card's folder is named like the card; ca.pem, beside them, is the authority's certificate.
"""

import argparse
import sys
import uuid
from pathlib import Path

from cryptography.hazmat.primitives.asymmetric import ec, rsa
from cryptography.hazmat.primitives.serialization import Encoding

import card_descriptions
import card_folder
from card_descriptions import CardDescription, DescriptionError
from card_folder import Behaviour
from certificate_authority import CertificateAuthority
from private_keys import PrivateKey


def make_cards(folder: Path, descriptions: list[CardDescription]) -> None:
    folder.mkdir(parents=True, exist_ok=True)
    if any(folder.iterdir()):
        raise FileExistsError(f"{folder} is not empty; cards are made in a new folder")
    authority = CertificateAuthority()
    (folder / "ca.pem").write_bytes(authority.certificate.public_bytes(Encoding.PEM))
    for description in descriptions:
        _make_card(folder / description.name, description, authority)


def _make_card(folder: Path, card: CardDescription, authority: CertificateAuthority) -> None:
    # A card of the same name has the same serial number in every image.
    guid = uuid.uuid5(uuid.NAMESPACE_URL, f"card.lab.example/{card.name}")
    identities = {}
    for described in card.keys:
        key = _make_key(described.kind)
        certificate = authority.certify(described.slot, key, described.holder, card.expired)
        identities[described.slot] = (key, certificate)
    behaviour = Behaviour(card.delay_seconds, card.breaks_at_signature)
    card_folder.save(folder, guid, identities, behaviour)


def _make_key(kind: str) -> PrivateKey:
    if kind == "rsa-2048":
        return rsa.generate_private_key(public_exponent=65537, key_size=2048)
    return ec.generate_private_key(ec.SECP256R1())


def main(arguments: list[str]) -> int:
    parser = argparse.ArgumentParser(prog="make_cards.py", description="Makes the lab's cards.")
    parser.add_argument("folder", type=Path, help="a new or an empty one")
    parser.add_argument(
        "descriptions",
        type=Path,
        nargs="?",
        default=Path(__file__).with_name("cards.json"),
        help="what cards to make, instead of cards.json",
    )
    options = parser.parse_args(arguments)
    try:
        descriptions = card_descriptions.read(options.descriptions)
        make_cards(options.folder, descriptions)
    except (DescriptionError, OSError) as error:
        print(f"make_cards.py: {error}", file=sys.stderr)
        return 1
    return 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1:]))
