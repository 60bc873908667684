"""Signing, decrypting and agreeing on a secret, checked with the public keys."""

from bench import OTHER_PIN, PIN, certificate, frame, sign_frame, sign_request
from card_test_case import CardTestCase
from cryptography.hazmat.primitives import hashes, serialization
from cryptography.hazmat.primitives.asymmetric import ec, padding, rsa, utils

RSA, P_256 = 0x07, 0x11
OTHER_PARTY = 0x85
DIGEST = bytes(range(32))
# What PKCS #1 puts around a SHA-256 digest before the bare operation, for a key of 2048 bits.
_SHA_256 = bytes.fromhex("3031300d060960864801650304020105000420")
PADDED = b"\0\1" + b"\xff" * 202 + b"\0" + _SHA_256 + DIGEST


class Keys(CardTestCase):
    def rsa_key(self, slot: int) -> rsa.RSAPublicKey:
        key = certificate("rsa", slot).public_key()
        assert isinstance(key, rsa.RSAPublicKey)
        return key

    def ec_key(self, slot: int) -> ec.EllipticCurvePublicKey:
        key = certificate("ec", slot).public_key()
        assert isinstance(key, ec.EllipticCurvePublicKey)
        return key

    def check_rsa(self, signature: bytes) -> None:
        hashed = utils.Prehashed(hashes.SHA256())
        self.rsa_key(0x9A).verify(signature, DIGEST, padding.PKCS1v15(), hashed)

    def check_ec(self, slot: int, signature: bytes) -> None:
        self.ec_key(slot).verify(signature, DIGEST, ec.ECDSA(utils.Prehashed(hashes.SHA256())))

    def test_rsa_signs(self) -> None:
        self.check_rsa(self.verified("rsa").compute(RSA, 0x9A, PADDED))

    def test_rsa_signs_a_command_that_comes_in_parts(self) -> None:
        card = self.verified("rsa")
        request = sign_request(PADDED)

        first = card.send(frame(0x87, 0x079A, request[:200], cla=0x10))
        answer, status = card.send(frame(0x87, 0x079A, request[200:]))

        self.assertEqual((first, status), ((b"", 0x9000), 0x9000))
        self.check_rsa(answer[-256:])

    def test_parts_of_another_command_are_forgotten(self) -> None:
        card = self.verified("rsa")
        request = sign_request(PADDED)

        card.send(frame(0x87, 0x079A, request[:200], cla=0x10))

        self.assertEqual(card.verify(PIN), 0x9000)

        self.assertEqual(card.status(frame(0x87, 0x079A, request[200:])), 0x6A80)

    def test_a_command_without_end_is_refused(self) -> None:
        card = self.verified("rsa")
        part = frame(0x87, 0x079A, bytes(255), cla=0x10)

        self.assertIn(0x6700, [card.status(part) for _ in range(20)])

    def test_rsa_decrypts(self) -> None:
        secret = b"the key of a keyring"
        encrypted = self.rsa_key(0x9D).encrypt(secret, padding.PKCS1v15())

        block = self.verified("rsa").compute(RSA, 0x9D, encrypted)

        self.assertEqual(block[:2], b"\0\2")
        self.assertEqual(block[2:].split(b"\0", 1)[1], secret)

    def test_rsa_refuses_what_is_no_block(self) -> None:
        card = self.verified("rsa")

        for wrong in (b"", PADDED[1:], PADDED + b"\0", b"\xff" * 256):
            with self.subTest(length=len(wrong)):
                self.assertEqual(card.status(sign_frame(RSA, 0x9A, wrong)), 0x6A80)

    def test_ec_signs(self) -> None:
        self.check_ec(0x9A, self.verified("ec").compute(P_256, 0x9A, DIGEST))

    def test_ec_signs_a_shorter_digest(self) -> None:
        signature = self.verified("ec").compute(P_256, 0x9A, DIGEST[:20])

        hashed = utils.Prehashed(hashes.SHA1())
        self.ec_key(0x9A).verify(signature, DIGEST[:20], ec.ECDSA(hashed))

    def test_ec_refuses_what_is_no_digest(self) -> None:
        card = self.verified("ec")

        for wrong in (b"", bytes(33)):
            with self.subTest(length=len(wrong)):
                self.assertEqual(card.status(sign_frame(P_256, 0x9A, wrong)), 0x6A80)

    def test_both_sides_agree_on_one_secret(self) -> None:
        mine = ec.generate_private_key(ec.SECP256R1())
        point = mine.public_key().public_bytes(
            serialization.Encoding.X962, serialization.PublicFormat.UncompressedPoint
        )

        secret = self.verified("ec").compute(P_256, 0x9D, point, OTHER_PARTY)

        self.assertEqual(secret, mine.exchange(ec.ECDH(), self.ec_key(0x9D)))

    def test_a_point_off_the_curve_is_refused(self) -> None:
        off = sign_frame(P_256, 0x9D, b"\4" + bytes(range(64)), OTHER_PARTY)

        self.assertEqual(self.verified("ec").status(off), 0x6A80)

    def test_keys_want_the_pin(self) -> None:
        card = self.selected("ec")

        for slot in (0x9A, 0x9C, 0x9D):
            with self.subTest(slot=f"{slot:x}"):
                self.assertEqual(card.status(sign_frame(P_256, slot, DIGEST)), 0x6982)

    def test_the_key_for_doors_wants_no_pin(self) -> None:
        self.check_ec(0x9E, self.selected("ec").compute(P_256, 0x9E, DIGEST))

    def test_the_key_for_documents_wants_the_pin_each_time(self) -> None:
        card = self.verified("ec")

        self.check_ec(0x9C, card.compute(P_256, 0x9C, DIGEST))
        self.assertEqual(card.status(sign_frame(P_256, 0x9C, DIGEST)), 0x6982)
        self.check_ec(0x9A, card.compute(P_256, 0x9A, DIGEST))
        card.verify(PIN)
        self.check_ec(0x9C, card.compute(P_256, 0x9C, DIGEST))

    def test_a_wrong_pin_takes_the_keys_away(self) -> None:
        card = self.verified("ec")

        card.verify(OTHER_PIN)

        self.assertEqual(card.status(sign_frame(P_256, 0x9A, DIGEST)), 0x6982)

    def test_power_loss_takes_the_keys_away(self) -> None:
        loaded = self.load("ec")
        card = self.talk_verified(loaded)

        loaded.chip.reset()
        card.send(bytes.fromhex("00a4040009a00000030800001000"))

        self.assertEqual(card.status(sign_frame(P_256, 0x9A, DIGEST)), 0x6982)

    def test_a_key_that_is_not_there_and_an_algorithm_that_does_not_fit(self) -> None:
        card = self.verified("rsa")

        self.assertEqual(card.status(sign_frame(RSA, 0x9C, PADDED)), 0x6A88)
        self.assertEqual(card.status(sign_frame(P_256, 0x9A, DIGEST)), 0x6A86)
