"""The data objects of a PIV card, by the names that GET DATA asks for."""

from collections.abc import Mapping
from uuid import UUID

import tlv

AID = bytes.fromhex("a000000308000010000100")

# The answer to SELECT: the application's version, and who hands its names out.
APPLICATION = tlv.encode(
    0x61,
    tlv.encode(0x4F, AID[5:]) + tlv.encode(0x79, tlv.encode(0x4F, AID[:5])),
)

_DISCOVERY = b"\x7e"
_CARD_HOLDER_IDENTIFIER = bytes.fromhex("5fc102")

# Where the certificate of each key lies.
CERTIFICATES = {
    0x9A: bytes.fromhex("5fc105"),
    0x9C: bytes.fromhex("5fc10a"),
    0x9D: bytes.fromhex("5fc10b"),
    0x9E: bytes.fromhex("5fc101"),
}

# The agency number of cards that no agency gave out: readers then take the GUID as serial number.
_NO_AGENCY = bytes.fromhex("d4e739da739ced39ce739d836858210842108421c84210c3eb")
_NO_CHECKSUM = tlv.encode(0xFE, b"")


def make(guid: UUID, certificates: Mapping[int, bytes]) -> dict[bytes, bytes]:
    """All objects of a card. Certificates are DER, by key."""
    objects = {
        _DISCOVERY: _discovery(),
        _CARD_HOLDER_IDENTIFIER: tlv.encode(0x53, _card_holder_identifier(guid)),
    }
    for key, certificate in certificates.items():
        not_compressed = tlv.encode(0x71, b"\0")
        content = tlv.encode(0x70, certificate) + not_compressed + _NO_CHECKSUM
        objects[CERTIFICATES[key]] = tlv.encode(0x53, content)
    return objects


def _discovery() -> bytes:
    only_the_application_pin = b"\x40\0"
    return tlv.encode(0x7E, tlv.encode(0x4F, AID) + tlv.encode(0x5F2F, only_the_application_pin))


def _card_holder_identifier(guid: UUID) -> bytes:
    expires = tlv.encode(0x35, b"99991231")
    unsigned = tlv.encode(0x3E, b"")
    identity = tlv.encode(0x30, _NO_AGENCY) + tlv.encode(0x34, guid.bytes)
    return identity + expires + unsigned + _NO_CHECKSUM
