"""What scenarios do with the tool's listing."""

import re


def identities(lab) -> dict[str, str]:
    """The unpaired identities: name to public-key hash."""
    lines = re.findall(r"^([0-9A-F]{64})\t(.*)$", lab.root("vlmbind", "-i").output, re.MULTILINE)
    return {name: hash_ for hash_, name in lines}


def only_identity(lab, name: str) -> str:
    """Waits until the card's identity is listed; its public-key hash."""
    return lab.wait_until(f"{name} is listed", lambda: identities(lab).get(name))


def present(lab, card: str, name: str, reader: int = 1) -> str:
    """Inserts a card whose holder will give the right PIN; its identity's public-key hash."""
    lab.insert(card, reader)
    lab.answer("pinentry", "pin 123456")
    return only_identity(lab, name)


def pair(lab, account: str, hash_: str):
    return lab.root("vlmbind", "-p", "-v", "-u", account, "-h", hash_)


def unpair(lab, account: str, hash_: str):
    return lab.root("vlmbind", "-r", "-v", "-u", account, "-h", hash_)
