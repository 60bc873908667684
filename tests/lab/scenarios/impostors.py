"""Programs that take the place of a part of the service, and what they gain by it: nothing."""

from machine.attack import AGENT, DAEMON, Attacker, instance_pid, nothing_changes
from machine.by_hand import pairings
from machine.checks import check
from machine.hints_daemon import SERVICE
from machine.listing import only_identity, pair, present

PIN = "123456"


def the_daemons_name_is_roots(lab):
    for state in ("start", "stop"):
        lab.root("systemctl", state, SERVICE)
        for user in ("alice", "bob"):
            with Attacker(lab, user, "take-name", "system", DAEMON) as impostor:
                check.assertRegex(impostor.first_line, "^refused: .*AccessDenied")

    check.assertIn("Alice Archer", _listing(lab))


def the_name_of_a_running_instance_is_not_taken(lab):
    with Attacker(lab, "alice", "take-name", "session", AGENT) as impostor:
        check.assertEqual(impostor.first_line, "refused: somebody has it")


def who_takes_the_instances_name_first_is_asked_for_no_pin(lab):
    """A program of alice's own; it can keep her prompt away, and is told no secret."""
    hash_ = present(lab, "rsa", "Alice Archer")
    lab.user("alice", "systemctl", "--user", "stop", SERVICE)

    with nothing_changes(lab):
        impostor = Attacker(lab, "alice", "take-name", "session", AGENT)
        check.assertEqual(impostor.first_line, "taken")
        refused = pair(lab, "alice", hash_)
        check.assertEqual(refused.status, 255, refused)
        check.assertIn("nobody could be asked for the PIN", refused.output)
        said = impostor.end()
    check.assertNotIn("AskPin", said)
    check.assertNotIn(PIN, said)

    lab.user("alice", "systemctl", "--user", "restart", SERVICE)
    lab.wait_until("her own is back", lambda: pair(lab, "alice", hash_).status == 0)


def who_registers_is_asked_for_the_own_user_only(lab):
    hash_ = present(lab, "rsa", "Alice Archer")

    with (
        Attacker(lab, "bob", "take-name", "prompter", "000000") as impostor,
        Attacker(lab, "bob", "take-name", "prompter", "000000") as twice,
    ):
        check.assertEqual([impostor.first_line, twice.first_line], ["taken", "taken"])
        paired = pair(lab, "alice", hash_)
        check.assertEqual(paired.status, 0, paired)
        check.assertEqual([impostor.end(), twice.end()], ["", ""])
    check.assertEqual(len(lab.asked("pinentry")), 1)


def an_instance_asks_for_nobody_but_the_daemon(lab):
    connection = _connection_of(lab, instance_pid(lab, "alice"))
    question = ("card", "s", "c", "identity", "s", "i", "state", "t", "0", "account", "s", "alice")
    call = (connection, "/org/vlm/token/hints", "org.vlm.token.hints.Prompter", "AskPin", "a{sv}")

    for user in ("alice", "bob"):
        refused = lab.user(user, "busctl", "call", *call, "4", *question)
        check.assertNotEqual(refused.status, 0, refused)
        check.assertIn("Access denied", refused.errors + refused.output)
    check.assertEqual(lab.asked("pinentry"), [])


def who_takes_the_agents_name_is_told_that_a_card_came(lab):
    with Attacker(lab, "alice", "take-name", "session", "org.vlm.vlmbind") as impostor:
        check.assertEqual(impostor.first_line, "taken")
        lab.insert("rsa")
        only_identity(lab, "Alice Archer")
        told = "org.vlm.Notifications.Deliver ('org.vlm.token.new-token',)\n"
        check.assertEqual(impostor.next_line(), told)
        check.assertEqual(impostor.end(), "")
    check.assertEqual(pairings(lab), [])


def the_window_is_not_asked_for_from_another_account(lab):
    lab.insert("rsa")
    lab.wait_until("the window is there", lambda: "SmartCard Pairing" in lab.windows())
    lab.windows("press", "Cancel")
    lab.wait_until("the window is gone", lambda: "SmartCard Pairing" not in lab.windows())
    before = _agent_starts(lab)
    bus = f"unix:path=/run/user/{lab.root('id', '-u', 'alice').output.strip()}/bus"

    refused = lab.user("bob", "env", f"DBUS_SESSION_BUS_ADDRESS={bus}", "vlmbind", "-f")

    check.assertEqual(refused.status, 255, refused)
    call = ("org.vlm.vlmbind", "/org/vlm/vlmbind", "org.vlm.Notifications", "Deliver", "s")
    word = "org.vlm.token.force-bind-ui"
    by_hand = lab.user("bob", "busctl", f"--address={bus}", "call", *call, word)
    check.assertNotEqual(by_hand.status, 0, by_hand)
    check.assertEqual(_agent_starts(lab), before)


def _agent_starts(lab) -> str:
    show = ("systemctl", "--user", "show", "vlmbind.service", "--property=ExecMainStartTimestamp")
    return lab.user("alice", *show).output


def _listing(lab) -> str:
    lab.insert("rsa")
    only_identity(lab, "Alice Archer")
    return lab.root("vlmbind", "-i").output


def _connection_of(lab, pid: str) -> str:
    """Its oldest one to the system bus; each request that it passes on has another for a moment."""
    lines = lab.root("busctl", "--system", "list", "--no-legend").output.splitlines()
    names = [name for name, owner, *_ in map(str.split, lines) if owner == pid]
    return min(names, key=lambda name: int(name.rpartition(".")[2]))
