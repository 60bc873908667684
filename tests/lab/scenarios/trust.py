"""Whom the machine trusts where it asks for trusted certificates."""

from machine.checks import check
from machine.listing import pair, present

AUTHORITY = "/var/lib/vlm-lab/cards/ca.pem"
ANCHORS = "/etc/vlm/trust/anchors"


def a_card_of_a_trusted_issuer_is_used_for_logins(lab):
    _pair_alice(lab)
    lab.root("vlmctl", "set", "checkCertificateTrust", "on")
    check.assertEqual(_state(lab), "paired")

    _trust(lab)

    check.assertEqual(_state(lab), "used for login")


def an_anchor_that_others_may_write_does_not_count(lab):
    _pair_alice(lab)
    lab.root("vlmctl", "set", "checkCertificateTrust", "on")
    _trust(lab)
    lab.root("chmod", "666", f"{ANCHORS}/ca.pem")

    check.assertEqual(_state(lab), "paired")
    check.assertIn("ca.pem does not count", lab.journal("SUBSYSTEM=org.vlm.token"))


def a_broken_revocation_list_refuses_everybody(lab):
    _pair_alice(lab)
    lab.root("vlmctl", "set", "checkCertificateTrust", "on")
    _trust(lab)
    lab.root("mkdir", "-p", "/etc/vlm/trust/revoked")
    lab.root("tee", "/etc/vlm/trust/revoked/list.crl", typed="broken")

    check.assertEqual(_state(lab), "paired")


def the_machines_own_trust_counts(lab):
    _pair_alice(lab)
    lab.root("vlmctl", "set", "checkCertificateTrust", "on")
    check.assertEqual(_state(lab), "paired")
    lab.root("cp", AUTHORITY, "/usr/local/share/ca-certificates/lab.crt")
    if lab.root("which", "update-ca-certificates").status != 0:
        # What the package's program does in the end.
        lab.root("mkdir", "-p", "/etc/ssl/certs")
        lab.root("sh", "-c", f"cat {AUTHORITY} >>/etc/ssl/certs/ca-certificates.crt")
    else:
        lab.root("update-ca-certificates")

    # The daemon reads it anew after a while; a new one does at once.
    lab.root("systemctl", "restart", "vlmhintsd.service")

    check.assertEqual(_state(lab), "used for login")


def nobody_is_asked_whom_he_trusts_while_it_is_off(lab):
    _pair_alice(lab)

    check.assertEqual(_state(lab), "used for login")


def _pair_alice(lab) -> None:
    check.assertEqual(pair(lab, "alice", present(lab, "rsa", "Alice Archer")).status, 0)


def _trust(lab) -> None:
    lab.root("install", "-D", "-m", "644", AUTHORITY, f"{ANCHORS}/ca.pem")


def _state(lab) -> str:
    """Of the only paired identity."""
    listed = lab.root("vlmctl", "tokens").output
    (state,) = [each for each in ("used for login", "paired  ") if each in listed]
    return state.strip()
