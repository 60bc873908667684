"""What the installed tool's confinement holds off, on the kernel that runs."""

import signal

from machine.checks import check

DENIED = "Permission denied\n"
NOT_PERMITTED = "Operation not permitted\n"


def the_home_folder_is_not_written_to(lab):
    _attempt(lab, "alice", DENIED, "create", "/home/alice/new")
    _attempt(lab, "alice", DENIED, "mkdir", "/home/alice/new")
    _attempt(lab, "alice", DENIED, "overwrite", "/home/alice/.bashrc")
    check.assertEqual(lab.root("ls", "/home/alice/new").status, 2)


def no_program_is_started(lab):
    for way in ("execve", "execve-from-memory", "posix_spawn", "system"):
        _attempt(lab, "alice", NOT_PERMITTED, way)


def no_network_socket_is_opened(lab):
    for family in ("inet", "inet6", "netlink", "packet"):
        _attempt(lab, "alice", "Address family not supported by protocol\n", "socket", family)
    _attempt(lab, "alice", "Success\n", "socket", "unix")


def other_peoples_files_are_not_read_not_even_by_root(lab):
    lab.root(
        "sh", "-c", "echo secret >/home/bob/diary; chmod 644 /home/bob/diary; chmod 755 /home/bob"
    )
    for user in ("alice", None):
        _attempt(lab, user, DENIED, "read", "/home/bob/diary")
    lab.root("vlmbind", "-i")
    _attempt(lab, None, DENIED, "read", "/var/lib/vlm/hints.sqlite3")


def what_the_tool_needs_stays_open(lab):
    _attempt(lab, "alice", "Success\n", "read", "/etc/passwd")
    _attempt(lab, "alice", "Success\n", "account", "bob")


def without_the_profile_the_tool_does_not_run(lab):
    lab.root("rm", "/usr/share/vlm/sandbox/org.vlm.vlmbind.profile")

    aborted = lab.user("alice", "sh", "-c", "vlmbind -s status; echo $?")

    check.assertEqual(aborted.output, f"{128 + signal.SIGABRT}\n", aborted)
    check.assertIn("org.vlm.vlmbind.profile", lab.journal("SUBSYSTEM=org.vlm.token"))


def _attempt(lab, user: str | None, expected: str, *words: str) -> None:
    command = ["vlmbind-intruder", *words]
    done = lab.user(user, *command) if user else lab.root(*command)
    check.assertEqual((done.status, done.output), (0, expected), done)
