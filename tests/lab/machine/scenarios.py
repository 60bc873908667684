"""Finds scenarios and runs each on a machine of its own.

A scenario is a function of a file in scenarios/ whose only argument is the lab, a booted Desktop; its
name says what must be true. It fails by raising.
"""

import importlib.util
import inspect
import os
import sys
import time
import traceback
from pathlib import Path

from machine.container import Container
from machine.desktop import Desktop
from machine.image import LAB

FOLDER = LAB / "scenarios"
SHOWN_LINES = 150


def list_scenarios() -> list[str]:
    return [name for file in sorted(FOLDER.glob("*.py")) for name in _scenarios_of(file)]


def run_scenarios(names: list[str], build: Path) -> int:
    known = {
        name: scenario
        for file in sorted(FOLDER.glob("*.py"))
        for name, scenario in _scenarios_of(file).items()
    }
    for unknown in set(names) - set(known):
        print(f"lab: there is no scenario {unknown}; lab scenarios --list has all", file=sys.stderr)
        return 2
    failed = [name for name in names or known if not _passes(name, known[name], build)]
    return 1 if failed else 0


def _scenarios_of(file: Path) -> dict:
    spec = importlib.util.spec_from_file_location(f"scenarios.{file.stem}", file)
    module = importlib.util.module_from_spec(spec)
    spec.loader.exec_module(module)
    return {
        f"{file.stem}.{name}": function
        for name, function in inspect.getmembers(module, inspect.isfunction)
        if not name.startswith("_")
        and function.__module__ == module.__name__  # and not a helper that is imported
        and list(inspect.signature(function).parameters) == ["lab"]
    }


def _machine_name(scenario: str) -> str:
    """A host's name, and nobody else's."""
    words = scenario.replace("_", "-").replace(".", "-")
    return f"{words[:40].rstrip('-')}-{os.getpid()}"


def _passes(name: str, scenario, build: Path) -> bool:
    container = Container(_machine_name(name))
    began = time.monotonic()
    try:
        container.up(build, ends_with_us=True)
        lab = Desktop(container)
        container.run(["systemctl", "start", "--no-block", "lab-bus-monitor"], check=True)
        scenario(lab)
    except Exception:
        print(f"FAILED {name}\n{traceback.format_exc()}")
        if container.is_up():
            _report(lab, build / "lab" / name)
        return False
    else:
        print(f"ok {name} ({time.monotonic() - began:.1f} s)")
        return True
    finally:
        container.down()


def _report(lab: Desktop, stem: Path) -> None:
    """What helps to see why: the end of the logs, and the whole of them beside a screenshot."""
    stem.parent.mkdir(parents=True, exist_ok=True)
    logs = {
        "journal": ["journalctl", "--no-pager", "--output=short-precise"],
        "system-bus": ["cat", "/run/vlm-lab/system-bus"],
        "session-bus": ["sh", "-c", "cat /run/vlm-lab/session-bus-*"],
    }
    for what, command in logs.items():
        text = lab.container.run(command, capture_output=True, text=True).stdout
        file = stem.with_name(f"{stem.name}.{what}")
        file.write_text(text)
        print(f"== the end of {file}", *text.splitlines()[-SHOWN_LINES:], sep="\n")
    screen = stem.with_name(f"{stem.name}.png")
    try:
        screen.write_bytes(lab.screenshot())
        print(f"== the screen: {screen}")
    except Exception as error:
        print(f"== no picture of the screen: {error}")
