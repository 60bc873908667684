"""The tool's switch for the dialog, the request for it, and the administrator's settings."""

import json

from machine.checks import check
from machine.listing import pair, present
from machine.pairing_window import wait_for_line

ENABLED = "SmartCard Pairing dialog is enabled.\n"
DISABLED = "SmartCard Pairing dialog is disabled.\n"
MANAGED = """<?xml version="1.0" encoding="UTF-8"?>
<plist version="1.0"><dict>
  <key>oneCardPerUser</key><true/>
  <key>UserPairing</key><false/>
</dict></plist>
"""


def each_user_has_a_switch_of_his_own(lab):
    check.assertEqual(lab.user("alice", "vlmbind", "-s", "status").output, ENABLED)

    quiet = lab.user("alice", "vlmbind", "-s", "disable")
    check.assertEqual((quiet.status, quiet.output), (0, ""))

    check.assertEqual(lab.user("alice", "vlmbind", "-s", "status").output, DISABLED)
    check.assertEqual(lab.user("bob", "vlmbind", "-s", "status").output, ENABLED)
    check.assertEqual(lab.user("alice", "vlmbind", "-v", "-s", "enable").output, ENABLED)
    check.assertEqual(lab.user("alice", "vlmbind", "-s", "status").output, ENABLED)


def a_users_switch_outlives_his_session(lab):
    lab.user("alice", "vlmbind", "-s", "disable")

    lab.root("systemctl", "restart", "console@alice")

    check.assertEqual(lab.user("alice", "vlmbind", "-s", "status").output, DISABLED)


def root_has_no_such_switch(lab):
    refused = lab.root("vlmbind", "-s", "status")

    check.assertEqual(refused.status, 255)
    check.assertEqual(refused.output, "This operation must not be run with root privileges.\n")


def root_sets_and_users_read_the_machines_settings(lab):
    check.assertEqual(lab.root("vlmctl", "set", "oneCardPerUser", "true").status, 0)

    check.assertEqual(lab.user("alice", "vlmctl", "get", "oneCardPerUser").output, "1\n")
    check.assertRegex(lab.user("bob", "vlmctl", "settings").output, r"oneCardPerUser +1 +machine\n")

    refused = lab.user("alice", "vlmctl", "set", "oneCardPerUser", "false")
    check.assertNotEqual(refused.status, 0)
    check.assertNotEqual(refused.errors, "")
    check.assertEqual(lab.root("vlmctl", "unset", "oneCardPerUser").status, 0)
    check.assertRegex(lab.root("vlmctl", "settings").output, r"oneCardPerUser +0 +default\n")


def a_managed_value_rules_and_is_not_written(lab):
    lab.root("vlmctl", "set", "oneCardPerUser", "false")
    _manage(lab)

    check.assertRegex(
        lab.user("alice", "vlmctl", "settings").output, r"oneCardPerUser +1 +managed\n"
    )
    refused = lab.root("vlmctl", "set", "oneCardPerUser", "false")
    check.assertNotEqual(refused.status, 0)
    check.assertIn("managed", refused.errors)


def a_dialog_that_management_has_off_is_not_asked_for(lab):
    _manage(lab)

    refused = lab.user("alice", "vlmbind", "-f")

    check.assertEqual((refused.status, refused.output), (255, "Pairing UI is disabled.\n"))


def a_managed_file_that_others_may_write_does_not_count(lab):
    _manage(lab)
    lab.root("chmod", "666", "/etc/vlm/managed/org.vlm.smartcard.plist")

    check.assertRegex(lab.root("vlmctl", "settings").output, r"oneCardPerUser +0 +default\n")


def the_request_for_the_dialog_ends_with_255_and_starts_the_agent(lab):
    asked = lab.user("alice", "vlmbind", "-f")

    check.assertEqual((asked.status, asked.output), (255, ""))
    wait_for_line(lab, "no bind is running, exiting")


def root_without_a_session_bus_asks_for_the_dialog_in_vain(lab):
    asked = lab.root("vlmbind", "-f")

    check.assertEqual((asked.status, asked.output), (255, ""))
    check.assertRegex(lab.journal("SUBSYSTEM=org.vlm.token"), "(?i)session bus")


def vlmctl_tells_each_what_he_may_know(lab):
    hash_ = present(lab, "rsa", "Alice Archer")
    check.assertEqual(pair(lab, "bob", hash_).status, 0)

    pairings = json.loads(lab.root("vlmctl", "--json", "pairings").output)
    check.assertEqual([each["account"] for each in pairings["pairings"]], ["bob"])
    check.assertIn(hash_, lab.user("bob", "vlmctl", "pairings").output)
    check.assertNotIn(hash_, lab.user("alice", "vlmctl", "pairings").output)
    for listed in (lab.root("vlmctl", "tokens"), lab.user("alice", "vlmctl", "tokens")):
        check.assertIn("Alice Archer", listed.output)


def vlmctl_says_what_is_wrong_in_a_managed_file(lab):
    _manage(lab)
    file = "/etc/vlm/managed/org.vlm.smartcard.plist"
    check.assertEqual(lab.user("alice", "vlmctl", "check", file).status, 0)

    lab.root("sed", "-i", "s|</dict>||", file)

    wrong = lab.user("alice", "vlmctl", "check", file)
    check.assertNotEqual(wrong.status, 0)
    check.assertRegex(wrong.output + wrong.errors, r":\d+:\d+: ")
    check.assertRegex(lab.root("vlmctl", "settings").output, r"oneCardPerUser +0 +default\n")


def the_one_card_rule_of_management_is_obeyed(lab):
    _manage(lab)
    check.assertEqual(pair(lab, "alice", present(lab, "rsa", "Alice Archer")).status, 0)

    refused = pair(lab, "alice", present(lab, "second", "Carol Cooper", 2))

    check.assertEqual(refused.status, 255)
    check.assertEqual(refused.output, "Cannot pair user who is already paired\n")


def the_manual_and_the_completion_are_installed(lab):
    for file in ("man/man1/vlmbind.1", "man/man1/vlmctl.1", "man/man5/SmartcardLogin.plist.5"):
        check.assertEqual(lab.root("sh", "-c", f"ls /usr/share/{file}*").status, 0, file)
    check.assertEqual(lab.root("ls", "/usr/share/bash-completion/completions/vlmctl").status, 0)


def _manage(lab) -> None:
    folder = "/etc/vlm/managed"
    lab.root("mkdir", "-p", folder)
    lab.root("tee", f"{folder}/org.vlm.smartcard.plist", typed=MANAGED)
