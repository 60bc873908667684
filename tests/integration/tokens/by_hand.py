#!/usr/bin/env python3
"""Opens and makes wrapped unlock keys with pkcs11-tool and openssl alone, as docs/unlock-key.md says.

  by_hand.py open FORM ACCOUNT HASH WRAP-HASH MODULE TOKEN ID    prints the password; the PIN is in $PIN
  by_hand.py make SCHEME PUBLIC-KEY ACCOUNT HASH WRAP-HASH       wraps what is on standard input

What neither of them does is counted here: the sums of GCM's tag, and OAEP's padding after a card's bare
RSA operation. The public key is a DER file, hashes are hexadecimal.
"""

import hashlib
import os
import subprocess
import sys
import tempfile

PASSWORD_BYTES = 1024
OAEP, PKCS1, ECDH = 1, 2, 3
OAEP_OPTIONS = "rsa_padding_mode:oaep rsa_oaep_md:sha256 rsa_mgf1_md:sha256".split()


def run(*command, given=b""):
    return subprocess.run(command, input=given, stdout=subprocess.PIPE, check=True).stdout


def cipher_key(secret, sealed):
    return run(
        *("openssl", "kdf", "-binary", "-keylen", "32", "-kdfopt", "digest:SHA256"),
        *("-kdfopt", "hexkey:" + secret.hex(), "-kdfopt", "hexsalt:" + sealed.hex()),
        *("-kdfopt", "info:vlm unlock key", "HKDF"),
    )


def aes(key, mode, given, *options):
    return run("openssl", "enc", "-aes-256-" + mode, "-K", key.hex(), *options, given=given)


def counted(key, nonce, text):
    """GCM's encryption, and decryption: a counter that begins with 2."""
    return aes(key, "ctr", text, "-iv", nonce.hex() + "00000002")


def product(x, y):
    """In the field of GHASH (SP 800-38D, 6.3)."""
    z = 0
    for bit in range(127, -1, -1):
        if x >> bit & 1:
            z ^= y
        y = y >> 1 ^ (0xE1 << 120 if y & 1 else 0)
    return z


def tag_of(key, nonce, associated, ciphertext):
    first = int.from_bytes(aes(key, "ecb", bytes(16), "-nopad"), "big")
    blocks = b"".join(data + bytes(-len(data) % 16) for data in (associated, ciphertext))
    blocks += (8 * len(associated)).to_bytes(8, "big") + (8 * len(ciphertext)).to_bytes(8, "big")
    total = 0
    for at in range(0, len(blocks), 16):
        total = product(total ^ int.from_bytes(blocks[at : at + 16], "big"), first)
    mask = aes(key, "ecb", nonce + (1).to_bytes(4, "big"), "-nopad")
    return (total ^ int.from_bytes(mask, "big")).to_bytes(16, "big")


def associated_data(front, account, paired, wrap):
    parts = (front, account.encode(), bytes.fromhex(paired), bytes.fromhex(wrap))
    return b"".join(len(part).to_bytes(4, "big") + part for part in parts)


