"""What others see of PINs and pairings: nothing, whatever becomes of the processes."""

import json
import time

from machine.attack import TOOLS, daemon_pid, instance_pid
from machine.checks import check
from machine.hints_daemon import SERVICE
from machine.listing import pair, present
from machine.login_keyring import unlock_keys
from machine.login_person import check_let_in, greeted_with, turn_on

PIN, PASSWORD = "123456", "pw-alice"
SEARCH = f"{TOOLS}/search-memory"


def the_files_are_closed(lab):
    pair(lab, "alice", present(lab, "rsa", "Alice Archer"))
    folder = "/var/lib/vlm"
    files = [f"{folder}/hints.sqlite3{end}" for end in ("", "-wal", "-shm")]
    for file in files:
        check.assertEqual(lab.root("stat", "-c", "%U %a", file).output, "root 600\n", file)

    for user in ("alice", "bob"):
        for attempt in (("ls", folder), *(("cat", file) for file in files)):
            check.assertNotEqual(lab.user(user, *attempt).status, 0, (user, attempt))


def there_is_no_socket_to_connect_to(lab):
    present(lab, "rsa", "Alice Archer")
    # A worker's socket has no name, as those to the bus have none on this side.
    bound = lab.root("ss", "--unix", "--listening", "--processes", "--no-header").output
    for _, pid in _holders(lab):
        check.assertNotIn(f"pid={pid},", bound)


def no_process_that_a_pin_passes_is_looked_into(lab):
    pair(lab, "alice", present(lab, "rsa", "Alice Archer"))

    for who, pid in _holders(lab):
        check.assertIn("memory", lab.root(f"{TOOLS}/look-into", pid).output, who)
        for user in ("alice", "bob"):
            looked = lab.user(user, f"{TOOLS}/look-into", pid)
            check.assertEqual((looked.status, looked.output), (0, ""), (user, who))


def a_process_that_crashes_leaves_no_memory_behind(lab):
    # systemd's limit would hide whether the processes forbid it themselves.
    _allow_cores(lab, "/run/systemd/system", "/var/lib/vlm")
    _allow_cores(lab, "/run/systemd/user", "%t")
    lab.root("systemctl", "restart", SERVICE)
    lab.user("alice", "systemctl", "--user", "daemon-reload")
    lab.user("alice", "systemctl", "--user", "restart", SERVICE)
    pair(lab, "alice", present(lab, "rsa", "Alice Archer"))
    crash = "ulimit -c unlimited; cd /var/lib/vlm; mkdir control; cd control; sh -c 'kill -SEGV $$$$'"  # systemd takes one half
    lab.root("sh", "-c", crash)
    cores = ("find", "/var/lib/vlm", "/run/user", "/tmp", "-name", "core*", "-type", "f")
    check.assertRegex(lab.root(*cores).output, "^/var/lib/vlm/control/core[.0-9]*\n$")

    for _, pid in _holders(lab):
        lab.root("kill", "-SEGV", pid)
        lab.wait_until("it ended", lambda pid=pid: lab.root("test", "-d", f"/proc/{pid}").status)

    check.assertRegex(lab.root(*cores).output, "^/var/lib/vlm/control/core[.0-9]*\n$")
    check.assertNotIn("code=dumped", lab.journal())
    ended = f"{SERVICE}: Main process exited, code=killed, status=11/SEGV"
    lab.wait_until("both ends are told", lambda: lab.journal().count(ended) == 2)


def a_pin_is_in_no_log_and_on_no_session_bus(lab):
    hash_ = present(lab, "rsa", "Alice Archer")

    check.assertEqual(pair(lab, "alice", hash_).status, 0)

    def count(file: str) -> str:
        # Not by systemd, which logs what it runs.
        grep = ["grep", "--count", "--text", PIN, file]
        return lab.container.run(grep, capture_output=True, text=True).stdout

    # It did come by the system bus, from her instance to the daemon.
    lab.wait_until("the monitor has seen it", lambda: count("/run/vlm-lab/system-bus") != "0\n")
    check.assertEqual(count("/run/vlm-lab/session-bus-alice"), "0\n")
    for line in lab.journal("--output=json").splitlines():
        entry = json.loads(line)
        # The journal's own numbers may hold any digits.
        said = {key: text for key, text in entry.items() if not key.startswith("_")}
        check.assertNotIn(PIN, str(said))


def what_logs_in_is_in_no_memory_a_second_later(lab):
    turn_on(lab)
    hash_ = present(lab, "rsa", "Alice Archer")
    lab.answer("keyring", f"password {PASSWORD}")
    check.assertEqual(pair(lab, "alice", hash_).status, 0)
    check.assertEqual(unlock_keys(lab), [("alice", hash_)])
    _check_forgotten(lab)

    check_let_in(greeted_with(lab, "alice", pin=PIN))

    _check_forgotten(lab)


def _check_forgotten(lab) -> None:
    time.sleep(1)
    pids = [pid for _, pid in _holders(lab)]
    # The search itself works: the processes' names are in them.
    found = lab.container.run([SEARCH, "vlmhintsd", *pids], capture_output=True, text=True).stdout
    check.assertTrue({pids[0], pids[-1]} <= {line.split()[0] for line in found.splitlines()})
    for secret in (PIN, PASSWORD):
        # Not by systemd, which would tell its own bus what is looked for.
        found = lab.container.run([SEARCH, secret, *pids], capture_output=True, text=True)
        check.assertEqual((found.returncode, found.stdout), (0, ""), found)


def _holders(lab) -> list[tuple[str, str]]:
    """The processes that PINs pass through: which, and the process id. The daemon is the last."""
    # The kernel keeps fifteen letters of a name.
    workers = lab.root("pgrep", "--exact", "vlm-token-worke").output.split()
    check.assertTrue(workers)
    return [
        ("alice's instance", instance_pid(lab, "alice")),
        *(("a worker", pid) for pid in workers),
        ("the daemon", daemon_pid(lab)),
    ]


def _allow_cores(lab, units: str, working_folder: str) -> None:
    lines = rf"[Service]\nLimitCORE=infinity\nWorkingDirectory={working_folder}\n"
    folder = f"{units}/{SERVICE}.d"
    write = f"mkdir -p {folder} && printf '{lines.replace('%', '%%')}' >{folder}/core.conf"
    lab.root("sh", "-c", write)
    lab.root("systemctl", "daemon-reload")
