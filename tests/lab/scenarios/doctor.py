"""The doctor finds a whole machine well, and each break by its name."""

import json

from machine.checks import check
from machine.listing import only_identity, pair


def a_whole_machine_is_well_for_everybody(lab):
    _make_well(lab)

    for examined in (lab.user("alice", "vlmctl", "doctor"), lab.root("vlmctl", "doctor")):
        check.assertEqual(examined.status, 0, examined)
        check.assertNotIn("warning", examined.output)
        check.assertIn("ok       card: Alice Archer\n", examined.output)
        check.assertIn("ok       login:login: ", examined.output)
    check.assertIn("ok       keyring: ", lab.user("alice", "vlmctl", "doctor").output)


def files_that_are_missing_are_found(lab):
    _make_well(lab)
    shared = "/usr/share"
    breaks = {
        f"{shared}/dbus-1/system-services/org.vlm.token.hints.daemon.service": "daemon-activation",
        f"{shared}/dbus-1/system.d/org.vlm.token.hints.daemon.conf": "bus-policy",
        f"{shared}/dbus-1/services/org.vlm.token.hints.agent.service": "user-activation",
        f"{shared}/polkit-1/actions/org.vlm.vlmbind.policy": "polkit",
        f"{shared}/vlm/sandbox/org.vlm.vlmbind.profile": "sandbox",
        f"{shared}/vlm/ui/BindDialog.ui": "window-layout",
        _found(lab, "/usr/lib", "vlm_qt_windowing.so"): "window",
        _found(lab, "/usr/lib", "vlmhintsd.service", "*/system/*"): "daemon-unit",
        f"{shared}/p11-kit/modules": "modules",
        "/etc/pam.d/common-auth": "logins",
    }
    for file, name in breaks.items():
        lab.root("mv", file, f"{file}.away")
        _check_problem(lab, name)
        lab.root("mv", f"{file}.away", file)
    check.assertEqual(lab.root("vlmctl", "doctor").status, 0)


def a_pcscd_that_is_stopped_is_found(lab):
    _make_well(lab)
    lab.root("systemctl", "stop", "pcscd.socket", "pcscd.service")
    lab.root("systemctl", "mask", "--runtime", "pcscd.socket", "pcscd.service")

    _check_problem(lab, "pcscd")


def a_daemon_that_cannot_start_is_found(lab):
    _make_well(lab)
    lab.root("systemctl", "mask", "--runtime", "--now", "vlmhintsd.service")

    _check_problem(lab, "daemon")


def a_daemon_that_hangs_is_found_in_time(lab):
    _make_well(lab)
    lab.root("systemctl", "kill", "--signal=STOP", "vlmhintsd.service")

    timed = lab.root("bash", "-c", "time -p vlmctl doctor")

    check.assertEqual(timed.status, 1, timed)
    check.assertIn("problem  daemon: it does not answer", timed.output)
    seconds = float(timed.errors.split("real")[1].split()[0])
    check.assertLess(seconds, 2.0)


def a_card_that_is_missing_is_found(lab):
    _make_well(lab)
    lab.remove()

    lab.wait_until("it is gone", lambda: _verdict(lab, "card") == "warning")


def an_expired_card_is_found(lab):
    _make_well(lab)
    lab.insert("expired", 2)

    lab.wait_until("it is read", lambda: _verdict(lab, "certificate") == "warning")


def settings_that_lock_people_out_are_found(lab):
    _make_well(lab)
    lab.root("vlmctl", "set", "enforceSmartCard", "on")
    _check_problem(lab, "enforcement", "alice")
    lab.answer("pinentry", "pin 123456")
    hash_ = only_identity(lab, "Alice Archer")
    check.assertEqual(pair(lab, "alice", hash_).status, 0)
    check.assertEqual(lab.user("alice", "vlmctl", "doctor").status, 0)

    lab.root("vlmctl", "set", "allowSmartCard", "off")

    _check_problem(lab, "enforcement", "alice")


def logins_that_ask_in_the_wrong_order_are_found(lab):
    _make_well(lab)
    lab.root("sh", "-c", "echo 'auth optional pam_unix.so' >/tmp/first")
    lab.root("sh", "-c", "cat /etc/pam.d/login >>/tmp/first; cp /tmp/first /etc/pam.d/login")

    _check_problem(lab, "login:login")


def a_trust_folder_that_others_may_write_is_found(lab):
    _make_well(lab)
    lab.root("vlmctl", "set", "checkCertificateTrust", "on")
    check.assertEqual(lab.root("vlmctl", "doctor").status, 0)

    lab.root("mkdir", "-p", "/etc/vlm/trust/revoked")
    lab.root("chmod", "777", "/etc/vlm/trust/revoked")

    _check_problem(lab, "trust-files")


def a_session_without_a_keyring_is_found(lab):
    _make_well(lab)
    lab.user("alice", "sh", "-c", 'rm "$XDG_RUNTIME_DIR/keyring/control"')

    check.assertEqual(_verdict(lab, "keyring", "alice"), "warning")


def _make_well(lab) -> None:
    """As an administrator leaves a machine on which people log in with cards. The doctor looks at
    the files of logins; nobody logs in here."""
    folder = lab.root("sh", "-c", "dirname /usr/lib/*/security/pam_unix.so").output.strip()
    lab.root("touch", f"{folder}/pam_vlm.so")
    lab.root("sed", "-i", "1i auth sufficient pam_vlm.so", "/etc/pam.d/common-auth")
    lab.insert("rsa")
    lab.wait_until("the card is read", lambda: _verdict(lab, "card") == "ok")


def _check_problem(lab, name: str, user: str | None = None) -> None:
    examined = _examine(lab, user)
    verdicts = {each["check"]: each["verdict"] for each in json.loads(examined.output)["checks"]}
    check.assertEqual(verdicts.get(name), "problem", examined)
    check.assertEqual(examined.status, 1)


def _verdict(lab, name: str, user: str | None = None) -> str | None:
    for each in json.loads(_examine(lab, user).output)["checks"]:
        if each["check"] == name:
            return each["verdict"]
    return None


def _examine(lab, user: str | None):
    command = ["vlmctl", "doctor", "--json"]
    return lab.user(user, *command) if user else lab.root(*command)


def _found(lab, folder: str, name: str, path: str = "*") -> str:
    return lab.root("find", f"{folder}/", "-name", name, "-path", path).output.splitlines()[0]
