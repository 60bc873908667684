"""The hints service's daemon, as systemd has it."""

SERVICE = "vlmhintsd.service"


def runs(lab) -> bool:
    return lab.root("systemctl", "is-active", "--quiet", SERVICE).status == 0


def leave_soon(lab) -> None:
    """Makes it leave after a few quiet seconds, more than between two looks at a card."""
    lines = (
        r"[Service]\nExecStart=\nExecStart=/usr/libexec/vlm/vlmhintsd --system --idle-seconds 3\n"
    )
    folder = f"/run/systemd/system/{SERVICE}.d"
    lab.root("sh", "-c", f"mkdir -p {folder} && printf '{lines}' >{folder}/soon.conf")
    lab.root("systemctl", "daemon-reload")
    # The one that runs, for the cards that were in when the user came, would stay for minutes.
    lab.root("systemctl", "stop", SERVICE)
