"""What a PIV card's chip computes with a private key."""

from cryptography.hazmat.primitives import hashes
from cryptography.hazmat.primitives.asymmetric import ec, rsa, utils

from apdu import CommandRefused, Status

PrivateKey = rsa.RSAPrivateKey | ec.EllipticCurvePrivateKey

RSA_2048 = 0x07
P_256 = 0x11

CHALLENGE = 0x81
OTHER_PARTY = 0x85  # a public point, for a key agreement

P_256_BYTES = 32


def algorithm(key: PrivateKey) -> int:
    """The number that commands name the key's kind by."""
    return RSA_2048 if isinstance(key, rsa.RSAPrivateKey) else P_256


def compute(key: PrivateKey, request: dict[int, bytes]) -> bytes:
    """Signature, decrypted block or shared secret. The padding is the reader's business."""
    if isinstance(key, rsa.RSAPrivateKey):
        return _rsa(key, request.get(CHALLENGE, b""))
    if OTHER_PARTY in request:
        return _agree(key, request[OTHER_PARTY])
    return _sign(key, request.get(CHALLENGE, b""))


def _rsa(key: rsa.RSAPrivateKey, block: bytes) -> bytes:
    # The library pads whatever it signs, so the bare operation is spelled out here: the two half
    # powers and their recombination.
    numbers = key.private_numbers()
    value = int.from_bytes(block, "big")
    if len(block) != key.key_size // 8 or value >= numbers.public_numbers.n:
        raise CommandRefused(Status.WRONG_DATA)
    in_p = pow(value, numbers.dmp1, numbers.p)
    in_q = pow(value, numbers.dmq1, numbers.q)
    result = in_q + numbers.q * (numbers.iqmp * (in_p - in_q) % numbers.p)
    return result.to_bytes(len(block), "big")


def _sign(key: ec.EllipticCurvePrivateKey, digest: bytes) -> bytes:
    if not 0 < len(digest) <= P_256_BYTES:
        raise CommandRefused(Status.WRONG_DATA)
    # The digest is a number: zeros in front do not change it, and fit it to a hash that the
    # library knows by its length.
    return key.sign(digest.rjust(P_256_BYTES, b"\0"), ec.ECDSA(utils.Prehashed(hashes.SHA256())))


def _agree(key: ec.EllipticCurvePrivateKey, point: bytes) -> bytes:
    try:
        other = ec.EllipticCurvePublicKey.from_encoded_point(key.curve, point)
    except ValueError as not_on_curve:
        raise CommandRefused(Status.WRONG_DATA) from not_on_curve
    return key.exchange(ec.ECDH(), other)