def mask(seed, size):
    """MGF1 with SHA-256 (RFC 8017, B.2.1)."""
    count = range(-(-size // 32))
    return b"".join(hashlib.sha256(seed + i.to_bytes(4, "big")).digest() for i in count)[:size]


def mixed(one, other):
    return bytes(a ^ b for a, b in zip(one, other, strict=True))


def without_oaep_padding(block):
    """RFC 8017, 7.1.2, step 3."""
    seed, data = block[1:33], block[33:]
    seed = mixed(seed, mask(data, len(seed)))
    data = mixed(data, mask(seed, len(data)))
    content = data[32:].lstrip(b"\0")
    assert block[0] == 0 and data[:32] == hashlib.sha256(b"").digest() and content[0] == 1
    return content[1:]


class Card:
    def __init__(self, module, token, key):
        self._command = ("pkcs11-tool", "--module", module, "--token-label", token)
        self._command += ("--login", "--pin", "env:PIN", "--id", key)

    def _ask(self, *arguments, given=b""):
        with open("given", "wb") as file:
            file.write(given)
        files = ("--input-file", "given", "--output-file", "made")
        subprocess.run(self._command + arguments + files, stdout=subprocess.DEVNULL, check=True)
        with open("made", "rb") as file:
            return file.read()

    def decrypt(self, mechanism, sealed):
        return self._ask("--decrypt", "--mechanism", mechanism, given=sealed)

    def derive(self, public_key):
        return self._ask("--derive", "--mechanism", "ECDH1-DERIVE", given=public_key)

    def public_key(self):
        certificate = self._ask("--read-object", "--type", "cert")
        text = run("openssl", "x509", "-inform", "DER", "-noout", "-pubkey", given=certificate)
        return run("openssl", "pkey", "-pubin", "-outform", "DER", given=text)

    def open(self, scheme, sealed):
        if scheme == OAEP:
            return without_oaep_padding(self.decrypt("RSA-X-509", sealed))
        if scheme == PKCS1:
            return self.decrypt("RSA-PKCS", sealed)
        return self.derive(self.public_key()[: -len(sealed)] + sealed)


def open_form(form, account, paired, wrap, card):
    assert form[:5] == b"VLMK\x01"
    scheme, size = form[5], int.from_bytes(form[6:8], "big")
    front, ciphertext, tag = form[: 20 + size], form[20 + size : -16], form[-16:]
    sealed, nonce = front[8:-12], front[-12:]
    assert len(ciphertext) == 2 + PASSWORD_BYTES
    key = cipher_key(card.open(scheme, sealed), sealed)
    assert tag == tag_of(key, nonce, associated_data(front, account, paired, wrap), ciphertext)
    padded = counted(key, nonce, ciphertext)
    return padded[2:][: int.from_bytes(padded[:2], "big")]


def seal(scheme, public_key):
    """A secret, and what the card makes it of."""
    if scheme != ECDH:
        secret = run("openssl", "rand", "32")
        options = OAEP_OPTIONS if scheme == OAEP else ["rsa_padding_mode:pkcs1"]
        options = [word for option in options for word in ("-pkeyopt", option)]
        key = ("-pubin", "-keyform", "DER", "-inkey", public_key)
        return secret, run("openssl", "pkeyutl", "-encrypt", *key, *options, given=secret)
    parameters = ("-pubin", "-inform", "DER", "-in", public_key, "-noout", "-text")
    curve = next(
        line.split()[-1]
        for line in run("openssl", "pkey", *parameters).decode().splitlines()
        if "ASN1 OID" in line
    )
    run("openssl", "ecparam", "-name", curve, "-genkey", "-noout", "-out", "ephemeral")
    own = run("openssl", "pkey", "-in", "ephemeral", "-pubout", "-outform", "DER")
    run("openssl", "pkey", "-pubin", "-inform", "DER", "-in", public_key, "-out", "peer")
    secret = run("openssl", "pkeyutl", "-derive", "-inkey", "ephemeral", "-peerkey", "peer")
    return secret, own[-1 - 2 * len(secret) :]


def make_form(password, scheme, public_key, account, paired, wrap):
    secret, sealed = seal(scheme, public_key)
    key, nonce = cipher_key(secret, sealed), run("openssl", "rand", "12")
    front = b"VLMK\x01" + bytes([scheme]) + len(sealed).to_bytes(2, "big") + sealed + nonce
    padded = len(password).to_bytes(2, "big") + password.ljust(PASSWORD_BYTES, b"\0")
    ciphertext = counted(key, nonce, padded)
    associated = associated_data(front, account, paired, wrap)
    return front + ciphertext + tag_of(key, nonce, associated, ciphertext)


def main():
    what, first, *rest = sys.argv[1:]
    if what == "open":
        with open(first, "rb") as file:
            form = file.read()
    else:
        password, rest[0] = sys.stdin.buffer.read(), os.path.abspath(rest[0])
    with tempfile.TemporaryDirectory() as folder:
        os.chdir(folder)
        if what == "open":
            made = open_form(form, *rest[:3], Card(*rest[3:]))
        else:
            made = make_form(password, int(first), *rest)
        os.chdir("/")
    sys.stdout.buffer.write(made)


main()
