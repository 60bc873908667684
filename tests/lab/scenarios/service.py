"""The hints service: started when asked, gone when nobody asks, none the worse for a bad end."""

import subprocess

from machine.checks import check
from machine.hints_daemon import SERVICE, leave_soon, runs
from machine.listing import identities, only_identity, pair, present


def nothing_starts_it_but_a_request(lab):
    # The user's instance asks for the cards that are in.
    lab.user("alice", "systemctl", "--user", "stop", SERVICE)
    lab.root("systemctl", "stop", SERVICE)
    check.assertFalse(runs(lab), lab.journal("-u", SERVICE))

    check.assertEqual(lab.root("vlmbind", "-i").status, 0)

    check.assertTrue(runs(lab))


def it_leaves_when_idle_and_comes_back_with_its_pairings(lab):
    leave_soon(lab)
    # A window would watch the card, and keep the daemon.
    lab.user("alice", "vlmbind", "-s", "disable")
    hash_ = present(lab, "rsa", "Alice Archer")
    check.assertEqual(pair(lab, "alice", hash_).status, 0)

    lab.wait_until("it left", lambda: not runs(lab))
    left = lab.root("systemctl", "show", SERVICE, "--property=Result", "--value")
    check.assertEqual(left.output, "success\n")

    check.assertIn(f"{hash_}\talice - Alice Archer\n", lab.root("vlmbind", "-i").output)


def a_pin_is_asked_for_by_a_service_that_was_just_started(lab):
    hash_ = present(lab, "rsa", "Alice Archer")
    lab.root("systemctl", "stop", SERVICE)

    paired = pair(lab, "alice", hash_)

    check.assertEqual(paired.status, 0, paired)
    check.assertEqual(len(lab.asked("pinentry")), 1)


def a_restart_forgets_nothing(lab):
    hash_ = present(lab, "rsa", "Alice Archer")
    check.assertEqual(pair(lab, "alice", hash_).status, 0)

    lab.root("systemctl", "restart", SERVICE)

    check.assertIn(f"{hash_}\talice - Alice Archer\n", lab.root("vlmbind", "-i").output)


def killed_in_the_middle_of_a_pairing_it_has_written_nothing(lab):
    lab.insert("rsa")
    hash_ = only_identity(lab, "Alice Archer")
    lab.answer("pinentry", "wait")
    command = lab.command_for(None, ["vlmbind", "-p", "-u", "alice", "-h", hash_])
    pairing = subprocess.Popen(command, stdout=subprocess.PIPE, text=True)
    lab.wait_until("the PIN is asked for", lambda: lab.asked("pinentry"))

    lab.root("systemctl", "kill", "--signal=KILL", SERVICE)

    output, _ = pairing.communicate(timeout=30)
    check.assertEqual(pairing.returncode, 255, output)
    check.assertIn(f"Cannot pair user (public key hash: {hash_}).", output)
    lab.answer("pinentry", "pin 123456")
    check.assertNotIn(hash_, lab.root("vlmctl", "pairings").output)
    check.assertEqual(pair(lab, "alice", hash_).status, 0)


def a_module_that_crashes_takes_no_service_with_it(lab):
    lab.insert("rsa")
    only_identity(lab, "Alice Archer")
    service = _main_pid(lab)

    lab.root("pkill", "--signal", "SEGV", "vlm-token-worke")

    check.assertEqual(list(identities(lab)), ["Alice Archer"])
    check.assertEqual(_main_pid(lab), service)


def its_database_is_roots_alone(lab):
    pair(lab, "alice", present(lab, "rsa", "Alice Archer"))

    database = "/var/lib/vlm/hints.sqlite3"
    check.assertEqual(lab.root("stat", "-c", "%U %a", database).output, "root 600\n")
    check.assertNotEqual(lab.user("alice", "cat", database).status, 0)


def _main_pid(lab) -> str:
    return lab.root("systemctl", "show", SERVICE, "--property=MainPID", "--value").output
