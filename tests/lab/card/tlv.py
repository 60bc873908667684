"""Tag, length, value: the nested boxes in which a PIV card's data travels (BER, ISO 7816-4)."""


class MalformedTlv(ValueError):
    """The bytes are not a row of complete boxes."""


def encode(tag: int, value: bytes) -> bytes:
    length = len(value)
    if length < 0x80:
        header = bytes([length])
    elif length < 0x100:
        header = bytes([0x81, length])
    else:
        header = b"\x82" + length.to_bytes(2, "big")
    return tag.to_bytes((tag.bit_length() + 7) // 8, "big") + header + value


def decode(data: bytes) -> dict[int, bytes]:
    """The boxes in data, by tag. Tags are one byte long: commands to the card hold no others."""
    boxes = {}
    while data:
        tag = data[0]
        value, data = _take_value(data[1:])
        boxes[tag] = value
    return boxes


def _take_value(data: bytes) -> tuple[bytes, bytes]:
    if not data:
        raise MalformedTlv("a tag without a length")
    length, start = data[0], 1
    if length in (0x81, 0x82):
        start += length & 0x0F
        length = int.from_bytes(data[1:start], "big")
    elif length > 0x7F:
        raise MalformedTlv("an unknown form of length")
    if len(data) < start + length:
        raise MalformedTlv("a value that ends early")
    return data[start : start + length], data[start + length :]
