"""The authority that certifies the keys of the lab's cards."""

from dataclasses import dataclass
from datetime import datetime

from cryptography import x509
from cryptography.hazmat.primitives import hashes
from cryptography.hazmat.primitives.asymmetric import ec, rsa
from cryptography.x509.oid import ExtendedKeyUsageOID, NameOID

from private_keys import PrivateKey

PublicKey = rsa.RSAPublicKey | ec.EllipticCurvePublicKey

_BEGIN = datetime(2020, 1, 1)
_PAST_END = datetime(2021, 1, 1)
_NO_END = datetime(9999, 12, 31, 23, 59, 59)  # "never", as RFC 5280 writes it

_USAGES = (
    "digital_signature",
    "content_commitment",
    "key_encipherment",
    "data_encipherment",
    "key_agreement",
    "key_cert_sign",
    "crl_sign",
    "encipher_only",
    "decipher_only",
)


@dataclass(frozen=True)
class Holder:
    name: str
    email: str


class CertificateAuthority:
    """Its key lives as long as the object: no card can be certified later."""

    def __init__(self) -> None:
        self._key = ec.generate_private_key(ec.SECP256R1())
        self._name = _common_name("Card Lab Authority")
        public = self._key.public_key()
        self.certificate = (
            self._begin(self._name, public, _NO_END)
            .add_extension(x509.BasicConstraints(ca=True, path_length=0), critical=True)
            .add_extension(_usage("key_cert_sign", "crl_sign"), critical=True)
            .sign(self._key, hashes.SHA256())
        )

    def certify(
        self, slot: int, key: PrivateKey, holder: Holder, expired: bool = False
    ) -> x509.Certificate:
        """A certificate for the key in one of a card's slots, which says what the key is for."""
        public = key.public_key()
        end = _PAST_END if expired else _NO_END
        issuer_key = x509.AuthorityKeyIdentifier.from_issuer_public_key(self._key.public_key())
        email = x509.SubjectAlternativeName([x509.RFC822Name(holder.email)])
        builder = (
            self._begin(_common_name(holder.name), public, end)
            .add_extension(x509.BasicConstraints(ca=False, path_length=None), critical=True)
            .add_extension(_usage(*_usages_of(slot, key)), critical=True)
            .add_extension(issuer_key, critical=False)
            .add_extension(email, critical=False)
        )
        if slot == 0x9A:
            log_in = x509.ExtendedKeyUsage([ExtendedKeyUsageOID.CLIENT_AUTH])
            builder = builder.add_extension(log_in, critical=False)
        return builder.sign(self._key, hashes.SHA256())

    def _begin(
        self, subject: x509.Name, public: PublicKey, end: datetime
    ) -> x509.CertificateBuilder:
        return (
            x509.CertificateBuilder()
            .issuer_name(self._name)
            .subject_name(subject)
            .public_key(public)
            .serial_number(x509.random_serial_number())
            .not_valid_before(_BEGIN)
            .not_valid_after(end)
            .add_extension(x509.SubjectKeyIdentifier.from_public_key(public), critical=False)
        )


def _usages_of(slot: int, key: PrivateKey) -> list[str]:
    if slot == 0x9D:
        return ["key_encipherment" if isinstance(key, rsa.RSAPrivateKey) else "key_agreement"]
    if slot == 0x9C:
        return ["digital_signature", "content_commitment"]
    return ["digital_signature"]


def _usage(*allowed: str) -> x509.KeyUsage:
    return x509.KeyUsage(**{usage: usage in allowed for usage in _USAGES})


def _common_name(name: str) -> x509.Name:
    return x509.Name([x509.NameAttribute(NameOID.COMMON_NAME, name)])
