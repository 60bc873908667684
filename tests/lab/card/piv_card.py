"""A PIV card (NIST SP 800-73-4, the parts that log-in needs): a command goes in, an answer out."""

from collections.abc import Mapping

import apdu
import piv_objects
import private_keys
import tlv
from apdu import Command, CommandRefused, Status
from card_state import MAXIMUM_TRIES, CardState, SecretNumber
from private_keys import PrivateKey

# Without historical bytes OpenSC takes the card for another one, which has no elliptic curves.
_HISTORICAL = b"LabPIV"
_AFTER_TS = bytes([0x80 | len(_HISTORICAL), 0x80, 0x01]) + _HISTORICAL


def _checksum(data: bytes) -> int:
    result = 0
    for byte in data:
        result ^= byte
    return result


ATR = b"\x3b" + _AFTER_TS + bytes([_checksum(_AFTER_TS)])

GENERAL_AUTHENTICATE = 0x87
GET_RESPONSE = 0xC0

_PIN, _PUK = 0x80, 0x81
_SHORTEST_AID = 9  # bytes: a reader may leave the version out

# Keys by what the card wants to know before it uses them.
_WITHOUT_PIN = {0x9E}
_PIN_FOR_EACH_USE = {0x9C}


class PivCard:
    """Between reset() and the next reset it is in one reader, and powered."""

    def __init__(
        self, keys: Mapping[int, PrivateKey], objects: Mapping[bytes, bytes], state: CardState
    ) -> None:
        self._keys = keys
        self._objects = objects
        self._state = state
        self._instructions = {
            0x20: self._verify,
            0x24: self._change_reference_data,
            0x2C: self._reset_retry_counter,
            GENERAL_AUTHENTICATE: self._general_authenticate,
            0xCB: self._get_data,
        }
        self.reset()

    def reset(self) -> None:
        """Power, or its loss: the card forgets who has proved what."""
        self._selected = False
        self._verified = False
        self._verified_for_one_use = False
        self._chain = apdu.Chain()
        self._rest = b""

    def answer(self, frame: bytes) -> bytes:
        try:
            return self._execute(apdu.parse(frame))
        except CommandRefused as refused:
            return refused.status.to_bytes(2, "big")

    def _execute(self, part: Command) -> bytes:
        if part.cla & ~apdu.MORE_FOLLOWS:
            raise CommandRefused(Status.UNKNOWN_CLASS)
        if part.ins == GET_RESPONSE:
            if not self._rest:
                raise CommandRefused(Status.NOT_NOW)
            return self._fit(self._rest, part.expected)
        self._rest = b""
        command = self._chain.add(part)
        if command is None:
            return self._fit(b"", part.expected)
        return self._fit(self._run(command), command.expected)

    def _fit(self, data: bytes, expected: int) -> bytes:
        self._rest = data[expected:]
        return data[:expected] + _status_before(self._rest).to_bytes(2, "big")

    def _run(self, command: Command) -> bytes:
        if command.ins == 0xA4:
            return self._select(command)
        instruction = self._instructions.get(command.ins)
        if not self._selected or not instruction:
            raise CommandRefused(Status.UNKNOWN_INSTRUCTION)
        return instruction(command)

    def _select(self, command: Command) -> bytes:
        _require_parameters(command, 0x0400)
        name = command.data
        if len(name) < _SHORTEST_AID or not piv_objects.AID.startswith(name):
            raise CommandRefused(Status.NOT_FOUND)
        # Selecting it again takes nothing away that was proved.
        self._selected = True
        return piv_objects.APPLICATION

    def _get_data(self, command: Command) -> bytes:
        _require_parameters(command, 0x3FFF)
        name = _decode(command.data).get(0x5C, b"")
        if name not in self._objects:
            raise CommandRefused(Status.NOT_FOUND)
        return self._objects[name]

    def _verify(self, command: Command) -> bytes:
        if command.parameters == 0xFF00 | _PIN and not command.data:
            self._forget_pin()
            return b""
        _require_parameters(command, _PIN)
        if not command.data:
            if not self._verified:
                raise CommandRefused(_tries_left(self._state.pin))
            return b""
        self._check(self._state.pin, command.data)
        self._remember_pin()
        return b""

    def _change_reference_data(self, command: Command) -> bytes:
        _require_parameters(command, _PIN, _PUK)
        changes_pin = command.parameters == _PIN
        secret = self._state.pin if changes_pin else self._state.puk
        old, new = command.data[:8], _new_value(command.data[8:])
        self._check(secret, old)
        secret.value = new
        self._state.save()
        if changes_pin:
            self._remember_pin()
        return b""

    def _reset_retry_counter(self, command: Command) -> bytes:
        _require_parameters(command, _PIN)
        puk, new = command.data[:8], _new_value(command.data[8:])
        self._check(self._state.puk, puk)
        self._state.pin = SecretNumber(new)
        self._state.save()
        self._forget_pin()
        return b""

    def _check(self, secret: SecretNumber, padded: bytes) -> None:
        if len(padded) != 8:
            raise CommandRefused(Status.WRONG_DATA)
        if secret.is_blocked():
            raise CommandRefused(Status.BLOCKED)
        if not secret.matches(padded):
            secret.tries -= 1
            self._state.save()
            if secret is self._state.pin:
                self._forget_pin()
            raise CommandRefused(Status.WRONG_SECRET | secret.tries)
        secret.tries = MAXIMUM_TRIES
        self._state.save()

    def _remember_pin(self) -> None:
        self._verified = self._verified_for_one_use = True

    def _forget_pin(self) -> None:
        self._verified = self._verified_for_one_use = False

    def _general_authenticate(self, command: Command) -> bytes:
        algorithm, reference = command.parameters >> 8, command.parameters & 0xFF
        key = self._keys.get(reference)
        if key is None:
            raise CommandRefused(Status.NO_SUCH_REFERENCE)
        if algorithm != private_keys.algorithm(key):
            raise CommandRefused(Status.WRONG_PARAMETERS)
        self._require_pin(reference)
        request = _decode(_decode(command.data).get(0x7C, b""))
        return tlv.encode(0x7C, tlv.encode(0x82, private_keys.compute(key, request)))

    def _require_pin(self, reference: int) -> None:
        if reference in _WITHOUT_PIN:
            return
        allowed = self._verified
        if reference in _PIN_FOR_EACH_USE:
            allowed = self._verified_for_one_use
            self._verified_for_one_use = False
        if not allowed:
            raise CommandRefused(Status.NOT_VERIFIED)


def _status_before(rest: bytes) -> int:
    if not rest:
        return Status.OK
    return Status.MORE_DATA | (len(rest) if len(rest) < 256 else 0)


def _require_parameters(command: Command, *known: int) -> None:
    if command.parameters not in known:
        raise CommandRefused(Status.WRONG_PARAMETERS)


def _decode(data: bytes) -> dict[int, bytes]:
    try:
        return tlv.decode(data)
    except tlv.MalformedTlv as malformed:
        raise CommandRefused(Status.WRONG_DATA) from malformed


def _tries_left(secret: SecretNumber) -> int:
    return Status.BLOCKED if secret.is_blocked() else Status.WRONG_SECRET | secret.tries


def _new_value(padded: bytes) -> str:
    digits = padded.rstrip(b"\xff")
    if len(padded) != 8 or len(digits) < 6 or not digits.isdigit():
        raise CommandRefused(Status.WRONG_DATA)
    return digits.decode()
