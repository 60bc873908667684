"""Certificates of the cards, and what make_cards.py says to what it cannot make."""

import contextlib
import io
import json
import stat
import tempfile
import unittest
from datetime import datetime
from pathlib import Path
from typing import Any

import bench
import card_descriptions
import make_cards
from cryptography import x509
from cryptography.hazmat.primitives.asymmetric import ec
from cryptography.x509.oid import ExtendedKeyUsageOID, NameOID

_COMMON_USES = (
    "digital_signature",
    "content_commitment",
    "key_encipherment",
    "data_encipherment",
    "key_agreement",
    "key_cert_sign",
    "crl_sign",
)
LAB_CARDS = Path(make_cards.__file__).with_name("cards.json")


class Certificates(unittest.TestCase):
    def test_they_never_end(self) -> None:
        certificate = bench.certificate("rsa", 0x9A)

        self.assertEqual(certificate.not_valid_before, datetime(2020, 1, 1))
        self.assertEqual(certificate.not_valid_after, datetime(9999, 12, 31, 23, 59, 59))

    def test_the_expired_one_has_ended(self) -> None:
        certificate = bench.certificate("expired", 0x9A)

        self.assertLess(certificate.not_valid_before, certificate.not_valid_after)
        self.assertLess(certificate.not_valid_after, datetime.now())

    def test_they_are_signed_by_the_authority_beside_them(self) -> None:
        authority = x509.load_pem_x509_certificate((bench.made_once() / "ca.pem").read_bytes())
        certificate = bench.certificate("rsa", 0x9D)

        key = authority.public_key()
        assert isinstance(key, ec.EllipticCurvePublicKey)
        assert certificate.signature_hash_algorithm
        key.verify(
            certificate.signature,
            certificate.tbs_certificate_bytes,
            ec.ECDSA(certificate.signature_hash_algorithm),
        )
        self.assertEqual(certificate.issuer, authority.subject)

    def test_they_name_the_holder(self) -> None:
        certificate = bench.certificate("ec", 0x9A)

        names = certificate.subject.get_attributes_for_oid(NameOID.COMMON_NAME)
        others = certificate.extensions.get_extension_for_class(x509.SubjectAlternativeName).value
        self.assertEqual([name.value for name in names], ["Alice Archer"])
        self.assertEqual(others.get_values_for_type(x509.RFC822Name), ["alice@lab.example"])

    def test_each_key_has_its_use(self) -> None:
        for card, slot, uses in (
            ("rsa", 0x9A, {"digital_signature"}),
            ("rsa", 0x9D, {"key_encipherment"}),
            ("ec", 0x9A, {"digital_signature"}),
            ("ec", 0x9C, {"digital_signature", "content_commitment"}),
            ("ec", 0x9D, {"key_agreement"}),
        ):
            with self.subTest(card=card, slot=f"{slot:x}"):
                extensions = bench.certificate(card, slot).extensions
                usage = extensions.get_extension_for_class(x509.KeyUsage).value

                named = {use for use in _COMMON_USES if getattr(usage, use)}
                self.assertEqual(named, uses)

    def test_the_key_for_log_in_says_so(self) -> None:
        extensions = bench.certificate("rsa", 0x9A).extensions

        usage = extensions.get_extension_for_class(x509.ExtendedKeyUsage).value
        self.assertEqual(list(usage), [ExtendedKeyUsageOID.CLIENT_AUTH])

    def test_only_their_owner_reads_the_keys(self) -> None:
        for key in bench.made_once().glob("*/*.key.pem"):
            self.assertEqual(stat.S_IMODE(key.stat().st_mode), 0o600)


class WrongInput(unittest.TestCase):
    def setUp(self) -> None:
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.folder = Path(folder.name)

    def run_program(self, *arguments: str) -> tuple[int | str | None, str]:
        """Its exit status and what it says about it."""
        said = io.StringIO()
        with contextlib.redirect_stderr(said):
            try:
                return make_cards.main(list(arguments)), said.getvalue()
            except SystemExit as end:
                return end.code, said.getvalue()

    def refusal(self, descriptions: Any) -> str:
        file = self.folder / "descriptions.json"
        file.write_text(json.dumps(descriptions))
        status, said = self.run_program(str(self.folder / "cards"), str(file))
        self.assertEqual(status, 1)
        self.assertFalse((self.folder / "cards").exists())
        return said

    def test_usage(self) -> None:
        self.assertEqual(self.run_program()[0], 2)
        self.assertEqual(self.run_program("a", "b", "c")[0], 2)

    def test_a_folder_that_holds_something(self) -> None:
        (self.folder / "ca.pem").write_text("another authority")

        status, said = self.run_program(str(self.folder))

        self.assertEqual(status, 1)
        self.assertIn("is not empty", said)
        self.assertEqual((self.folder / "ca.pem").read_text(), "another authority")

    def test_a_folder_that_is_a_file(self) -> None:
        file = self.folder / "file"
        file.touch()

        self.assertEqual(self.run_program(str(file))[0], 1)

    def test_descriptions_that_are_not_there(self) -> None:
        status, said = self.run_program(str(self.folder / "cards"), str(self.folder / "none"))

        self.assertEqual(status, 1)
        self.assertIn("cannot read", said)

    def test_descriptions_that_are_wrong(self) -> None:
        good = {"holder": "A", "email": "a@lab.example", "keys": {"9a": "p-256"}}
        rows: list[tuple[Any, str]] = [
            ([], "describes no cards"),
            ({}, "describes no cards"),
            ({"../a": good}, "is no name for a card"),
            ({"a": 1}, "a: this is no JSON object"),
            ({"a": good | {"holder": 1}}, "a: holder cannot be 1"),
            ({"a": {"holder": "A", "keys": {"9a": "p-256"}}}, "a: email is missing"),
            ({"a": good | {"keys": {}}}, "a: there are no keys"),
            ({"a": good | {"keys": {"9b": "p-256"}}}, "a: a card has no key '9b'"),
            ({"a": good | {"keys": {"9a": "p-255"}}}, "a: key 9a is 'p-255'"),
            ({"a": good | {"keys": {"9a": ["p-256"]}}}, "a: key 9a is ['p-256']"),
            ({"a": good | {"other_holders": {"9c": {}}}}, "a, 9c: holder is missing"),
            (
                {"a": good | {"other_holders": {"9c": {"holder": "B", "email": "b@b"}}}},
                "a: there is a holder without a key",
            ),
            ({"a": good | {"delay_seconds": -1}}, "a: delay_seconds is not between"),
            ({"a": good | {"delay_seconds": True}}, "a: delay_seconds cannot be True"),
            ({"a": good | {"expired": "no"}}, "a: expired cannot be 'no'"),
            ({"a": good | {"expirred": True}}, "a: nobody knows expirred"),
        ]

        for descriptions, text in rows:
            with self.subTest(text):
                self.assertIn(text, self.refusal(descriptions))


class LabCards(unittest.TestCase):
    def test_the_cards_of_the_lab_are_described(self) -> None:
        names = {card.name for card in card_descriptions.read(LAB_CARDS)}

        self.assertEqual(
            names,
            {
                "rsa",
                "ec",
                "second",
                "no-wrap-key",
                "expired",
                "two-identities",
                "slow",
                "breaking",
                "long-names",
                "hostile",
            },
        )
