"""The lab's own desktop: what later scenarios rely on."""

import struct

from machine.checks import check

ASK = ["pkexec", "--disable-internal-agent", "id", "-un"]


def the_machine_is_healthy(lab):
    check.assertEqual(lab.root("systemctl", "is-system-running").output, "running\n")
    for user in ("alice", "bob", "carol", "guest"):
        check.assertEqual(lab.root("id", "-un", user).output, f"{user}\n")
    check.assertEqual(lab.root("systemctl", "--failed", "--no-legend").output, "")


def no_network_leads_out(lab):
    check.assertEqual(lab.root("ls", "/sys/class/net").output, "lo\n")


def an_administrator_answers_the_question_for_the_password(lab):
    lab.answer("polkit", "password pw-carol")

    done = lab.user("alice", *ASK)

    check.assertEqual((done.status, done.output), (0, "root\n"), done)
    (question,) = lab.asked("polkit")
    check.assertEqual(question["action"], "org.freedesktop.policykit.exec")
    check.assertEqual(question["users"], ["carol"])


def a_question_that_is_dismissed_authorises_nothing(lab):
    lab.answer("polkit", "dismiss")

    check.assertNotEqual(lab.user("alice", *ASK).status, 0)


def a_wrong_password_authorises_nothing(lab):
    lab.answer("polkit", "fail")

    check.assertNotEqual(lab.user("alice", *ASK).status, 0)


def an_agent_that_dies_authorises_nothing(lab):
    lab.answer("polkit", "die")

    check.assertNotEqual(lab.user("alice", *ASK).status, 0)


def the_keyring_is_open_and_keeps_secrets(lab):
    stored = lab.user("alice", "secret-tool", "store", "--label=lab", "lab", "x", typed="treasure")
    check.assertEqual(stored.status, 0, stored)

    check.assertEqual(lab.user("alice", "secret-tool", "lookup", "lab", "x").output, "treasure")


def a_window_is_seen_on_the_screen_and_by_assistive_programs(lab):
    empty = lab.screenshot()
    check.assertEqual(struct.unpack(">II", empty[16:24]), (1280, 800))

    # The keyring's own window: it asks for the password of a keyring that was locked.
    lab.user(
        "alice",
        *"busctl --user call org.freedesktop.secrets /org/freedesktop/secrets".split(),
        *"org.freedesktop.Secret.Service Lock ao 1".split(),
        "/org/freedesktop/secrets/collection/login",
    )
    lab.root(
        "systemd-run",
        "--user",
        "--machine=alice@",
        "--quiet",
        "--collect",
        "secret-tool",
        "store",
        "--label=x",
        "lab",
        "y",
    )
    lab.wait_until("the window is there", lambda: "Unlock" in lab.windows())

    check.assertIn("password text", lab.windows())
    check.assertNotEqual(lab.screenshot(), empty)

    lab.windows("type", "pw-alice")
    lab.windows("press", "Unlock")
    lab.wait_until("the window is gone", lambda: "Unlock" not in lab.windows())
