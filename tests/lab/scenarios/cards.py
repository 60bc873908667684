"""Cards that come, go, break and keep one waiting, and pcscd that does not stay."""

import subprocess
import time

from machine.checks import check
from machine.listing import identities, only_identity, pair, present


def two_cards_in_two_readers_are_both_listed(lab):
    lab.insert("rsa", 1)
    lab.insert("second", 2)
    lab.wait_until("both are listed", lambda: len(identities(lab)) == 2)

    check.assertRegex(
        lab.root("vlmbind", "-i").output,
        "^SmartCard: Alice Archer\n"
        "Unpaired identities:\n[0-9A-F]{64}\tAlice Archer\n"
        "\n"
        "SmartCard: Carol Cooper\n"
        "Unpaired identities:\n[0-9A-F]{64}\tCarol Cooper\n$",
    )

    lab.remove(1)
    lab.wait_until("one is gone", lambda: set(identities(lab)) == {"Carol Cooper"})


def the_right_one_of_two_cards_is_asked_for_its_pin(lab):
    lab.insert("rsa", 1)
    hash_ = present(lab, "second", "Carol Cooper", 2)

    check.assertEqual(pair(lab, "carol", hash_).status, 0)

    (question,) = lab.asked("pinentry")
    check.assertIn("Carol Cooper", question["desc"])


def a_card_that_is_replaced_by_another_is_not_remembered(lab):
    lab.insert("rsa")
    only_identity(lab, "Alice Archer")

    lab.remove()
    lab.insert("second")

    only_identity(lab, "Carol Cooper")
    check.assertEqual(set(identities(lab)), {"Carol Cooper"})


def a_card_that_comes_back_is_the_same(lab):
    lab.insert("rsa")
    before = only_identity(lab, "Alice Archer")
    lab.remove()
    lab.wait_until("it is gone", lambda: not identities(lab))

    lab.insert("rsa")

    check.assertEqual(only_identity(lab, "Alice Archer"), before)


def a_card_pulled_while_its_pin_is_asked_for_pairs_nobody(lab):
    lab.insert("rsa")
    hash_ = only_identity(lab, "Alice Archer")
    lab.answer("pinentry", "wait")
    pairing = _start_pairing(lab, "alice", hash_)
    lab.wait_until("the PIN is asked for", lambda: lab.asked("pinentry"))

    lab.remove()
    lab.answer("pinentry", "pin 123456")

    _refused_without_a_trace(lab, pairing, hash_)


def a_card_that_breaks_in_the_middle_of_its_signature_pairs_nobody(lab):
    hash_ = present(lab, "breaking", "Henry Hunter")

    _refused_without_a_trace(lab, _start_pairing(lab, "alice", hash_), hash_)

    # The reader is none the worse for it.
    lab.insert("rsa", 2)
    check.assertEqual(pair(lab, "alice", only_identity(lab, "Alice Archer")).status, 0)


def a_slow_card_keeps_nobody_else_waiting(lab):
    hash_ = present(lab, "rsa", "Alice Archer", 1)
    check.assertEqual(pair(lab, "alice", hash_).status, 0)

    # From here on the module is busy with a card that takes seconds to read.
    lab.insert("slow", 2)
    began = time.monotonic()
    pairings = lab.root("vlmctl", "pairings")
    bound = lab.root("vlmbind", "-r", "-u", "alice", "-h", hash_)

    check.assertIn(hash_, pairings.output)
    check.assertEqual(bound.status, 0, bound)
    check.assertLess(time.monotonic() - began, 4)
    lab.wait_until("the slow card is listed", lambda: "Grace Gardener" in identities(lab), 60)


def pcscd_may_be_stopped_and_started(lab):
    lab.insert("rsa")
    only_identity(lab, "Alice Archer")

    lab.root("systemctl", "stop", "pcscd.socket", "pcscd.service", "virtual-readers")
    lab.wait_until("no card is listed", lambda: not identities(lab))
    lab.root("systemctl", "start", "pcscd.socket", "virtual-readers")
    lab.insert("rsa")

    only_identity(lab, "Alice Archer")


def pcscd_may_be_killed(lab):
    lab.insert("rsa")
    only_identity(lab, "Alice Archer")

    killed = _pcscd(lab)
    lab.root("systemctl", "kill", "--signal=KILL", "pcscd.service")
    # Whoever listens to cards starts it again.
    lab.wait_until("pcscd is another", lambda: _pcscd(lab) not in (killed, "0\n"))
    check.assertEqual(lab.root("vlmbind", "-i").status, 0)
    lab.root("systemctl", "restart", "virtual-readers")
    lab.insert("rsa")

    hash_ = only_identity(lab, "Alice Archer")
    lab.answer("pinentry", "pin 123456")
    check.assertEqual(pair(lab, "alice", hash_).status, 0)


def other_programs_see_the_same_identities(lab):
    lab.insert("rsa")
    hash_ = only_identity(lab, "Alice Archer")

    # By the standard tools: the certificate, its public key, the hash of that.
    certificate = "pkcs11-tool --module opensc-pkcs11.so --read-object --type cert --id 01"
    key = "openssl x509 -inform DER -noout -pubkey | openssl pkey -pubin -outform DER"
    seen = lab.root("sh", "-c", f"{certificate} 2>/dev/null | {key} | sha256sum")

    check.assertEqual(seen.output.split()[0].upper(), hash_, seen)


def _start_pairing(lab, account: str, hash_: str) -> subprocess.Popen:
    command = lab.command_for(None, ["vlmbind", "-p", "-u", account, "-h", hash_])
    return subprocess.Popen(command, stdout=subprocess.PIPE, text=True)


def _refused_without_a_trace(lab, pairing: subprocess.Popen, hash_: str) -> None:
    output, _ = pairing.communicate(timeout=60)
    check.assertEqual(pairing.returncode, 255, output)
    check.assertRegex(output, rf"^Cannot pair user \(public key hash: {hash_}\)\. .+\n$")
    check.assertNotIn(hash_, lab.root("vlmctl", "pairings").output)


def _pcscd(lab) -> str:
    return lab.root("systemctl", "show", "pcscd.service", "--property=MainPID", "--value").output
