"""Who may log in with what: while the service fails, and where cards are required or not allowed."""

from machine.checks import check
from machine.login_person import (
    Greeter,
    check_kept_out,
    check_let_in,
    greeted_with,
    pair,
    turn_on,
)

ALICE = "Alice Archer"
SERVICE = "vlmhintsd.service"


def the_password_is_asked_for_while_the_service_is_down(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    lab.root("systemctl", "mask", "--now", "--runtime", SERVICE)

    check_let_in(greeted_with(lab, "alice", password="pw-alice"))
    lab.root("vlmctl", "set", "enforceSmartCard", "1")
    shown = Greeter(lab, "alice").end()
    check_kept_out(shown)
    check.assertIn("does not answer", shown)
    check_let_in(greeted_with(lab, "root", "/dev/tty1", password="pw-root"))


def the_password_is_asked_for_while_the_service_hangs(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    lab.root("systemctl", "kill", "--signal=STOP", SERVICE)

    check_let_in(greeted_with(lab, "alice", password="pw-alice"))
    lab.root("vlmctl", "set", "enforceSmartCard", "1")
    check_kept_out(Greeter(lab, "alice").end())
    lab.root("systemctl", "kill", "--signal=CONT", SERVICE)
    check_let_in(greeted_with(lab, "alice", pin="123456"))


def where_cards_are_required_nobody_gets_in_without_one(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    lab.root("vlmctl", "set", "enforceSmartCard", "1")

    check_let_in(greeted_with(lab, "alice", pin="123456"))
    check_kept_out(greeted_with(lab, "alice", pin=""))
    lab.remove()
    lab.wait_until("it is gone", lambda: ALICE not in lab.root("vlmbind", "-i").output)
    for user in ("alice", "bob", "nobody-here"):
        shown = Greeter(lab, user).end()
        check_kept_out(shown)
        check.assertIn("only a card", shown)
        check.assertNotRegex(shown, "[Pp]assword")


def where_others_are_allowed_only_paired_accounts_need_a_card(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    lab.remove()
    lab.root("vlmctl", "set", "enforceSmartCard", "1")
    lab.root("vlmctl", "set", "allowUnmappedUsers", "1")

    check_kept_out(Greeter(lab, "alice").end())
    check_let_in(greeted_with(lab, "bob", password="pw-bob"))


def root_gets_in_at_the_console_whatever_is_required(lab):
    turn_on(lab)
    lab.root("vlmctl", "set", "enforceSmartCard", "1")

    check_let_in(greeted_with(lab, "root", "/dev/tty1", password="pw-root"))
    check_kept_out(greeted_with(lab, "root", "/dev/tty1", password="wrong"))
    check_kept_out(Greeter(lab, "root", "/dev/pts/0").end())
    check_kept_out(Greeter(lab, "root", ":0").end())
    check_kept_out(Greeter(lab, "alice", "/dev/tty1").end())


def a_login_from_afar_costs_the_card_in_this_machine_no_try(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    before = lab.card_ctl("tries", "rsa")

    shown = greeted_with(lab, "alice", "ssh", remote_host="far.away", password="wrong")

    check_kept_out(shown)
    check.assertNotIn("PIN", shown)
    check.assertEqual(lab.card_ctl("tries", "rsa"), before)
    check_let_in(greeted_with(lab, "alice", "ssh", remote_host="far.away", password="pw-alice"))
    lab.root("vlmctl", "set", "enforceSmartCard", "1")
    check_kept_out(Greeter(lab, "alice", "ssh", remote_host="far.away").end())


def a_card_is_passed_over_where_none_is_allowed(lab):
    turn_on(lab)
    pair(lab, "alice", ALICE, "rsa")
    lab.root("vlmctl", "set", "allowSmartCard", "0")

    shown = greeted_with(lab, "alice", password="pw-alice")

    check_let_in(shown)
    check.assertNotIn("PIN", shown)
